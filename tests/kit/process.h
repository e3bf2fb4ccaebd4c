// process.h - the test kit: runs a program as a process of its own and
// collects what it says.
//
//   const kit::ProcessResult result = kit::run_process({program, "-x", "a b"});
//   EXPECT_EQ(result.exit_code, 0);
//   EXPECT_EQ(result.out, "done\r\n");
//
// The streams are pipes, the bytes as the program wrote them.  All of them
// are served at once, so that no side waits for a full pipe.  One process
// runs at a time.
#ifndef KIT_PROCESS_H
#define KIT_PROCESS_H

#include <chrono>
#include <string>
#include <utility>
#include <vector>

namespace kit {

// The standard streams, as bits of ProcessOptions::missing.
inline constexpr unsigned k_no_input = 1;
inline constexpr unsigned k_no_output = 2;
inline constexpr unsigned k_no_errors = 4;

struct ProcessOptions {
  // The working directory; empty for that of the test.
  std::string directory = {};

  // Variables to add or change, and then those to remove.
  std::vector<std::pair<std::string, std::string>> variables = {};
  std::vector<std::string> removed_variables = {};

  // What the program finds on its standard input, and then the end.
  std::string input = {};

  // Streams that the process starts without, as of k_no_input and so on.
  unsigned missing = 0;

  // The time after which the process is killed, with all that it started.
  std::chrono::milliseconds limit = std::chrono::seconds(60);
};

struct ProcessResult {
  // What the program ended with; natively minus the signal's number if it
  // died by a signal, such as -9 after the time limit.
  int exit_code = -1;
  bool timed_out = false;
  std::string out = {};
  std::string err = {};
};

// Runs a program to its end.  The first word is the program's path, with a
// folder unless the system's search path is meant, the others its arguments,
// which arrive as they are.  Throws std::runtime_error if the program cannot
// be started.
ProcessResult run_process(const std::vector<std::string>& command,
                          const ProcessOptions& options = {});

// The path of the running test program.
std::string self_path();

}  // namespace kit

#endif  // KIT_PROCESS_H
