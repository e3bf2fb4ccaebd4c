// kit_main.cpp - the entry of the test program.
//
// The library is started as a program starts it, so that its process-wide
// values are there; tests that need a start of another kind run a process.
#include <gtest/gtest.h>

#include "zxmainf.h"

int main(int argc, char** argv) {
  testing::InitGoogleTest(&argc, argv);
  init_zxlib_args(argc, argv);
  return RUN_ALL_TESTS();
}
