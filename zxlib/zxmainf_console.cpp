// zxmainf_console.cpp - the entry of console programs, an object of its own
// that a program links, so that test programs can have theirs.
#include "zxmainf.h"

// The run time of the Windows target would expand wildcards in arguments;
// programs here get them as they came.
extern "C" {
extern int _dowildcard;
int _dowildcard = 0;
}

int main(int argc, char** argv) {
  init_zxlib_args(argc, argv);
  return zx_main();
}
