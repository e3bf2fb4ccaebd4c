// copy_file.cpp - the program bench_copy_file FROM TO: one cpfile(), as a
// process for the group `files`.
#include "zxmainf.h"
#include "zxsys2.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

int zx_main() {
  cpfile(positional_arg(0), positional_arg(1));
  return 0;
}
