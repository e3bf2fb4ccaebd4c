// process_posix.cpp - see process.h.

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <stdexcept>
#include <string_view>

#include "process.h"

namespace kit {
namespace {

using Clock = std::chrono::steady_clock;

void require(int error, const char* what) {
  if (error == 0) return;
  throw std::runtime_error(std::string(what) + ": " + std::strerror(error));
}

// An end of a pipe.
class End {
 public:
  End() = default;
  End(const End&) = delete;
  End& operator=(const End&) = delete;
  ~End() { close(); }

  void close() {
    if (fd >= 0) ::close(fd);
    fd = -1;
  }

  int fd = -1;
};

struct Pipe {
  End read;
  End write;

  // The numbers stay clear of the standard streams, even if the test runs
  // without one, so that none is overwritten while they are put in place.
  Pipe() {
    int ends[2];
    require(pipe2(ends, O_CLOEXEC) == 0 ? 0 : errno, "pipe");
    read.fd = fcntl(ends[0], F_DUPFD_CLOEXEC, 3);
    write.fd = fcntl(ends[1], F_DUPFD_CLOEXEC, 3);
    ::close(ends[0]);
    ::close(ends[1]);
  }
};

// Writing to a program that reads no more is no reason to die.
class NoPipeSignal {
 public:
  NoPipeSignal() : before(signal(SIGPIPE, SIG_IGN)) {}
  NoPipeSignal(const NoPipeSignal&) = delete;
  NoPipeSignal& operator=(const NoPipeSignal&) = delete;
  ~NoPipeSignal() { signal(SIGPIPE, before); }

 private:
  sighandler_t before;
};

bool is_variable(const std::string& entry, const std::string& name) {
  return entry.compare(0, name.size() + 1, name + "=") == 0;
}

void remove_variable(std::vector<std::string>& entries,
                     const std::string& name) {
  std::erase_if(entries, [&](const std::string& entry) {
    return is_variable(entry, name);
  });
}

std::vector<std::string> environment_for(const ProcessOptions& options) {
  std::vector<std::string> entries;
  for (char** entry = environ; *entry != nullptr; ++entry) {
    entries.push_back(*entry);
  }
  for (const auto& [name, value] : options.variables) {
    remove_variable(entries, name);
    entries.push_back(name);
    entries.back().append("=").append(value);
  }
  for (const std::string& name : options.removed_variables) {
    remove_variable(entries, name);
  }
  return entries;
}

std::vector<char*> pointers_to(std::vector<std::string>& texts) {
  std::vector<char*> pointers;
  pointers.reserve(texts.size() + 1);
  for (std::string& text : texts) pointers.push_back(text.data());
  pointers.push_back(nullptr);
  return pointers;
}

// What happens in the child ahead of the program.
class FileActions {
 public:
  FileActions() { posix_spawn_file_actions_init(&actions); }
  FileActions(const FileActions&) = delete;
  FileActions& operator=(const FileActions&) = delete;
  ~FileActions() { posix_spawn_file_actions_destroy(&actions); }

  void bind(const End& end, int stream, bool is_missing) {
    require(is_missing
                ? posix_spawn_file_actions_addclose(&actions, stream)
                : posix_spawn_file_actions_adddup2(&actions, end.fd, stream),
            "stream");
  }

  void enter(const std::string& directory) {
    if (directory.empty()) return;
    std::string path = directory;
    std::replace(path.begin(), path.end(), '\\', '/');
    require(posix_spawn_file_actions_addchdir_np(&actions, path.c_str()),
            "directory");
  }

  const posix_spawn_file_actions_t* get() const { return &actions; }

 private:
  posix_spawn_file_actions_t actions;
};

// The child leads a group of its own, and is told of closed pipes as usual.
class Attributes {
 public:
  Attributes() {
    sigset_t defaults;
    sigemptyset(&defaults);
    sigaddset(&defaults, SIGPIPE);
    posix_spawnattr_init(&attributes);
    posix_spawnattr_setsigdefault(&attributes, &defaults);
    posix_spawnattr_setpgroup(&attributes, 0);
    posix_spawnattr_setflags(&attributes,
                             POSIX_SPAWN_SETSIGDEF | POSIX_SPAWN_SETPGROUP);
  }
  Attributes(const Attributes&) = delete;
  Attributes& operator=(const Attributes&) = delete;
  ~Attributes() { posix_spawnattr_destroy(&attributes); }

  const posix_spawnattr_t* get() const { return &attributes; }

 private:
  posix_spawnattr_t attributes;
};

// One run: the process, its streams and how far they have got.
class Run {
 public:
  Run(const std::vector<std::string>& command, const ProcessOptions& wanted)
      : options(wanted), deadline(Clock::now() + wanted.limit) {
    start(command);
    in.read.close();
    out.write.close();
    err.write.close();
    fcntl(in.write.fd, F_SETFL, O_NONBLOCK);
  }

  ProcessResult finish() {
    const NoPipeSignal guard;
    while (serve_streams()) {
    }
    in.write.close();
    while (!has_ended()) wait_a_little();
    return result;
  }

 private:
  void start(std::vector<std::string> command) {
    std::vector<std::string> environment = environment_for(options);
    const Attributes attributes;
    FileActions actions;
    actions.bind(in.read, 0, (options.missing & k_no_input) != 0);
    actions.bind(out.write, 1, (options.missing & k_no_output) != 0);
    actions.bind(err.write, 2, (options.missing & k_no_errors) != 0);
    actions.enter(options.directory);
    require(posix_spawnp(&pid, command.at(0).c_str(), actions.get(),
                         attributes.get(), pointers_to(command).data(),
                         pointers_to(environment).data()),
            command.at(0).c_str());
  }

  // Waits for one of the streams and serves it.  False once both outputs
  // have come to their end.
  bool serve_streams() {
    if (out.read.fd < 0 && err.read.fd < 0) return false;
    if (sent == options.input.size()) in.write.close();
    std::array<pollfd, 3> polled = {{{in.write.fd, POLLOUT, 0},
                                     {out.read.fd, POLLIN, 0},
                                     {err.read.fd, POLLIN, 0}}};
    poll(polled.data(), polled.size(), milliseconds_left());
    if (polled[0].revents != 0) send();
    if (polled[1].revents != 0) receive(out.read, result.out);
    if (polled[2].revents != 0) receive(err.read, result.err);
    kill_when_late();
    return true;
  }

  void send() {
    const std::string_view rest = std::string_view(options.input).substr(sent);
    const ssize_t count = write(in.write.fd, rest.data(), rest.size());
    if (count >= 0) {
      sent += static_cast<std::size_t>(count);
    } else if (errno != EAGAIN && errno != EINTR) {
      sent = options.input.size();  // nobody reads any more
    }
  }

  static void receive(End& end, std::string& text) {
    char buffer[65536];
    const ssize_t count = read(end.fd, buffer, sizeof buffer);
    if (count > 0) text.append(buffer, static_cast<std::size_t>(count));
    if (count == 0) end.close();
  }

  bool has_ended() {
    int status;
    kill_when_late();
    const pid_t ended = waitpid(pid, &status, WNOHANG);
    if (ended == -1) throw std::runtime_error("lost the process");
    if (ended != pid) return false;
    result.exit_code =
        WIFEXITED(status) ? WEXITSTATUS(status) : -WTERMSIG(status);
    return true;
  }

  int milliseconds_left() const {
    using std::chrono::milliseconds;
    const auto left =
        std::chrono::duration_cast<milliseconds>(deadline - Clock::now());
    return static_cast<int>(std::clamp<long>(left.count() + 1, 0, 60'000));
  }

  // The group is the process and what it started.  Streams that something
  // else still holds are given up, so that the run ends.
  void kill_when_late() {
    if (result.timed_out || Clock::now() < deadline) return;
    result.timed_out = true;
    kill(-pid, SIGKILL);
    out.read.close();
    err.read.close();
  }

  static void wait_a_little() {
    const timespec pause = {0, 1'000'000};
    nanosleep(&pause, nullptr);
  }

  const ProcessOptions& options;
  Clock::time_point deadline;
  Pipe in;
  Pipe out;
  Pipe err;
  pid_t pid = -1;
  std::size_t sent = 0;
  ProcessResult result;
};

}  // namespace

ProcessResult run_process(const std::vector<std::string>& command,
                          const ProcessOptions& options) {
  return Run(command, options).finish();
}

std::string self_path() {
  return std::filesystem::read_symlink("/proc/self/exe").string();
}

}  // namespace kit
