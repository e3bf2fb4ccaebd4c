/* peak.c - runs a program and prints its peak memory in KiB as the last line
 * of the standard output; usage: peak PROGRAM [ARGUMENT...]
 *
 * The system counts what a process held before it became the program, too, so
 * this figure can't be had from a process as large as an interpreter: it would
 * be the interpreter's own. */
#include <stdio.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

int main(int argc, char **argv) {
  struct rusage used;
  int status;
  const pid_t child = argc > 1 ? fork() : -1;
  if (child == 0) {
    execvp(argv[1], argv + 1);
    _exit(127);
  }
  if (child < 0 || wait4(child, &status, 0, &used) != child || status != 0)
    return 1;
  printf("%ld\n", used.ru_maxrss);
  return 0;
}
