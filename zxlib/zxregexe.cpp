// The search and the run.  From the bottom up: the record, the stack of
// choices, what is remembered of failures, the run, the search.
//
// A run goes forward from step to step until one fails or all have matched.
// Where it has a choice it takes the best one and leaves a frame on the stack
// for the rest; where it changes a group or a field it leaves a frame with
// the old value.  Going back means taking frames off: old values are put
// back, and the first choice that has something left goes forward again.
//
// Counts of alternatives are never put back: what a failed try has left is
// what the next one finds.

#include "zxregexe.h"

#include <algorithm>
#include <cstring>

#include "zxregexe_impl.h"

zxMatch zx_match;

namespace zxregexe {

namespace {

// ------------------------------------------------------------ the record --

// How much of the record the last run may have set.
struct Touched {
  int groups = 0;
  int fields = 0;
};
Touched touched;

void clear_slot(std::int32_t n) {
  zx_match.start[n] = nullptr;
  zx_match.end[n] = nullptr;
}

void clear_groups(int highest) {
  for (int n = 0; n <= highest; ++n) clear_slot(n);
}

void clear_fields(int count) {
  std::fill_n(zx_match.field, count, zxMatch::Field{});
}

void clear_record() {
  clear_groups(touched.groups);
  clear_slot(zxMatch::k_before);
  clear_slot(zxMatch::k_after);
  std::fill_n(zx_match.alternative, zxMatch::k_slots, 0);
  clear_fields(touched.fields);
}

void set_slot(std::int32_t n, const char* start, const char* end) {
  zx_match.start[n] = start;
  zx_match.end[n] = end;
}

// --------------------------------------------------- the stack of choices --

enum class FrameKind : std::uint8_t {
  alternative,  // step: the BRANCH to try next; place: where
  greedy,       // step: the repetition; count: to try next; place: its begin
  lazy,
  group_start,  // count: the group; place: its old start
  group_end,    // ... its old end
  field_start,  // step: the field; count: its old type; place: its old start
  field_end,    // place: its old end
  failing,      // step and place: what has failed when all above has;
                // count: the counts touched before it
};

struct Frame {
  FrameKind kind;
  std::uint8_t current;  // the current group to go on with
  std::uint16_t step;
  std::uint32_t count;
  const char* place;
};
static_assert(sizeof(Frame) == 8 + sizeof(void*));

// Kept between runs; what is beyond `k_kept` frames is given back.
struct Stack {
  static constexpr std::size_t k_kept = 65536 / sizeof(Frame);
  Frame* bottom = nullptr;
  Frame* limit = nullptr;

  std::size_t capacity() const {
    return static_cast<std::size_t>(limit - bottom);
  }

  bool resize(std::size_t frames) {
    auto* block =
        static_cast<Frame*>(zx_realloc(bottom, frames * sizeof(Frame)));
    if (block == nullptr && frames != 0) return false;
    bottom = block;
    limit = block + frames;
    return true;
  }

  // Makes room for more frames; the place of `top` in the block that has
  // moved, or null.
  [[gnu::noinline]] Frame* grow(const Frame* top) {
    const auto used = static_cast<std::size_t>(top - bottom);
    const std::size_t wanted = std::max(k_kept, 2 * capacity());
    if (wanted > PTRDIFF_MAX / sizeof(Frame)) {
      bail_code(2000);
      return nullptr;
    }
    return resize(wanted) ? bottom + used : nullptr;
  }

  void give_back() {
    if (capacity() > k_kept) resize(k_kept);
  }
};
Stack stack;

// ------------------------------------------------- remembering of failures --

// What failed at a place fails whenever a run comes there again, and leaves
// the same counts, because each count that it adds to it has set before.  So a
// run that goes back very often notes down, for each choice and place, that it
// has failed, and with which effect.

// The counts that a failed try wrote.
struct Effect {
  std::uint16_t touched;  // a bit for each slot
  std::uint8_t current;   // the current group that it began with
  std::int32_t counts[zxMatch::k_slots];

  bool operator==(const Effect& other) const {
    if (touched != other.touched || current != other.current) return false;
    for (int n = 0; n < zxMatch::k_slots; ++n)
      if ((touched >> n & 1) != 0 && counts[n] != other.counts[n]) return false;
    return true;
  }
};

class Memory {
 public:
  static constexpr std::size_t k_most_bytes = 64U << 20;

  // Makes room for all steps at all places; false if that is too much.
  bool open(std::size_t step_count, const char* subject, const char* end) {
    start = subject;
    places = static_cast<std::size_t>(end - subject) + 1;
    const std::size_t most = k_most_bytes / sizeof(std::uint16_t);
    if (step_count > most / places) return false;
    const std::size_t bytes = step_count * places * sizeof(std::uint16_t);
    cells = static_cast<std::uint16_t*>(zx_realloc(nullptr, bytes));
    if (cells == nullptr) return false;
    std::memset(cells, 0, bytes);
    effect_count = 0;
    return true;
  }

  void close() {
    if (cells != nullptr) zx_realloc(cells, 0);
    cells = nullptr;
  }

  bool is_open() const { return cells != nullptr; }

  // The effect of the failure at that place; null if none is known.
  const Effect* recall(std::size_t step, const char* at, int current) const {
    const std::uint16_t number = cells[cell(step, at)];
    if (number == 0) return nullptr;
    const Effect& effect = effects[number - 1];
    return effect.current == current ? &effect : nullptr;
  }

  void note(std::size_t step, const char* at, const Effect& effect) {
    int i = 0;
    while (i < effect_count && !(effects[i] == effect)) ++i;
    if (i == k_most_effects) return;
    if (i == effect_count) effects[effect_count++] = effect;
    cells[cell(step, at)] = static_cast<std::uint16_t>(i + 1);
  }

 private:
  static constexpr int k_most_effects = 256;

  std::size_t cell(std::size_t step, const char* at) const {
    return step * places + static_cast<std::size_t>(at - start);
  }

  std::uint16_t* cells = nullptr;
  const char* start = nullptr;
  std::size_t places = 0;
  int effect_count = 0;
  Effect effects[k_most_effects];
};
Memory memory;

// --------------------------------------------------------------- the run --

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
  Run(const zxRegex& its_regex, const Subject& subject)
      : program(its_regex.program()),
        plan(*its_regex.plan()),
        steps(plan.steps()),
        tables(plan.tables()),
        start(subject.start),
        end(subject.end),
        previous(subject.previous) {}

  // Tries a match at one place.
  Outcome from(const char* at) {
    State state{steps + plan.first, at, stack.bottom, 0};
    return go(state);
  }

  // Goes on with a run that has gone back too often.
  Outcome resume(Frame* top) {
    State state{nullptr, nullptr, top, 0};
    return go_back(state) ? go(state) : Outcome::failed;
  }

  Frame* left_at = nullptr;   // the stack of a run that left
  std::int64_t patience = 0;  // how often it may still go back
  std::uint32_t touched_counts = 0;

 private:
  Outcome go(State& state) {
    for (;;) {
      if (forward(state)) return Outcome::matched;
      if (!remembers && --patience < 0) {
        left_at = state.top;
        return Outcome::too_often;
      }
      if (!go_back(state)) return Outcome::failed;
    }
  }

  // ---- forward
  ZX_INLINE bool forward(State& s) {
    for (;;) {
      const zxStep& step = *s.step;
      s.step = steps + step.next;
      switch (step.kind) {
        case zxStepKind::succeed:
          set_slot(0, nullptr, s.at);
          return true;
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
          if (s.at != start || previous != Subject::k_at_start) return false;
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
          if (!open_group(s, step.number)) return false;
          break;
        case zxStepKind::close:
          if (!close_group(s, step.number)) return false;
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

  ByteScan scan_of(unsigned table, unsigned mask) const {
    return {tables + table * 256, static_cast<std::uint8_t>(mask),
            plan.sets() + table * 8 +
                static_cast<unsigned>(std::countr_zero(mask))};
  }

  ZX_INLINE bool is_byte(State& s, std::uint8_t byte) const {
    if (s.at == end || static_cast<std::uint8_t>(*s.at) != byte) return false;
    ++s.at;
    return true;
  }

  ZX_INLINE bool is_literal(State& s, const zxStep& step) const {
    const std::size_t length = step.number;
    const std::uint8_t* bytes = program + step.place;
    if (static_cast<std::size_t>(end - s.at) < length ||
        static_cast<std::uint8_t>(*s.at) != *bytes)
      return false;
    for (std::size_t i = 1; i < length; ++i)
      if (static_cast<std::uint8_t>(s.at[i]) != bytes[i]) return false;
    s.at += length;
    return true;
  }

  bool is_word_edge(const char* at) const {
    const bool ahead =
        at == start ? previous != Subject::k_at_start &&
                          zx_is(static_cast<char>(previous), k_regex_edge_class)
                    : zx_is(at[-1], k_regex_edge_class);
    return ahead != (at != end && zx_is(*at, k_regex_edge_class));
  }

  // True if the run can go on at that place, as far as its byte tells.
  ZX_INLINE bool can_go_on(const zxStep& step, const char* at) const {
    if ((step.look_flags & k_look_open) != 0) return true;
    return at == end ? (step.look_flags & k_look_end) != 0
                     : has(at, step.look_table, step.look_mask);
  }

  // ---- groups and fields
  ZX_INLINE bool open_group(State& s, unsigned n) {
    if (!keep(s, FrameKind::group_start, 0, n, zx_match.start[n])) return false;
    zx_match.start[n] = s.at;
    s.current = n;
    set_count(n, 0);
    return true;
  }

  ZX_INLINE bool close_group(State& s, unsigned n) {
    if (!keep(s, FrameKind::group_end, 0, n, zx_match.end[n])) return false;
    zx_match.end[n] = s.at;
    return true;
  }

  // Inside a loop a group can have begun again behind its old end.
  bool is_group(State& s, unsigned n) const {
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

  bool is_field(State& s, const zxStep& step) {
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
      if (can_go_on(*branch, s.at)) {
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

  // The count goes up from what the failed try has left.
  ZX_INLINE bool choose_next(State& s, const Frame& frame) {
    s.at = frame.place;
    s.current = frame.current;
    set_count(s.current, zx_match.alternative[s.current] + 1);
    return try_alternative(s, steps[frame.step]);
  }

  // True if the pass of a loop took nothing: it ends where the loop's last
  // choice was made.  `exit` is the alternative that leaves the loop.
  bool is_empty_pass(const State& s, std::uint16_t exit) const {
    for (const Frame* frame = s.top; frame != stack.bottom;) {
      --frame;
      if (frame->kind == FrameKind::alternative && frame->step == exit)
        return frame->place == s.at;
    }
    return false;
  }

  // ---- repetitions
  // How often the set goes on from there, up to the step's maximum.
  ZX_INLINE std::size_t run_length(const zxStep& step, const char* at) const {
    const auto left = static_cast<std::size_t>(end - at);
    const char* limit = step.max == k_no_limit
                            ? end
                            : at + std::min<std::size_t>(left, step.max);
    const char* p = at;
    const char* near_limit = limit - p > 16 ? p + 16 : limit;
    while (p < near_limit && has(p, step.table, step.mask)) ++p;
    if (p == near_limit && p < limit)
      p = find_not_in(scan_of(step.table, step.mask), p, limit);
    return static_cast<std::size_t>(p - at);
  }

  ZX_INLINE bool repeat_for_good(State& s, const zxStep& step) const {
    const std::size_t count = run_length(step, s.at);
    if (count < step.min) return false;
    s.at += count;
    return true;
  }

  ZX_INLINE bool repeat_greedy(State& s, const zxStep& step) {
    const std::size_t count = run_length(step, s.at);
    if (count < step.min) return false;
    if (remembers && count > step.min && has_failed(s, step)) return false;
    return try_counts_down(s, step, s.at, count);
  }

  // Goes on behind the highest count up to `count` that the byte there
  // allows; lower ones are left for later.
  ZX_INLINE bool try_counts_down(State& s, const zxStep& step, const char* base,
                                 std::size_t count) {
    const std::size_t min = step.min;
    if (!can_go_on(step, base + count)) {
      if (count == min) return false;
      const char* place = find_last_in(scan_of(step.look_table, step.look_mask),
                                       base + min, base + count);
      if (place == nullptr) return false;
      count = static_cast<std::size_t>(place - base);
    }
    if (count > min &&
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
      zxStep least = step;
      least.max = step.min;
      if (run_length(least, s.at) < step.min) return false;
    }
    if (remembers && has_failed(s, step)) return false;
    return try_counts_up(s, step, s.at, step.min);
  }

  // The same from the lowest count upward; `count` bytes are known to fit.
  ZX_INLINE bool try_counts_up(State& s, const zxStep& step, const char* base,
                               std::size_t count) {
    const char* place = base + count;
    const char* limit =
        step.max == k_no_limit
            ? end
            : base + std::min<std::size_t>(static_cast<std::size_t>(end - base),
                                           step.max);
    while (!can_go_on(step, place)) {
      if (place == limit || !has(place, step.table, step.mask)) return false;
      ++place;
    }
    if (place != limit && has(place, step.table, step.mask) &&
        !push(s, frame_of(s, FrameKind::lazy, step,
                          static_cast<std::size_t>(place - base) + 1, base)))
      return false;
    s.at = place;
    s.step = steps + step.next;
    return true;
  }

  ZX_INLINE bool repeat_more(State& s, const Frame& frame) {
    s.current = frame.current;
    return try_counts_up(s, steps[frame.step], frame.place, frame.count);
  }

  // ---- remembered failures
  // If the choice has failed at this place before, its effect is brought
  // about; otherwise a frame sees to it that its failure is noted.
  bool has_failed(State& s, const zxStep& step) {
    const std::size_t number = number_of(step);
    if (const Effect* effect =
            memory.recall(number, s.at, static_cast<int>(s.current))) {
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
    Effect effect;
    effect.touched = static_cast<std::uint16_t>(touched_counts);
    effect.current = frame.current;
    std::copy_n(zx_match.alternative, zxMatch::k_slots, effect.counts);
    memory.note(frame.step, frame.place, effect);
    touched_counts |= frame.count;
  }

  const std::uint8_t* const program;
  const zxRegexPlan& plan;
  const zxStep* const steps;
  const std::uint8_t* const tables;
  const char* const start;
  const char* const end;
  const int previous;
};

#undef ZX_INLINE

// ------------------------------------------------------------ the search --

// How often a run may go back before failures are remembered.
std::int64_t patience_for(const Subject& subject) {
  constexpr std::int64_t k_base = 256;
  constexpr std::int64_t k_for_each_byte = 4;
  return k_base + k_for_each_byte * (subject.end - subject.start);
}

class Search {
 public:
  Search(const zxRegex& its_regex, const Subject& its_subject)
      : regex(its_regex),
        plan(*its_regex.plan()),
        subject(its_subject),
        starts{plan.tables() + plan.start_set / 8 * 256,
               static_cast<std::uint8_t>(1U << (plan.start_set % 8)),
               plan.sets() + plan.start_set},
        run(its_regex, its_subject) {
    run.patience = (plan.choice_bits & k_plan_remembers) != 0
                       ? patience_for(subject)
                       : INT64_MAX;
  }

  ~Search() {
    memory.close();
    stack.give_back();
  }
  Search(const Search&) = delete;
  Search& operator=(const Search&) = delete;

  bool find() {
    if (regex.reganch != 0) return try_at(subject.start);
    for (const char* at = subject.start;; ++at) {
      at = next_start(at);
      if (at == nullptr) return false;
      if (try_at(at)) return true;
      if ((plan.choice_bits & k_plan_one_try) != 0) return false;
      if ((plan.choice_bits & k_plan_skips_run) != 0) at = behind_run(at) - 1;
      if (at >= subject.end) return false;
    }
  }

 private:
  // The first place from `at` on where a match can begin; null if none.
  const char* next_start(const char* at) const {
    if ((plan.start_flags & k_look_open) != 0) return at;
    const char* place = find_in(starts, at, subject.end);
    const bool ok =
        place != subject.end || (plan.start_flags & k_look_end) != 0;
    return ok ? place : nullptr;
  }

  // A match that begins with a repetition has failed: it fails wherever the
  // same run of bytes is entered, the next place to try being behind it.
  const char* behind_run(const char* at) const {
    const zxStep* step = plan.steps() + plan.first;
    while (step->kind != zxStepKind::repeat) step = plan.steps() + step->next;
    const ByteScan set{plan.tables() + step->table * 256, step->mask,
                       plan.sets() + step->table * 8 +
                           static_cast<unsigned>(std::countr_zero(
                               static_cast<unsigned>(step->mask)))};
    return std::max(find_not_in(set, at, subject.end), at + 1);
  }

  bool try_at(const char* at) {
    if (outcome_at(at) == Outcome::matched) {
      set_slot(0, at, zx_match.end[0]);
      set_slot(zxMatch::k_before, subject.start, at);
      set_slot(zxMatch::k_after, zx_match.end[0], subject.end);
      return true;
    }
    clear_groups(plan.groups);
    if (plan.fields != 0) clear_fields(plan.fields);
    return false;
  }

  Outcome outcome_at(const char* at) {
    if (!memory.is_open()) {
      const Outcome outcome = run.from(at);
      return outcome == Outcome::too_often ? give_more_room() : outcome;
    }
    Run<true> patient(regex, subject);
    return patient.from(at);
  }

  // The run goes on and remembers its failures, if there is room for them.
  Outcome give_more_room() {
    if (memory.open(plan.step_count, subject.start, subject.end)) {
      Run<true> patient(regex, subject);
      return patient.resume(run.left_at);
    }
    run.patience = INT64_MAX;
    return run.resume(run.left_at);
  }

  const zxRegex& regex;
  const zxRegexPlan& plan;
  const Subject& subject;
  const ByteScan starts;
  Run<false> run;
};

const char* find_literal(const char* at, const char* end, const char* literal,
                         std::size_t length) {
  while (static_cast<std::size_t>(end - at) >= length) {
    const std::size_t last = static_cast<std::size_t>(end - at) - length;
    at = static_cast<const char*>(std::memchr(at, *literal, last + 1));
    if (at == nullptr) return nullptr;
    if (std::memcmp(at, literal, length) == 0) return at;
    ++at;
  }
  return nullptr;
}

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

bool is_rejected(const zxRegex& regex, const Subject& subject) {
  if (regex.reganch == 2 &&
      (subject.start == subject.end ||
       static_cast<std::uint8_t>(*subject.start) != regex.regstart))
    return true;
  return regex.regmust != nullptr &&
         find_literal(subject.start, subject.end, regex.regmust,
                      regex.regmlen) == nullptr;
}

bool search(const zxRegex& regex, const Subject& subject) {
  clear_record();
  touched = {regex.plan()->groups, regex.plan()->fields};
  return Search(regex, subject).find();
}

}  // namespace zxregexe

bool regexec(const zxRegex* regex, const char* subject, const char* end) {
  using namespace zxregexe;
  if (!can_run(regex, subject, end)) return false;
  const Subject whole{subject, end, Subject::k_at_start};
  return !is_rejected(*regex, whole) && search(*regex, whole);
}

bool regexec_from(const zxRegex* regex, const char* subject, const char* end,
                  char prev_char) {
  using namespace zxregexe;
  if (!can_run(regex, subject, end)) return false;
  const Subject rest{subject, end, static_cast<unsigned char>(prev_char)};
  return !is_rejected(*regex, rest) && search(*regex, rest);
}

void clear_match() {
  zx_match = zxMatch{};
  zxregexe::touched = {};
}
