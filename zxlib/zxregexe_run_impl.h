// zxregexe_run_impl.h - one run of the matcher over a subject.  Not installed.
//
// A run goes forward from step to step until one fails or all have matched.
// Where it has a choice it takes the best one and leaves a frame on the stack
// for the rest; where it changes a group or a field it leaves a frame with
// the old value.  Going back means taking frames off: old values are put
// back, and the first choice that has something left goes forward again.
//
// Counts of alternatives are never put back: what a failed try has left is
// what the next one finds.
#ifndef ZXREGEXE_RUN_IMPL_H
#define ZXREGEXE_RUN_IMPL_H

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>

#include "zxregexe_impl.h"
#include "zxregexe_memory_impl.h"
#include "zxregexe_stack_impl.h"

namespace zxregexe {

enum class Outcome {
  failed,
  matched,
  too_often,  // has gone back so often that failures should be remembered
};

// Where a run stands.
struct State {
  const zxStep* step;
  const char* at;
  Frame* top;
  std::uint32_t current;  // group
};

#define ZX_INLINE [[gnu::always_inline]] inline

// One run after the other over one subject.  Functions that take a State and
// return bool say whether the run can go on forward.
template <bool remembers>
class Run {
 public:
  Run(const zxRegex& regex, const char* its_start, const char* its_end,
      int its_previous)
      : program(regex.program()),
        plan(*regex.plan()),
        steps(plan.steps()),
        tables(plan.tables()),
        tests(plan.tests()),
        marks(plan.marks()),
        start(its_start),
        end(its_end),
        previous(its_previous),
        has_fresh_tries((plan.choice_bits & k_plan_fresh_tries) != 0) {}
  explicit Run(const Run<false>& other) requires remembers
      : program(other.program),
        plan(other.plan),
        steps(other.steps),
        tables(other.tables),
        tests(other.tests),
        marks(other.marks),
        start(other.start),
        end(other.end),
        previous(other.previous),
        has_fresh_tries(other.has_fresh_tries) {}

  // Tries a match at one place.
  Outcome from(const char* at) {
    return go({steps + plan.first, at, stack.bottom, 0}, true);
  }

  // Goes on with a run that has gone back too often.
  Outcome resume(Frame* top) { return go({steps, start, top, 0}, false); }

  Frame* left_at = nullptr;   // the stack of a run that left
  std::int64_t patience = 0;  // how often it may still go back
  std::uint32_t touched_counts = 0;

 private:
  friend class Run<true>;

  // A state of its own, and all that takes it inlined, so that it lives in
  // registers.
  Outcome go(State s, bool starts_forward) {
    for (bool goes_forward = starts_forward;; goes_forward = true) {
      if (goes_forward && forward(s)) return Outcome::matched;
      if (!remembers && --patience < 0) {
        left_at = s.top;
        return Outcome::too_often;
      }
      if (!go_back(s)) return Outcome::failed;
    }
  }

  // ---- forward
  ZX_INLINE bool forward(State& s) {
    for (;;) {
      const zxStep& step = *s.step;
      s.step = steps + step.next;
      switch (step.kind) {
        case zxStepKind::succeed:
          zx_match.end[0] = s.at;
          return true;
        case zxStepKind::sequence:
          if (!is_sequence(s, step)) return false;
          break;
        case zxStepKind::byte:
          if (!is_byte(s, step.number)) return false;
          break;
        case zxStepKind::literal:
          if (!is_literal(s, step)) return false;
          break;
        case zxStepKind::set:
          if (s.at == end || !has(s.at, step.table, step.mask)) return false;
          ++s.at;
          break;
        case zxStepKind::any:
          if (s.at == end) return false;
          ++s.at;
          break;
        case zxStepKind::at_start:
          if (s.at != start || previous != k_at_start) return false;
          break;
        case zxStepKind::at_end:
          if (s.at != end) return false;
          break;
        case zxStepKind::word_edge:
          if (!is_word_edge(s.at)) return false;
          break;
        case zxStepKind::no_word_edge:
          if (is_word_edge(s.at)) return false;
          break;
        case zxStepKind::open_plain:
          s.current = 0;
          break;
        case zxStepKind::open:
          if (!open_group(s, step.number, s.at)) return false;
          break;
        case zxStepKind::close:
          if (!close_group(s, step.number, s.at)) return false;
          break;
        case zxStepKind::check_branch:
          if (is_empty_pass(s, step.other)) return false;
          [[fallthrough]];
        case zxStepKind::branch:
          if (!choose(s, step)) return false;
          break;
        case zxStepKind::check_pass:
          if (is_empty_pass(s, step.other)) return false;
          break;
        case zxStepKind::back_reference:
          if (!is_group(s, step.number)) return false;
          break;
        case zxStepKind::field:
          if (!is_field(s, step)) return false;
          break;
        case zxStepKind::repeat:
          if (!repeat_for_good(s, step)) return false;
          break;
        case zxStepKind::repeat_greedy:
          if (!repeat_greedy(s, step)) return false;
          break;
        case zxStepKind::repeat_lazy:
          if (!repeat_lazy(s, step)) return false;
          break;
        default:
          __builtin_unreachable();
      }
    }
  }

  // ---- back
  ZX_INLINE bool go_back(State& s) {
    while (s.top != stack.bottom) {
      Frame& frame = *--s.top;
      switch (frame.kind) {
        case FrameKind::alternative:
          if (choose_next(s, frame)) return true;
          break;
        case FrameKind::greedy:
          if (repeat_less(s, frame)) return true;
          break;
        case FrameKind::lazy:
          if (repeat_more(s, frame)) return true;
          break;
        case FrameKind::group_start:
          zx_match.start[frame.count] = frame.place;
          break;
        case FrameKind::group_end:
          zx_match.end[frame.count] = frame.place;
          break;
        case FrameKind::field_start:
          put_field_back(frame);
          break;
        case FrameKind::field_end:
          field_of(frame.step).end = frame.place;
          break;
        case FrameKind::failing:
          note_failure(frame);
          break;
      }
    }
    return false;
  }

  // ---- the stack
  // Without memory for the frame the run is given up: nothing is left to go
  // back to.
  ZX_INLINE bool push(State& s, const Frame& frame) {
    if (s.top == stack.limit) [[unlikely]] {
      s.top = stack.grow(s.top);
      if (s.top == nullptr) {
        s.top = stack.bottom;
        return false;
      }
    }
    *s.top++ = frame;
    return true;
  }

  Frame frame_of(const State& s, FrameKind kind, const zxStep& step,
                 std::size_t count, const char* place) const {
    return {kind, static_cast<std::uint8_t>(s.current), number_of(step),
            static_cast<std::uint32_t>(count), place};
  }

  // A value that is put back when the run goes back beyond this point.  With
  // nothing to go back to it isn't needed: the search clears all.
  ZX_INLINE bool keep(State& s, FrameKind kind, std::uint16_t step,
                      std::uint32_t count, const char* place) {
    return s.top == stack.bottom ||
           push(s, {kind, static_cast<std::uint8_t>(s.current), step, count,
                    place});
  }

  std::uint16_t number_of(const zxStep& step) const {
    return static_cast<std::uint16_t>(&step - steps);
  }

  // ---- bytes
  bool has(const char* at, unsigned table, unsigned mask) const {
    return (tables[table * 256 + static_cast<unsigned char>(*at)] & mask) != 0;
  }

  ZX_INLINE bool is_byte(State& s, std::uint8_t byte) const {
    if (s.at == end || static_cast<std::uint8_t>(*s.at) != byte) return false;
    ++s.at;
    return true;
  }

  ZX_INLINE bool is_literal(State& s, const zxStep& step) const {
    if (!is_text(s.at, program + step.place, step.number)) return false;
    s.at += step.number;
    return true;
  }

  ZX_INLINE bool is_text(const char* at, const std::uint8_t* text,
                         std::size_t length) const {
    if (static_cast<std::size_t>(end - at) < length) return false;
    for (std::size_t i = 0; i < length; ++i)
      if (static_cast<std::uint8_t>(at[i]) != text[i]) return false;
    return true;
  }

  // All the bytes are tested ahead of the first change.
  ZX_INLINE bool is_sequence(State& s, const zxStep& step) {
    const std::size_t length = step.number;
    if (static_cast<std::size_t>(end - s.at) < length) return false;
    const zxByteTest* test = tests + step.place;
    for (const char *at = s.at, *last = at + length; at != last; ++at, ++test)
      if (!fits(*test, static_cast<unsigned char>(*at))) return false;
    const zxGroupMark* mark = marks + step.look_table;
    for (const zxGroupMark* last = mark + step.table; mark != last; ++mark)
      if (!mark_group(s, *mark)) return false;
    s.at += length;
    return true;
  }

  ZX_INLINE bool fits(const zxByteTest& test, unsigned byte) const {
    return test.mask == 0 ? test.table == byte
                          : (tables[test.table * 256U + byte] & test.mask) != 0;
  }

  ZX_INLINE bool mark_group(State& s, const zxGroupMark& mark) {
    const char* const at = s.at + mark.offset;
    return mark.closes != 0 ? close_group(s, mark.group, at)
                            : open_group(s, mark.group, at);
  }

  bool is_word_edge(const char* at) const {
    const bool ahead =
        at == start ? previous != k_at_start &&
                          zx_is(static_cast<char>(previous), k_regex_edge_class)
                    : zx_is(at[-1], k_regex_edge_class);
    return ahead != (at != end && zx_is(*at, k_regex_edge_class));
  }

  // True if the run can go on at that place, as far as its byte tells.
  ZX_INLINE bool can_go_on(const zxStep& step, const char* at) const {
    return (step.look_flags & k_look_open) != 0 || meets(step, at);
  }
  ZX_INLINE bool meets(const zxStep& step, const char* at) const {
    return at == end ? (step.look_flags & k_look_end) != 0
                     : has(at, step.look_table, step.look_mask);
  }

  // ---- groups and fields
  ZX_INLINE bool open_group(State& s, unsigned n, const char* at) {
    if (!keep(s, FrameKind::group_start, 0, n, zx_match.start[n])) return false;
    zx_match.start[n] = at;
    s.current = n;
    set_count(n, 0);
    return true;
  }

  ZX_INLINE bool close_group(State& s, unsigned n, const char* at) {
    if (!keep(s, FrameKind::group_end, 0, n, zx_match.end[n])) return false;
    zx_match.end[n] = at;
    return true;
  }

  // Inside a loop a group can have begun again behind its old end.
  ZX_INLINE bool is_group(State& s, unsigned n) const {
    const char* text = zx_match.start[n];
    const char* text_end = zx_match.end[n];
    if (text == nullptr || text_end == nullptr || text_end < text) return false;
    if (end - s.at < text_end - text) return false;
    if (!std::equal(text, text_end, s.at)) return false;
    s.at += text_end - text;
    return true;
  }

  zxMatch::Field& field_of(std::uint16_t step) const {
    return zx_match.field[program[steps[step].place + k_node_head]];
  }

  ZX_INLINE bool is_field(State& s, const zxStep& step) {
    const char* behind = field_end(program + step.place, s.at, end);
    if (behind == nullptr) return false;
    const std::uint16_t number = number_of(step);
    zxMatch::Field& field = field_of(number);
    if (!keep(s, FrameKind::field_end, number, 0, field.end) ||
        !keep(s, FrameKind::field_start, number,
              static_cast<unsigned char>(field.type), field.start))
      return false;
    field.type = static_cast<char>(program[step.place + k_node_head + 4]);
    field.start = s.at;
    field.end = behind;
    s.at = behind;
    return true;
  }

  void put_field_back(const Frame& frame) const {
    zxMatch::Field& field = field_of(frame.step);
    field.type = static_cast<char>(frame.count);
    field.start = frame.place;
  }

  // ---- alternatives
  void set_count(unsigned n, std::int32_t count) {
    zx_match.alternative[n] = count;
    if (remembers) touched_counts |= 1U << n;
  }

  ZX_INLINE bool choose(State& s, const zxStep& branch) {
    if (remembers && has_failed(s, branch)) return false;
    set_count(s.current, 1);
    return try_alternative(s, branch);
  }

  // The first alternative from this one on that the byte allows; the ones
  // behind it are left for later.
  ZX_INLINE bool try_alternative(State& s, const zxStep& first) {
    const zxStep* branch = &first;
    while (branch->other != k_no_step) {
      if (can_go_on(*branch, s.at) && has_word(*branch, s.at)) {
        if (is_last_try(s, *branch) && meets(*branch, s.at)) break;
        if (!push(s,
                  {FrameKind::alternative, static_cast<std::uint8_t>(s.current),
                   branch->other, 0, s.at}))
          return false;
        break;
      }
      set_count(s.current, zx_match.alternative[s.current] + 1);
      branch = steps + branch->other;
    }
    s.step = steps + branch->next;
    return true;
  }

  // The word that an alternative begins with is looked at ahead of the choice.
  ZX_INLINE bool has_word(const zxStep& branch, const char* at) const {
    return branch.number == 0 ||
           is_text(at, program + branch.max, branch.number);
  }

  // True if, once what is behind a choice has failed, the try has failed: the
  // other ways can't go on here, nothing is left to go back to, and nobody
  // will see the counts that they would have left.
  ZX_INLINE bool is_last_try(const State& s, const zxStep& step) const {
    return (step.look_flags & k_look_only) != 0 && s.top == stack.bottom &&
           has_fresh_tries;
  }

  // The count goes up from what the failed try has left.
  ZX_INLINE bool choose_next(State& s, const Frame& frame) {
    s.at = frame.place;
    s.current = frame.current;
    set_count(s.current, zx_match.alternative[s.current] + 1);
    return try_alternative(s, steps[frame.step]);
  }

  // True if the pass of a loop took nothing: it ends where the loop's last
  // choice was made.  `exit` is the alternative that leaves the loop.
  ZX_INLINE bool is_empty_pass(const State& s, std::uint16_t exit) const {
    for (const Frame* frame = s.top; frame != stack.bottom;) {
      --frame;
      if (frame->kind == FrameKind::alternative && frame->step == exit)
        return frame->place == s.at;
    }
    return false;
  }

  // ---- repetitions
  // How far a repetition that begins at `at` may go by its maximum.
  ZX_INLINE const char* limit_of(const zxStep& step, const char* at) const {
    return step.max == k_no_limit || end - at <= step.max ? end : at + step.max;
  }

  // How far the step's set goes on, up to `limit`.
  ZX_INLINE const char* run_end(const zxStep& step, const char* at,
                                const char* limit) const {
    if (step.takes_all != 0) return limit;
    const std::uint8_t* table = tables + step.table * 256U;
    const unsigned mask = step.mask;
    const auto fits = [=](const char* place) {
      return (table[static_cast<unsigned char>(*place)] & mask) != 0;
    };
    constexpr std::ptrdiff_t k_near = 16;
    const char* const near_limit = limit - at > k_near ? at + k_near : limit;
    for (; near_limit - at >= 4; at += 4) {
      if (!fits(at)) return at;
      if (!fits(at + 1)) return at + 1;
      if (!fits(at + 2)) return at + 2;
      if (!fits(at + 3)) return at + 3;
    }
    for (; at != near_limit; ++at)
      if (!fits(at)) return at;
    return at == limit
               ? at
               : find_not_in(plan, zx_set_number(step.table, mask), at, limit);
  }

  ZX_INLINE bool repeat_for_good(State& s, const zxStep& step) const {
    const char* const behind = run_end(step, s.at, limit_of(step, s.at));
    if (behind - s.at < step.min) return false;
    s.at = behind;
    return true;
  }

  ZX_INLINE bool repeat_greedy(State& s, const zxStep& step) {
    const char* const behind = run_end(step, s.at, limit_of(step, s.at));
    if (behind - s.at < step.min) return false;
    if (remembers && behind - s.at > step.min && has_failed(s, step))
      return false;
    return try_counts_down(s, step, s.at,
                           static_cast<std::size_t>(behind - s.at));
  }

  // Goes on behind the highest count up to `count` that the byte there
  // allows; lower ones are left for later.
  ZX_INLINE bool try_counts_down(State& s, const zxStep& step, const char* base,
                                 std::size_t count) {
    const std::size_t min = step.min;
    if (!can_go_on(step, base + count)) {
      if (count == min) return false;
      const char* place =
          find_last_in(plan, zx_set_number(step.look_table, step.look_mask),
                       base + min, base + count);
      if (place == nullptr) return false;
      count = static_cast<std::size_t>(place - base);
    }
    if (count > min && !is_last_try(s, step) &&
        !push(s, frame_of(s, FrameKind::greedy, step, count - 1, base)))
      return false;
    s.at = base + count;
    s.step = steps + step.next;
    return true;
  }

  ZX_INLINE bool repeat_less(State& s, const Frame& frame) {
    s.current = frame.current;
    return try_counts_down(s, steps[frame.step], frame.place, frame.count);
  }

  ZX_INLINE bool repeat_lazy(State& s, const zxStep& step) {
    if (step.min > 0) {
      if (end - s.at < step.min) return false;
      const char* const least = s.at + step.min;
      if (run_end(step, s.at, least) != least) return false;
    }
    if (remembers && has_failed(s, step)) return false;
    return try_counts_up(s, step, s.at, step.min);
  }

  // The same from the lowest count upward; `count` bytes are known to fit.
  ZX_INLINE bool try_counts_up(State& s, const zxStep& step, const char* base,
                               std::size_t count) {
    const char* const limit = limit_of(step, base);
    const char* place = next_way_on(step, base + count, limit);
    if (place == nullptr) return false;
    if (place != limit && has(place, step.table, step.mask) &&
        !push(s, frame_of(s, FrameKind::lazy, step,
                          static_cast<std::size_t>(place - base) + 1, base)))
      return false;
    s.at = place;
    s.step = steps + step.next;
    return true;
  }

  // The first place from `at` to `limit` where the run can go on, the bytes
  // ahead of it being in the set; null if there is none.
  ZX_INLINE const char* next_way_on(const zxStep& step, const char* at,
                                    const char* limit) const {
    if (step.takes_all != 0 && (step.look_flags & k_look_open) == 0) {
      at = find_in(plan, zx_set_number(step.look_table, step.look_mask), at,
                   limit);
      return at != limit || can_go_on(step, at) ? at : nullptr;
    }
    while (!can_go_on(step, at)) {
      if (at == limit || !has(at, step.table, step.mask)) return nullptr;
      ++at;
    }
    return at;
  }

  ZX_INLINE bool repeat_more(State& s, const Frame& frame) {
    s.current = frame.current;
    return try_counts_up(s, steps[frame.step], frame.place, frame.count);
  }

  // ---- remembered failures
  // If the choice has failed at this place before, its effect is brought
  // about; otherwise a frame sees to it that its failure is noted.
  ZX_INLINE bool has_failed(State& s, const zxStep& step) {
    const std::size_t number = number_of(step);
    if (const Effect* effect = memory.recall(number, s.current, s.at)) {
      repeat_effect(*effect);
      return true;
    }
    const Frame frame =
        frame_of(s, FrameKind::failing, step, touched_counts, s.at);
    touched_counts = 0;
    return !push(s, frame);
  }

  void repeat_effect(const Effect& effect) {
    for (unsigned n = 0; n < zxMatch::k_slots; ++n)
      if ((effect.touched >> n & 1) != 0) set_count(n, effect.counts[n]);
  }

  void note_failure(const Frame& frame) {
    if (!remembers) return;
    Effect effect{};
    effect.touched = touched_counts;
    for (int n = 0; n < zxMatch::k_slots; ++n)
      if ((touched_counts >> n & 1) != 0)
        effect.counts[n] = zx_match.alternative[n];
    memory.note(frame.step, frame.current, frame.place, effect);
    touched_counts |= frame.count;
  }

  const std::uint8_t* const program;
  const zxRegexPlan& plan;
  const zxStep* const steps;
  const std::uint8_t* const tables;
  const zxByteTest* const tests;
  const zxGroupMark* const marks;
  const char* const start;
  const char* const end;
  const int previous;
  const bool has_fresh_tries;
};

#undef ZX_INLINE

}  // namespace zxregexe

#endif  // ZXREGEXE_RUN_IMPL_H
