// entry.cpp - the entry of a program that feeds one fuzz target, FUZZ_TARGET.
//
// The library is not started: its handlers would take faults away from the
// sanitizers.
#include <cstddef>
#include <cstdint>

#include "fuzz/targets.h"
#include "zxmainf.h"

std::uint32_t traits = k_trait_console | k_trait_executable;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes,
                                      std::size_t size);

int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::FUZZ_TARGET(fuzz::Bytes(bytes, size));
  return 0;
}
