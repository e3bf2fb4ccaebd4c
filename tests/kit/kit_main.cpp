// kit_main.cpp - the entry of the test program.
//
// The library is started as a program starts it, so that its process-wide
// values are there; tests that need a start of another kind run a case in a
// process (kit/cases.h), for which this entry hands over to the case.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>

#include "kit/cases.h"
#include "zxmainf.h"

// Cases get their arguments as they came; the run time of the Windows target
// would expand wildcards.
extern "C" {
extern int _dowildcard;
int _dowildcard = 0;
}

namespace {

constexpr int k_no_such_case = 99;

int run_case(const std::string& name, int argc, char** argv) {
  const kit::CaseFunction function = kit::find_case(name);
  if (function != nullptr) return function(argc, argv);
  std::fprintf(stderr, "no such case: %s\n", name.c_str());
  return k_no_such_case;
}

}  // namespace

int main(int argc, char** argv) {
  const std::string name = kit::wanted_case();
  if (!name.empty()) return run_case(name, argc, argv);
  testing::InitGoogleTest(&argc, argv);
  init_zxlib_args(argc, argv);
  return RUN_ALL_TESTS();
}
