// failure.h - running statements that must end in the library's failure
// path, without ending the test program.
//
// The failure runs its whole course, but for the two seconds; what would be
// printed is caught, and instead of ending the process the statement is left
// behind (its frames are jumped over, nothing in them is destroyed).
//
//   EXPECT_FAILURE(file.create("no\\such"),
//                  "1004: create: Can't open file 'no\\such' for writing",
//                  "[1004-1004-0/E-0/E/no\\such/]");
//   EXPECT_ASSERTION(text[5], "zxstr");
#ifndef KIT_FAILURE_H
#define KIT_FAILURE_H

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "zxatsys.h"

namespace kit {

struct Failure {
  bool failed = false;  // the statement did not come back
  int exit_code = 0;
  std::string screen;   // all that was printed
  std::string message;  // the part behind "Fatal Error "
  std::string line;     // the line in square brackets, with both numbers of
                        // the system replaced by "E"
  std::vector<std::string> dumps;  // what the stack dumps were told, each of
                                   // which is left out
};

// The program's path, name and version in these runs.
inline constexpr char k_shown_path[] = "prog";
inline constexpr char k_shown_name[] = "PROG";
inline constexpr char k_shown_version[] = "v1";

// Runs a statement up to its end, its failure or its process exit.
Failure failure_of(const std::function<void()>& statement);

// Runs a statement as if a failure were being handled already, so that every
// further one is dropped and its caller goes on.
void with_failures_dropped(const std::function<void()>& statement);

// True if the failure is the assertion of a module, at any line.
testing::AssertionResult is_assertion_of(const Failure& failure,
                                         const std::string& module);

// The diagnostic line of a failure, whose text it cuts, as of Failure::line.
std::string line_of(int number, const std::string& text,
                    const BailDetail& detail = no_detail);

// Runs a statement that must end in the assertion at a position such as
// "zxsys2:398".
void expect_assertion_at(const std::function<void()>& statement,
                         const std::string& position);

}  // namespace kit

#define EXPECT_FAILURE(statement, expected_message, expected_line) \
  do {                                                             \
    const kit::Failure kit_failure =                               \
        kit::failure_of([&] { static_cast<void>(statement); });    \
    EXPECT_TRUE(kit_failure.failed) << "came back: " #statement;   \
    EXPECT_EQ(kit_failure.exit_code, 100);                         \
    EXPECT_EQ(kit_failure.message, expected_message);              \
    EXPECT_EQ(kit_failure.line, expected_line);                    \
  } while (false)

#define EXPECT_ASSERTION(statement, module) \
  EXPECT_TRUE(kit::is_assertion_of(         \
      kit::failure_of([&] { static_cast<void>(statement); }), module))

#endif  // KIT_FAILURE_H
