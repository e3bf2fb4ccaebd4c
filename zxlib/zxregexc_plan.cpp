// The plan of a program: steps, sequences, the block.

#include <algorithm>
#include <bit>
#include <cstring>

#include "zxqva.h"
#include "zxregexc_outlook_impl.h"
#include "zxregexc_pass_impl.h"

using zxnode::Node;
using namespace zxregexc;

namespace {

// ----------------------------------------------------------------- steps --

// What stands for nodes in the table of steps by place.
constexpr std::uint16_t k_skipped = 0xFFFF;      // has no step of its own
constexpr std::uint16_t k_alternative = 0xFFFE;  // is a later alternative

class Planner {
 public:
  Planner(const zxRegex& its_regex, zxRegexPlan& its_plan, zxStep* its_steps)
      : regex(its_regex),
        plan(its_plan),
        steps(its_steps),
        empty_passes(begin(), false) {}

  bool make() {
    number_steps();
    std::fill_n(steps, plan.step_count, zxStep{});
    for (Node node = begin(); node < end(); node = zxnode::following(node))
      if (step_of(node) != k_skipped && !make_step(node)) return false;
    for (Node node = begin(); node < end(); node = zxnode::following(node))
      if (step_of(node) != k_skipped) node = make_sequence(node);
    finish();
    return true;
  }

  const zxQVA<ByteSet>& all_sets() const { return sets; }
  const zxQVA<zxByteTest>& all_tests() const { return tests; }
  const zxQVA<zxGroupMark>& all_marks() const { return marks; }

 private:
  // ---- nodes
  Node begin() const { return regex.program() + 1; }
  Node end() const { return regex.program() + regex.size; }
  std::uint16_t place(Node node) const {
    return static_cast<std::uint16_t>(node - regex.program());
  }
  std::uint16_t& step_of(Node node) { return step_at[place(node)]; }

  // The node that a run comes to when it is sent to `node`: those that do
  // nothing are passed.
  Node arrived(Node node) {
    while (step_of(node) == k_skipped)
      node = zxnode::is(node, zxNodeKind::branch) ? zxnode::operand(node)
                                                  : zxnode::next(node);
    return node;
  }
  std::uint16_t step_behind(Node node) {
    return step_of(arrived(zxnode::next(node)));
  }

  // ---- which nodes become steps
  void number_steps() {
    std::memset(step_at, 0, regex.size * sizeof step_at[0]);
    look_for_loops();
    int count = 0;
    for (Node node = begin(); node < end(); node = zxnode::following(node)) {
      const bool has_step = is_step(node);
      step_of(node) = has_step ? static_cast<std::uint16_t>(count) : k_skipped;
      if (has_step) ++count;
    }
    plan.step_count = static_cast<std::uint16_t>(count);
  }

  bool is_step(Node node) {
    switch (static_cast<zxNodeKind>(*node)) {
      case zxNodeKind::nothing:
      case zxNodeKind::close0:
        return false;
      case zxNodeKind::back:
        return empty_passes.ends_star(node);
      case zxNodeKind::branch:
        return is_alternative(node);
      default:
        return true;
    }
  }

  // True for the BRANCH nodes of a choice; those of a group with a single
  // alternative do nothing.
  bool is_alternative(Node branch) {
    const Node other = zxnode::next_alternative(branch);
    if (other != nullptr) step_of(other) = k_alternative;
    return other != nullptr || step_of(branch) == k_alternative;
  }

  void look_for_loops() {
    bool has_empty_counts = false;
    for (Node node = begin(); node < end(); node = zxnode::following(node)) {
      if (zxnode::is(node, zxNodeKind::back)) has_loops = true;
      if (zxnode::is(node, zxNodeKind::backref)) has_references = true;
      if (zxnode::info(node).operand == zxOperand::counts &&
          zxnode::minimum(node) == 0)
        has_empty_counts = true;
    }
    empty_passes = EmptyPasses(begin(), has_loops && has_empty_counts);
  }

  // ---- filling steps
  bool make_step(Node node) {
    zxStep& step = steps[step_of(node)];
    if (zxnode::is(node, zxNodeKind::branch)) {
      if (!is_branch(step)) make_choice(node);
      return true;
    }
    step.next =
        zxnode::is(node, zxNodeKind::end) ? k_no_step : step_behind(node);
    if (zxnode::is_open(node) || zxnode::is_close(node)) {
      make_group(step, node);
    } else if (zxnode::is_repeat(node)) {
      make_repeat(step, node);
    } else {
      return make_plain(step, node);
    }
    return true;
  }

  bool make_plain(zxStep& step, Node node) {
    switch (static_cast<zxNodeKind>(*node)) {
      case zxNodeKind::end:
        step.kind = zxStepKind::succeed;
        break;
      case zxNodeKind::bol:
        step.kind = zxStepKind::at_start;
        break;
      case zxNodeKind::eol:
        step.kind = zxStepKind::at_end;
        break;
      case zxNodeKind::any:
        step.kind = zxStepKind::any;
        break;
      case zxNodeKind::exactly:
        make_literal(step, node);
        break;
      case zxNodeKind::wordb:
        step.kind = zxStepKind::word_edge;
        break;
      case zxNodeKind::nwordb:
        step.kind = zxStepKind::no_word_edge;
        break;
      case zxNodeKind::open0:
        step.kind = zxStepKind::open_plain;
        break;
      case zxNodeKind::back:
        step.kind = zxStepKind::check_pass;
        has_empty_passes = true;
        step.other = step_of(zxnode::next(zxnode::next(node)));
        break;
      case zxNodeKind::backref:
        step.kind = zxStepKind::back_reference;
        step.number = zxnode::operand(node)[1];
        break;
      case zxNodeKind::field:
        step.kind = zxStepKind::field;
        step.place = place(node);
        plan.fields = static_cast<std::uint8_t>(plan.fields + 1);
        break;
      default:
        if (!ZX_ASSERT(zxnode::info(node).class_bits != 0 ||
                       zxnode::is(node, zxNodeKind::anyof)))
          return false;
        step.kind = zxStepKind::set;
        use_set(first_set(node), step.table, step.mask);
        break;
    }
    return true;
  }

  void make_literal(zxStep& step, Node node) {
    const Node operand = zxnode::operand(node);
    if (*operand == 1) {
      step.kind = zxStepKind::byte;
      step.number = operand[1];
    } else {
      step.kind = zxStepKind::literal;
      step.number = *operand;
      step.place = place(operand + 1);
    }
  }

  void make_group(zxStep& step, Node node) {
    const auto group = static_cast<std::uint8_t>(zxnode::group_of(node));
    step.kind = zxnode::is_open(node) ? zxStepKind::open : zxStepKind::close;
    step.number = group;
    plan.groups = std::max(plan.groups, group);
  }

  static bool is_branch(const zxStep& step) {
    return step.kind == zxStepKind::branch ||
           step.kind == zxStepKind::check_branch;
  }

  // What is known of an alternative.
  struct Way {
    Node node = nullptr;
    Outlook look;
  };

  // The steps of all alternatives that begin with this one.
  void make_choice(Node first) {
    int count = 0;
    for (Node node = first; node != nullptr;
         node = zxnode::next_alternative(node)) {
      zxStep& step = steps[step_of(node)];
      make_branch(step, node);
      const Outlook look = look_from(zxnode::operand(node), step);
      if (count < k_most_compared) ways[count] = {node, look};
      ++count;
    }
    if (count > k_most_compared) return;
    for (const Way* way = ways; way != ways + count; ++way)
      if (is_only_way(way, ways + count))
        steps[step_of(way->node)].look_flags |= k_look_only;
  }

  // True if none of the later alternatives can go on where this one can.
  static bool is_only_way(const Way* way, const Way* ways_end) {
    return std::all_of(way + 1, ways_end, [way](const Way& other) {
      return way->look.excludes(other.look) ||
             are_different(zxnode::operand(way->node),
                           zxnode::operand(other.node));
    });
  }

  // True for literals of which neither begins with the other.
  static bool are_different(Node a, Node b) {
    if (!is_word(a) || !is_word(b)) return false;
    const Node text_a = zxnode::operand(a);
    const Node text_b = zxnode::operand(b);
    return std::memcmp(text_a + 1, text_b + 1, std::min(*text_a, *text_b)) != 0;
  }

  // A literal of several bytes.
  static bool is_word(Node node) {
    return zxnode::is(node, zxNodeKind::exactly) && *zxnode::operand(node) > 1;
  }

  void make_branch(zxStep& step, Node node) {
    const Node other = zxnode::next_alternative(node);
    step.kind = empty_passes.ends_plus(node) ? zxStepKind::check_branch
                                             : zxStepKind::branch;
    if (step.kind == zxStepKind::check_branch) has_empty_passes = true;
    step.next = step_of(arrived(zxnode::operand(node)));
    step.other = other == nullptr ? k_no_step : step_of(other);
    const Node operand = zxnode::operand(node);
    if (is_word(operand)) {
      step.number = *zxnode::operand(operand);
      step.max = place(zxnode::operand(operand) + 1);
    }
  }

  Outlook last_outlook(Node node) const {
    return Outlook(node, Outlook::Purpose::last_try, has_loops);
  }

  // Behind a byte of the set no shorter repetition can go on, if none of its
  // bytes can be what follows: then there is nothing to go back to.
  void make_repeat(zxStep& step, Node node) {
    const ByteSet set = first_set(zxnode::repeated(node));
    const int max = zxnode::maximum(node);
    step.min = static_cast<std::uint16_t>(zxnode::minimum(node));
    step.max = static_cast<std::uint16_t>(max);
    step.takes_all = set == k_all_bytes ? 1 : 0;
    use_set(set, step.table, step.mask);
    const Outlook look = look_from(zxnode::next(node), step);
    const bool is_only_way = look.is_known && !set.meets(look.bytes);
    if (is_only_way) step.look_flags |= k_look_only;
    if (is_only_way && (step.look_flags & k_look_open) == 0)
      step.kind = zxStepKind::repeat;
    else
      step.kind =
          is_lazy(node) ? zxStepKind::repeat_lazy : zxStepKind::repeat_greedy;
  }

  static bool is_lazy(Node node) {
    return zxnode::is(node, zxNodeKind::starmin) ||
           zxnode::is(node, zxNodeKind::plusmin) ||
           zxnode::is(node, zxNodeKind::curlymin);
  }

  // Fills in what a choice can go on with.  Where that tells nothing because
  // of counts, the set is that of a last try.
  Outlook look_from(Node node, zxStep& step) {
    Outlook look(node, Outlook::Purpose::choice, has_loops);
    step.look_flags = look.flags();
    if (!look.is_known) look = last_outlook(node);
    step.look_flags |= look.flags();
    if (look.is_known) use_set(look.bytes, step.look_table, step.look_mask);
    return look;
  }

  // ---- sequences
  //
  // Nodes that take one byte each, or a few, and groups that open and close
  // between them become one step, which tests all the bytes and then marks the
  // groups.  Where a run comes to the middle of it, the steps of the nodes
  // still stand.  A group that is opened again and again shows by its count
  // that it was opened in vain, so with loops none opens in a sequence.
  struct Sequence {
    int bytes = 0;
    std::int32_t first_test = 0;
    std::int32_t first_mark = 0;
    int nodes = 0;
    Node last = nullptr;
  };

  // Makes the longest sequence that begins with the node the node's step; the
  // last node of it.
  Node make_sequence(Node node) {
    Sequence sequence;
    sequence.first_test = tests.length();
    sequence.first_mark = marks.length();
    sequence.last = node;
    for (Node next = node; add_to(sequence, next);
         next = arrived(zxnode::next(next)))
      sequence.last = next;
    if (sequence.nodes < 2) {
      while (tests.length() > sequence.first_test) tests.drop_last();
      while (marks.length() > sequence.first_mark) marks.drop_last();
      return node;
    }
    zxStep& step = steps[step_of(node)];
    step = zxStep{};
    step.kind = zxStepKind::sequence;
    step.number = static_cast<std::uint8_t>(sequence.bytes);
    step.place = static_cast<std::uint16_t>(sequence.first_test);
    step.table =
        static_cast<std::uint16_t>(marks.length() - sequence.first_mark);
    step.look_table = static_cast<std::uint16_t>(sequence.first_mark);
    step.next = step_behind(sequence.last);
    return sequence.last;
  }

  // Adds the node, if it is one for sequences and there is room.
  bool add_to(Sequence& sequence, Node node) {
    if (!add_step(sequence, steps[step_of(node)])) return false;
    ++sequence.nodes;
    return true;
  }

  bool add_step(Sequence& sequence, const zxStep& step) {
    switch (step.kind) {
      case zxStepKind::byte:
        return add_tests(sequence, {step.number, 0, 0}, 1);
      case zxStepKind::set:
        return add_tests(sequence, {step.table, step.mask, 0}, 1);
      case zxStepKind::any:
        return add_tests(sequence, test_of(k_all_bytes), 1);
      case zxStepKind::literal:
        return add_word(sequence, step);
      case zxStepKind::repeat:
      case zxStepKind::repeat_greedy:
      case zxStepKind::repeat_lazy:
        return step.min == step.max &&
               add_tests(sequence, {step.table, step.mask, 0}, step.min);
      case zxStepKind::open:
        return !has_loops && add_mark(sequence, step.number, false);
      case zxStepKind::close:
        return add_mark(sequence, step.number, true);
      default:
        return false;
    }
  }

  static bool has_room(const Sequence& sequence, int bytes) {
    constexpr int k_most_bytes = 255;
    constexpr int k_most_of_node = 8;
    return bytes <= k_most_of_node && sequence.bytes + bytes <= k_most_bytes;
  }

  bool add_tests(Sequence& sequence, const zxByteTest& test, int count) {
    if (!has_room(sequence, count)) return false;
    for (int i = 0; i < count; ++i) tests.append(test);
    sequence.bytes += count;
    return true;
  }

  bool add_word(Sequence& sequence, const zxStep& step) {
    if (!has_room(sequence, step.number)) return false;
    for (int i = 0; i < step.number; ++i)
      add_tests(sequence, {regex.program()[step.place + i], 0, 0}, 1);
    return true;
  }

  // There are no more marks than groups open and close.
  bool add_mark(const Sequence& sequence, std::uint8_t group, bool closes) {
    marks.append({group, static_cast<std::uint8_t>(sequence.bytes),
                  static_cast<std::uint8_t>(closes ? 1 : 0), 0});
    return true;
  }

  zxByteTest test_of(const ByteSet& set) {
    zxByteTest test{};
    use_set(set, test.table, test.mask);
    return test;
  }

  // ---- sets
  std::uint16_t set_number(const ByteSet& set) {
    std::int32_t i = 0;
    while (i < sets.length() && !(sets.get(i) == set)) ++i;
    if (i == sets.length()) sets.append(set);
    return static_cast<std::uint16_t>(i);
  }

  void use_set(const ByteSet& set, std::uint16_t& table, std::uint8_t& mask) {
    const unsigned number = set_number(set);
    table = static_cast<std::uint16_t>(number / 8);
    mask = static_cast<std::uint8_t>(1U << (number % 8));
  }

  // ---- the whole
  void finish() {
    plan.first = step_of(arrived(begin()));
    const Outlook start(begin(), Outlook::Purpose::start, has_loops);
    plan.start_flags = start.flags();
    plan.start_set = set_number(start.bytes);
    plan.set_count = static_cast<std::uint16_t>(sets.length());
    plan.test_count = static_cast<std::uint16_t>(tests.length());
    plan.mark_count = static_cast<std::uint16_t>(marks.length());
    // Whether a pass is empty is seen by the choice that is left behind.
    if ((regex.reganch != 0 || start.is_free) && !has_empty_passes)
      plan.choice_bits |= k_plan_fresh_tries;
    if (!has_references && !has_empty_passes)
      plan.choice_bits |= k_plan_remembers;
    if (!has_references) plan.choice_bits |= bits_of_first_repeat();
  }

  const zxStep* first_after_opening() const {
    const zxStep* step = steps + plan.first;
    while (step->kind == zxStepKind::open ||
           step->kind == zxStepKind::open_plain ||
           (step->kind == zxStepKind::sequence && step->number == 0))
      step = steps + step->next;
    return step;
  }

  // What the first step says about tries from later starts, if it is a
  // repetition without an upper limit.
  std::uint8_t bits_of_first_repeat() const {
    const zxStep* step = first_after_opening();
    if (step->kind < zxStepKind::repeat || step->max != k_no_limit ||
        step->min > 1)
      return 0;
    if (step->takes_all != 0) return k_plan_one_try;
    return step->kind == zxStepKind::repeat ? k_plan_skips_run : 0;
  }

  const zxRegex& regex;
  zxRegexPlan& plan;
  zxStep* const steps;
  EmptyPasses empty_passes;
  zxQVA<ByteSet> sets;
  zxQVA<zxByteTest> tests;
  zxQVA<zxGroupMark> marks;
  bool has_loops = false;
  bool has_references = false;
  bool has_empty_passes = false;

  static std::uint16_t step_at[32768];

  // Alternatives of more than so many are not compared with one another.
  static constexpr int k_most_compared = 64;
  static Way ways[k_most_compared];
};

std::uint16_t Planner::step_at[32768];
constinit Planner::Way Planner::ways[k_most_compared];

// ----------------------------------------------------------------- block --

constexpr std::size_t rounded_up(std::size_t size) {
  return (size + zxRegex::k_plan_unit - 1) / zxRegex::k_plan_unit *
         zxRegex::k_plan_unit;
}

// Resizes the block; what points into the program moves along.  Null, and the
// block is gone, if the failure was dropped.
zxRegex* resize(zxRegex* regex, std::size_t size) {
  const bool has_must = regex->regmust != nullptr;
  const std::ptrdiff_t must =
      has_must ? regex->regmust - reinterpret_cast<const char*>(regex) : 0;
  auto* moved = static_cast<zxRegex*>(zx_realloc(regex, size));
  if (moved == nullptr)
    zx_realloc(regex, 0);
  else if (has_must)
    moved->regmust = reinterpret_cast<const char*>(moved) + must;
  return moved;
}

template <class T>
void copy_all(const zxQVA<T>& from, const T* to) {
  if (from.length() > 0)
    std::memcpy(const_cast<T*>(to), from.begin(),
                zx_size(from.length()) * sizeof(T));
}

void write_sets(zxRegexPlan& plan, const zxQVA<ByteSet>& sets) {
  auto* ranges = const_cast<zxByteRanges*>(plan.sets());
  auto* tables = const_cast<std::uint8_t*>(plan.tables());
  std::memset(tables, 0, zx_size(sets.length() + 7) / 8 * 256);
  for (std::int32_t i = 0; i < sets.length(); ++i) {
    std::uint8_t* table = tables + i / 8 * 256;
    ranges[i] = ranges_of(sets.get(i));
    fill_table(table, sets.get(i), ranges[i],
               static_cast<std::uint8_t>(1U << (i % 8)));
  }
}

}  // namespace

zxRegex* regex_plan(zxRegex* regex, int node_count) {
  const std::size_t plan_place =
      rounded_up(zxRegex::k_program_place + regex->size);
  const std::size_t steps_end =
      plan_place + sizeof(zxRegexPlan) + zx_size(node_count) * sizeof(zxStep);
  regex = resize(regex, steps_end);
  if (regex == nullptr) return nullptr;
  regex->plan_place =
      static_cast<std::uint16_t>(plan_place / zxRegex::k_plan_unit);
  auto* plan = const_cast<zxRegexPlan*>(regex->plan());
  *plan = zxRegexPlan{};
  Planner planner(*regex, *plan, const_cast<zxStep*>(plan->steps()));
  if (!planner.make()) {
    zx_realloc(regex, 0);
    return nullptr;
  }
  const std::size_t sets_end = sizeof(zxRegexPlan) +
                               plan->step_count * sizeof(zxStep) +
                               plan->set_count * sizeof(zxByteRanges) +
                               plan->test_count * sizeof(zxByteTest) +
                               plan->mark_count * sizeof(zxGroupMark);
  plan->tables_place = static_cast<std::uint32_t>(sets_end);
  const std::size_t size =
      plan_place + sets_end + (plan->set_count + 7U) / 8 * 256;
  regex = resize(regex, size);
  if (regex == nullptr) return nullptr;
  plan = const_cast<zxRegexPlan*>(regex->plan());
  copy_all(planner.all_tests(), plan->tests());
  copy_all(planner.all_marks(), plan->marks());
  write_sets(*plan, planner.all_sets());
  return regex;
}
