// zxatsys_faults.cpp - hardware faults and errors of mathematical functions
// as failures.
// Tests: tests/zxlib/zxatsys_test.cpp.
#include "zxatsys.h"
#include "zxatsys_impl.h"
#include "zxplat.h"
#include "zxstkdmp.h"

namespace {

constexpr int k_arithmetic = 8;
constexpr int k_divide_by_zero = 131;
constexpr int k_overflow = 132;

BailDetail detail_of(const zxplat::Fault& fault) {
  return {fault.signal * 100 + fault.sub_code % 100};
}

void fail_on_arithmetic(const zxplat::Fault& fault) {
  switch (fault.sub_code) {
    case k_divide_by_zero:
      return bail_code(3002);
    case k_overflow:
      return bail_code(3003);
    default:
      return bail_detail(3000, detail_of(fault));
  }
}

// Coming back leaves the fault to the system, which ends the process.
void fail_on(const zxplat::Fault& fault) {
  if (bail_guard) return;
  if (fault.signal == k_arithmetic) return fail_on_arithmetic(fault);
  stack_dump_fault = {true, fault.frame, fault.instruction};
  bail_detail(1001, detail_of(fault));
}

}  // namespace

void install_fault_handlers() {
  static constinit bool installed = false;
  if (installed) return;
  installed = true;
  zxplat::catch_faults(fail_on);
}

int math_error(zxMathError& record) {
  if (record.type == k_math_underflow) {
    record.result = 0;
    return 1;
  }
  bail_detail(3004, BailDetail(record.type, record.name));
  return 0;
}
