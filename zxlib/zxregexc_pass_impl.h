// zxregexc_pass_impl.h - loops whose passes can be empty.  Not installed.
//
// A loop is made only of what takes a byte, but a counted repetition passes
// for that even if its minimum is 0, as in "(a{0,2})*".  A pass of such a loop
// that took nothing would be followed by another one for ever, so the matcher
// has to look.
#ifndef ZXREGEXC_PASS_IMPL_H
#define ZXREGEXC_PASS_IMPL_H

#include "zxregexc_impl.h"

namespace zxregexc {

// The loops of one program.
class EmptyPasses {
 public:
  // The program that begins at that node.  `may_exist`: it has loops, and
  // counted repetitions with a minimum of 0.
  EmptyPasses(zxnode::Node begin, bool may_exist)
      : program(begin), can_be(may_exist) {}

  // True if `back` ends the passes of an x* whose x can match empty.
  bool ends_star(zxnode::Node back) const;

  // True if `branch` stands behind the x of an x+ whose x can match empty.
  bool ends_plus(zxnode::Node branch) const;

 private:
  bool can_pass(zxnode::Node from, zxnode::Node to) const;

  zxnode::Node program;
  bool can_be;
};

}  // namespace zxregexc

#endif  // ZXREGEXC_PASS_IMPL_H
