// core.cpp - the program that times strings, arrays and tables beside their
// peers.  bench/groups/core.py runs it and says what is compared.
//
// Its sources register benchmarks named WHAT/SIDE or WHAT/SIDE/SIZE, where
// SIDE is "ours" or "peer".  Both sides are instances of the same template, so
// that they do the same work.  One with several operations to an iteration
// says how many in the counter "operations".
#include <benchmark/benchmark.h>

#include <cstdint>

#include "zxmainf.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

int main(int argc, char** argv) {
  init_zxlib_args(1, argv);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
