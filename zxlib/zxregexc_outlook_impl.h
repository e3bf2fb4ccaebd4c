// zxregexc_outlook_impl.h - what a run of the matcher can meet behind a choice.
// Not installed.
//
// What a plan saves the matcher must never show.  Two things could show: the
// order of preference, and the counts of alternatives, which are not put back
// when a try fails.  So a try may be skipped by the byte that it meets only
// if, up to where it would fail, it writes no count that a later reader could
// see.
#ifndef ZXREGEXC_OUTLOOK_IMPL_H
#define ZXREGEXC_OUTLOOK_IMPL_H

#include "zxregexc_set_impl.h"

namespace zxregexc {

// Works out what a run can meet from a node on, up to the first byte that it
// takes; the result stays "anything" where that could show or would take long
// to find out.
class Outlook {
 public:
  enum class Purpose {
    choice,    // of a choice inside the pattern
    last_try,  // ... if its failure is that of the whole try
    start,     // of a match as a whole
  };
  Outlook() = default;  // anything can be met
  Outlook(zxnode::Node node, Purpose purpose, bool program_has_loops);

  bool is_known = false;  // otherwise anything can be met
  bool at_end = false;    // the end of the subject can be met
  // Counts don't matter; for a start: each try writes that of slot 0 first.
  bool is_free = false;
  ByteSet bytes;  // that can be met

  // True if nothing that this one can meet can be met by the other.
  bool excludes(const Outlook& other) const {
    return is_known && other.is_known && !(at_end && other.at_end) &&
           !bytes.meets(other.bytes);
  }

  std::uint8_t flags() const {
    if (!is_known) return k_look_open;
    return at_end ? k_look_end : 0;
  }

 private:
  bool walk(zxnode::Node node, bool is_own);
  bool walk_choice(zxnode::Node branch, bool is_own);
  bool takes_byte(zxnode::Node node);
  bool takes_field(zxnode::Node node);

  bool may_open = false;
  bool is_ahead_of_choices = false;
  int budget = 64;  // nodes to visit
};

}  // namespace zxregexc

#endif  // ZXREGEXC_OUTLOOK_IMPL_H
