// cases.h - the test kit: cases, which are functions that the test program
// carries out in a process of its own, instead of its tests.  They are for
// what a process can do once only: starting the library, failing for real,
// ending.
//
//   ZX_CASE(ends_with_seven) {
//     init_zxlib_args(argc, argv);
//     return 7;
//   }
//
//   TEST(zxmainf, a_result_is_the_exit_code) {
//     EXPECT_EQ(kit::run_case("ends_with_seven").exit_code, 7);
//   }
//
// A case runs ahead of the library's start, with the arguments of main().
// The environment variable ZX_CASE names it.
#ifndef KIT_CASES_H
#define KIT_CASES_H

#include <string>
#include <vector>

#include "kit/process.h"

namespace kit {

using CaseFunction = int (*)(int argc, char** argv);

// Registers a function under a name; lives as long as the process.
class Case {
 public:
  Case(const char* name, CaseFunction function);

 private:
  friend CaseFunction find_case(const std::string& name);

  const char* const name;
  const CaseFunction function;
  const Case* const next;
};

// The case of that name, or null.
CaseFunction find_case(const std::string& name);

// The name of the case that this process is to carry out; empty for none.
std::string wanted_case();

// Starts this program to carry out a case.
ProcessResult run_case(const std::string& name,
                       const std::vector<std::string>& args = {},
                       ProcessOptions options = {});

// The path of a program that the build made; empty, and there is nothing to
// test, if the environment variable ZX_BIN_DIR does not tell where it is.
std::string built_program(const std::string& name);

}  // namespace kit

#define ZX_CASE(name)                                                 \
  static int zx_case_##name(int argc, char** argv);                   \
  static const kit::Case zx_case_entry_##name(#name, zx_case_##name); \
  static int zx_case_##name([[maybe_unused]] int argc,                \
                            [[maybe_unused]] char** argv)

#endif  // KIT_CASES_H
