// fault_main.cpp - the export tool with system calls that can be made to
// fail, for the fault sweep.
//
// Environment: ZX_FAIL, such as "write:3", names the call that fails (kit/
// faults.h); ZX_FAIL_COUNTS names a file that gets the number of calls of
// each kind at the end, a line "write 7" each.
#include <cstdlib>
#include <fstream>

#include "kit/faults.h"
#include "zxmainf.h"

// As in the real entry: arguments come as they are.
extern "C" {
extern int _dowildcard;
int _dowildcard = 0;
}

namespace {

kit::Faults* faults;

void write_counts() {
  const char* name = std::getenv("ZX_FAIL_COUNTS");
  if (name == nullptr) return;
  std::ofstream out(name, std::ios::binary);
  for (int i = 0; i < kit::k_calls; ++i) {
    const auto call = static_cast<kit::Call>(i);
    out << kit::name_of(call) << ' ' << faults->count(call) << '\n';
  }
}

}  // namespace

int main(int argc, char** argv) {
  static kit::Faults all;
  faults = &all;
  if (const char* wish = std::getenv("ZX_FAIL"); wish && !all.parse(wish))
    return 77;
  std::atexit(write_counts);
  bail_wait_seconds = 0;
  init_zxlib_args(argc, argv);
  return zx_main();
}
