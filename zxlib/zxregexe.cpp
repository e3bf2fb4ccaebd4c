// The record of a match and the search for one.

#include "zxregexe.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "zxregexc_set_impl.h"
#include "zxregexe_impl.h"
#include "zxregexe_run_impl.h"

zxMatch zx_match;

namespace zxregexe {

namespace {

// ------------------------------------------------------------ the record --

// How many fields the last run may have set.
int touched_fields = 0;

// All slots one by one, which takes a dozen instructions; a loop would become
// a call.
template <std::size_t... n>
[[gnu::always_inline]] inline void clear_slots(std::index_sequence<n...>) {
  ((zx_match.start[n] = nullptr), ...);
  ((zx_match.end[n] = nullptr), ...);
}
[[gnu::always_inline]] inline void clear_slots() {
  clear_slots(std::make_index_sequence<zxMatch::k_slots>());
}

void clear_fields(int count) {
  for (int n = 0; n < count; ++n) zx_match.field[n] = zxMatch::Field{};
}

void clear_record() {
  clear_slots();
  std::fill_n(zx_match.alternative, zxMatch::k_slots, 0);
  clear_fields(touched_fields);
}

void set_slot(std::int32_t n, const char* start, const char* end) {
  zx_match.start[n] = start;
  zx_match.end[n] = end;
}

// ------------------------------------------------------------ the search --

// How often a run may go back before failures are remembered.
std::int64_t patience_for(std::ptrdiff_t length) {
  constexpr std::int64_t k_base = 128;
  constexpr std::int64_t k_for_each_byte = 4;
  return k_base + k_for_each_byte * length;
}

class Search {
 public:
  Search(const zxRegex& its_regex, const char* its_start, const char* its_end,
         int previous)
      : regex(its_regex),
        plan(*regex.plan()),
        start_byte(regex.regstart),
        start(its_start),
        end(its_end),
        run(regex, its_start, its_end, previous) {
    run.patience = (plan.choice_bits & k_plan_remembers) != 0
                       ? patience_for(end - start)
                       : INT64_MAX;
  }

  ~Search() {
    if (memory.is_open()) memory.close();
    if (stack.capacity() > Stack::k_kept) stack.resize(Stack::k_kept);
  }
  Search(const Search&) = delete;
  Search& operator=(const Search&) = delete;

  bool find(bool is_anchored) {
    if (is_anchored) return try_at(start);
    for (const char* at = start;; ++at) {
      at = next_start(at);
      if (at == nullptr) return false;
      if (try_at(at)) return true;
      if (is_hopeless) return false;
      if ((plan.choice_bits & k_plan_one_try) != 0) return false;
      if ((plan.choice_bits & k_plan_skips_run) != 0) at = behind_run(at) - 1;
      if (at >= end) return false;
    }
  }

 private:
  // The first place from `at` on where a match can begin; null if none.
  const char* next_start(const char* at) const {
    if ((plan.start_flags & k_look_open) != 0) return at;
    const char* place = find_start(at);
    const bool ok = place != end || (plan.start_flags & k_look_end) != 0;
    return ok ? place : nullptr;
  }

  const char* find_start(const char* at) const {
    if (start_byte == k_regex_no_start)
      return find_in(plan, plan.start_set, at, end);
    const void* place =
        std::memchr(at, start_byte, static_cast<std::size_t>(end - at));
    return place == nullptr ? end : static_cast<const char*>(place);
  }

  // A match that begins with a repetition has failed: it fails wherever the
  // same run of bytes is entered, the next place to try being behind it.
  const char* behind_run(const char* at) const {
    const zxStep* step = plan.steps() + plan.first;
    while (step->kind != zxStepKind::repeat) step = plan.steps() + step->next;
    const unsigned set = zx_set_number(step->table, step->mask);
    return std::max(find_not_in(plan, set, at, end), at + 1);
  }

  bool try_at(const char* at) {
    if (outcome_at(at) == Outcome::matched) {
      zx_match.start[0] = at;
      set_slot(zxMatch::k_before, start, at);
      set_slot(zxMatch::k_after, zx_match.end[0], end);
      return true;
    }
    if (plan.groups != 0) clear_slots();
    if (plan.fields != 0) clear_fields(plan.fields);
    return false;
  }

  Outcome outcome_at(const char* at) {
    if (memory.is_open()) return try_remembering(at);
    const Outcome outcome = run.from(at);
    return outcome == Outcome::too_often ? go_on_remembering() : outcome;
  }

  [[gnu::noinline]] Outcome try_remembering(const char* at) const {
    return Run<true>(run).from(at);
  }

  // All bytes means that none is known to be needed.
  bool lacks_needed_byte() const {
    const zxregexc::ByteSet needed = zxregexc::needed_set(regex);
    return !(needed == zxregexc::k_all_bytes) &&
           std::none_of(start, end, [&needed](char byte) {
             return needed.has(static_cast<unsigned char>(byte));
           });
  }

  // The run goes on and remembers its failures, if there is room for them and
  // there is a byte that it must come upon.
  [[gnu::noinline]] Outcome go_on_remembering() {
    is_hopeless = lacks_needed_byte();
    if (is_hopeless) return Outcome::failed;
    if (memory.open(plan, start, end))
      return Run<true>(run).resume(run.left_at);
    run.patience = INT64_MAX;
    return run.resume(run.left_at);
  }

  const zxRegex& regex;
  const zxRegexPlan& plan;
  const std::uint8_t start_byte;
  const char* const start;
  const char* const end;
  bool is_hopeless = false;  // nothing can match anywhere
  Run<false> run;
};

}  // namespace

bool can_run(const zxRegex* regex, const char* subject, const char* end) {
  if (regex == nullptr || subject == nullptr) {
    bail_code(1753);
    return false;
  }
  if (regex->magic != k_regex_magic) {
    bail_code(1754);
    return false;
  }
  return ZX_ASSERT(end >= subject && end - subject < 0x7FFFFFFF);
}

bool is_missing(const char* literal, std::size_t length, const char* start,
                const char* end) {
  while (static_cast<std::size_t>(end - start) >= length) {
    const std::size_t last = static_cast<std::size_t>(end - start) - length;
    start = static_cast<const char*>(std::memchr(start, *literal, last + 1));
    if (start == nullptr) return true;
    if (std::memcmp(start, literal, length) == 0) return false;
    ++start;
  }
  return true;
}

bool search(const zxRegex& regex, const char* start, const char* end,
            int previous) {
  clear_record();
  touched_fields = regex.plan()->fields;
  return Search(regex, start, end, previous).find(regex.reganch != 0);
}

}  // namespace zxregexe

bool regexec(const zxRegex* regex, const char* subject, const char* end) {
  return zxregexe::can_run(regex, subject, end) &&
         !zxregexe::is_rejected(*regex, subject, end) &&
         zxregexe::search(*regex, subject, end, zxregexe::k_at_start);
}

bool regexec_from(const zxRegex* regex, const char* subject, const char* end,
                  char prev_char) {
  return zxregexe::can_run(regex, subject, end) &&
         !zxregexe::is_rejected(*regex, subject, end) &&
         zxregexe::search(*regex, subject, end,
                          static_cast<unsigned char>(prev_char));
}

void clear_match() {
  zx_match = zxMatch{};
  zxregexe::touched_fields = 0;
  zxregexe::stack.resize(0);
}
