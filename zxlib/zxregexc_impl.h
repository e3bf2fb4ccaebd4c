// zxregexc_impl.h - what the compiler and the matcher share: the node list
// and the plan.  Not installed.
#ifndef ZXREGEXC_IMPL_H
#define ZXREGEXC_IMPL_H

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>

#include "zxregexc.h"

// ----------------------------------------------------------------- nodes --

// What stands behind the opcode and the link of a node.
enum class zxOperand : std::uint8_t {
  none,
  bitmap,   // 32 bytes: bit c % 8 of byte c / 8 is clear for the members c
  branch,   // the chain of nodes that is one alternative
  literal,  // length, as many bytes, a NUL
  group,    // the number of a group, two bytes, highest first
  simple,   // the one node that is repeated
  counts,   // minimum, maximum, two bytes each; then as `simple`
  field,    // index, width, precision, flags, type letter
};

// The one list of nodes, from which all that is known of them derives:
//   X(name, opcode, text, operand, class bits)
// A node with class bits matches a byte that has one of them; the node behind
// it in the list, of the next, odd opcode, any other byte.  OPEN and CLOSE
// stand for nine opcodes each: that of group n is n - 1 more.
#define ZX_REGEX_NODES(X)                           \
  X(end, 0, "END", none, 0)                         \
  X(bol, 1, "BOL", none, 0)                         \
  X(eol, 2, "EOL", none, 0)                         \
  X(any, 3, "ANY", none, 0)                         \
  X(anyof, 4, "ANYOF", bitmap, 0)                   \
  X(branch, 6, "BRANCH", branch, 0)                 \
  X(back, 7, "BACK", none, 0)                       \
  X(exactly, 8, "EXACTLY", literal, 0)              \
  X(nothing, 9, "NOTHING", none, 0)                 \
  X(hebdos, 10, "HEBDOS", none, k_class_hebdos)     \
  X(nhebdos, 11, "NHEBDOS", none, k_class_hebdos)   \
  X(hebansi, 12, "HEBANSI", none, k_class_hebrew)   \
  X(nhebansi, 13, "NHEBANSI", none, k_class_hebrew) \
  X(word, 14, "WORD", none, k_regex_word_class)     \
  X(nword, 15, "NWORD", none, k_regex_word_class)   \
  X(space, 16, "SPACE", none, k_class_space)        \
  X(nspace, 17, "NSPACE", none, k_class_space)      \
  X(digit, 18, "DIGIT", none, k_class_digit)        \
  X(ndigit, 19, "NDIGIT", none, k_class_digit)      \
  X(wordb, 20, "WORDB", none, 0)                    \
  X(nwordb, 21, "NWORDB", none, 0)                  \
  X(open0, 30, "OPEN0", none, 0)                    \
  X(open, 31, "OPEN", none, 0)                      \
  X(close0, 40, "CLOSE0", none, 0)                  \
  X(close, 41, "CLOSE", none, 0)                    \
  X(backref, 50, "BACKREF", group, 0)               \
  X(curly, 51, "CURLY", counts, 0)                  \
  X(star, 52, "STAR", simple, 0)                    \
  X(plus, 53, "PLUS", simple, 0)                    \
  X(field, 54, "FIELD", field, 0)                   \
  X(starmin, 55, "STARMIN", simple, 0)              \
  X(plusmin, 56, "PLUSMIN", simple, 0)              \
  X(curlymin, 57, "CURLYMIN", counts, 0)

// `w: digits and ASCII letters.  Word boundaries take the letters of code
// page 862 for word bytes as well.
inline constexpr unsigned k_regex_word_class = k_class_digit | k_class_latin;
inline constexpr unsigned k_regex_edge_class =
    k_regex_word_class | k_class_hebdos;

enum class zxNodeKind : std::uint8_t {
#define ZX_NODE_NAME(name, opcode, text, operand, bits) name = opcode,
  ZX_REGEX_NODES(ZX_NODE_NAME)
#undef ZX_NODE_NAME
};

struct zxNodeInfo {
  const char* name;  // null: there is no such opcode
  zxOperand operand;
  unsigned class_bits;
};

namespace zxregexc_detail {
consteval std::array<zxNodeInfo, 256> make_node_infos() {
  std::array<zxNodeInfo, 256> infos{};
#define ZX_NODE_ROW(name, opcode, text, operand, bits) \
  infos[opcode] = {text, zxOperand::operand, bits};
  ZX_REGEX_NODES(ZX_NODE_ROW)
#undef ZX_NODE_ROW
  for (int n = 1; n < k_regex_groups; ++n) {
    infos[static_cast<std::size_t>(31 + n)] = infos[31];
    infos[static_cast<std::size_t>(41 + n)] = infos[41];
  }
  return infos;
}
}  // namespace zxregexc_detail

inline constexpr std::array<zxNodeInfo, 256> k_node_infos =
    zxregexc_detail::make_node_infos();

// Sizes and places inside a node.
inline constexpr int k_node_head = 3;  // opcode and link
inline constexpr int k_bitmap_bytes = 32;
inline constexpr int k_counts_bytes = 4;
inline constexpr int k_field_bytes = 5;
inline constexpr int k_max_literal = 127;
inline constexpr int k_max_field_width = 127;

namespace zxregexc_detail {
constexpr int operand_size(zxOperand operand) {
  switch (operand) {
    case zxOperand::bitmap:
      return k_bitmap_bytes;
    case zxOperand::literal:
      return 2;  // and the bytes
    case zxOperand::group:
      return 2;
    case zxOperand::counts:
      return k_counts_bytes;
    case zxOperand::field:
      return k_field_bytes;
    default:
      return 0;
  }
}
consteval std::array<std::uint8_t, 256> make_node_sizes() {
  std::array<std::uint8_t, 256> sizes{};
  for (std::size_t i = 0; i < sizes.size(); ++i)
    sizes[i] = static_cast<std::uint8_t>(k_node_head +
                                         operand_size(k_node_infos[i].operand));
  return sizes;
}
}  // namespace zxregexc_detail

// The sizes of nodes by opcode, those of EXACTLY without its bytes.
inline constexpr std::array<std::uint8_t, 256> k_node_sizes =
    zxregexc_detail::make_node_sizes();

// The flags of fields, as they stand in the node.
inline constexpr unsigned k_field_zero = 1;     // no blanks ahead
inline constexpr unsigned k_field_star = 2;     // no meaning
inline constexpr unsigned k_field_blank = 4;    // may be empty or blank
inline constexpr unsigned k_field_plus = 16;    // a sign is required
inline constexpr unsigned k_field_minus = 32;   // no meaning
inline constexpr unsigned k_field_equals = 64;  // a sign is forbidden
inline constexpr int k_field_not_given = -1;

// The control byte that a letter stands for behind an escape, or the letter.
constexpr char zx_control_byte(char letter) {
  switch (letter) {
    case 'f':
      return '\f';
    case 'n':
      return '\n';
    case 'r':
      return '\r';
    case 't':
      return '\t';
    default:
      return letter;
  }
}

// Reading nodes of a program that regcomp() made.  A node is known by its
// address.
namespace zxnode {
using Node = const std::uint8_t*;

inline unsigned big16(Node at) { return (unsigned{at[0]} << 8) | at[1]; }
inline const zxNodeInfo& info(Node node) { return k_node_infos[*node]; }
inline bool is(Node node, zxNodeKind kind) {
  return *node == static_cast<std::uint8_t>(kind);
}
inline bool is_open(Node node) { return *node >= 31 && *node <= 39; }
inline bool is_close(Node node) { return *node >= 41 && *node <= 49; }
inline int group_of(Node node) {
  return is_open(node) ? *node - 30 : *node - 40;
}
inline bool is_repeat(Node node) {
  return info(node).operand == zxOperand::simple ||
         info(node).operand == zxOperand::counts;
}
inline Node operand(Node node) { return node + k_node_head; }

// The node that the link leads to; null for none.
inline Node next(Node node) {
  const unsigned distance = big16(node + 1);
  if (distance == 0) return nullptr;
  return is(node, zxNodeKind::back) ? node - distance : node + distance;
}

// The next alternative behind a BRANCH; null behind the last.
inline Node next_alternative(Node branch) {
  const Node other = next(branch);
  return other != nullptr && is(other, zxNodeKind::branch) ? other : nullptr;
}

// The bytes of a node's own, without the nodes that are its operand.
inline int size_of(Node node) {
  const int size = k_node_sizes[*node];
  return is(node, zxNodeKind::exactly) ? size + *operand(node) : size;
}

// True for the nodes that take exactly one byte of a set, or a literal.
inline bool takes_bytes(Node node) {
  return is(node, zxNodeKind::any) || is(node, zxNodeKind::anyof) ||
         is(node, zxNodeKind::exactly) || info(node).class_bits != 0;
}

// The simple node that a repetition repeats, and its limits;
// k_no_maximum stands for none.
inline constexpr int k_no_maximum = 0xFFFF;
inline Node repeated(Node node) { return node + size_of(node); }
// The node behind this one in the program, which what is repeated is not.
inline Node following(Node node) {
  if (is_repeat(node)) node = repeated(node);
  return node + size_of(node);
}

inline int minimum(Node node) {
  if (info(node).operand == zxOperand::counts)
    return static_cast<int>(big16(operand(node)));
  return is(node, zxNodeKind::plus) || is(node, zxNodeKind::plusmin) ? 1 : 0;
}
inline int maximum(Node node) {
  return info(node).operand == zxOperand::counts
             ? static_cast<int>(big16(operand(node) + 2))
             : k_no_maximum;
}
}  // namespace zxnode

// ------------------------------------------------------------------ plan --

// The plan is what a run works by: the nodes with their operands decoded and
// their links followed, so that nodes that do nothing are gone, and for each
// choice the bytes that can stand where it goes on.
//
// All places in it are relative, so that a block may be moved as it is.
//
//   | zxRegexPlan | steps | sets | tests | marks | tables of 256 bytes |
//
// Set s holds byte c if table s / 8 has bit s % 8 in byte c.

enum class zxStepKind : std::uint8_t {
  succeed,
  sequence,  // number: how many bytes, place: of the first of their tests;
             // table: how many marks, look_table: the first of them
  byte,      // number: the byte
  literal,   // number: its length, place: of its bytes
  set,       // table, mask
  any,
  at_start,
  at_end,
  word_edge,
  no_word_edge,
  open_plain,      // the current group becomes 0
  open,            // number: the group
  close,           // number: the group
  branch,          // next: the alternative; other: the next one; look: of it;
                   // number: the length of the word that it begins with, max:
                   // the place of that
  check_pass,      // ends a pass that may be empty; other: its loop's exit
  check_branch,    // the same, then as branch
  back_reference,  // number: the group
  field,           // place: of the node
  repeat,          // table, mask, min, max: as often as possible, for good
  repeat_greedy,   // ... look: what can follow
  repeat_lazy,
};

inline constexpr std::uint16_t k_no_step = 0xFFFF;
inline constexpr std::uint16_t k_no_limit = zxnode::k_no_maximum;

// Where a choice goes on, the byte there must be in `look`, or be the end if
// this is k_look_end; k_look_open: it may be anything.
// With k_look_only, no later alternative can go on where this one can.
enum zxLook : std::uint8_t {
  k_look_end = 1,
  k_look_open = 2,
  k_look_only = 4,
};

struct zxStep {
  zxStepKind kind;
  std::uint8_t number;      // see the kinds
  std::uint8_t mask;        // of the set in its table
  std::uint8_t takes_all;   // 1: the set holds every byte
  std::uint8_t look_flags;  // of choices
  std::uint8_t look_mask;   // of the look set in its table
  std::uint16_t next;       // step
  union {
    std::uint16_t other;  // step
    std::uint16_t min;    // of repetitions
    std::uint16_t place;  // in the program
  };
  std::uint16_t max;  // k_no_limit: none
  std::uint16_t table;
  std::uint16_t look_table;
};
static_assert(sizeof(zxStep) == 16);

// The test of one byte in a sequence: whether it is in a set, or, with a mask
// of 0, whether it is `table`.
struct zxByteTest {
  std::uint16_t table;
  std::uint8_t mask;
  std::uint8_t unused;
};

// Where in a sequence a group opens or closes.
struct zxGroupMark {
  std::uint8_t group;
  std::uint8_t offset;  // from the sequence's begin
  std::uint8_t closes;  // 1: it closes
  std::uint8_t unused;
};

// A set as up to three ranges of bytes, or the lack of such.
struct zxByteRanges {
  static constexpr int k_most = 3;
  std::uint8_t count;       // 0xFF: more than three, go by the table
  std::uint8_t complement;  // 1: the ranges are those of the other bytes
  std::uint8_t low[k_most];
  std::uint8_t span[k_most];  // the last byte less the first
};
static_assert(sizeof(zxByteRanges) == 8);
inline constexpr std::uint8_t k_many_ranges = 0xFF;

// The number of the set that a step names by its table and its bit.
inline unsigned zx_set_number(unsigned table, unsigned mask) {
  return table * 8 + static_cast<unsigned>(std::countr_zero(mask));
}

struct zxRegexPlan {
  std::uint16_t first;  // step that a run begins with
  std::uint16_t step_count;
  std::uint16_t start_set;  // of bytes that a match can begin with
  std::uint16_t set_count;
  std::uint8_t start_flags;  // as look_flags
  std::uint8_t groups;       // the highest group
  std::uint8_t fields;
  std::uint8_t choice_bits;    // see below
  std::uint32_t tables_place;  // from the plan's begin
  std::uint16_t test_count;
  std::uint16_t mark_count;
  std::uint32_t unused;

  const zxStep* steps() const {
    return reinterpret_cast<const zxStep*>(this + 1);
  }
  const zxByteRanges* sets() const {
    return reinterpret_cast<const zxByteRanges*>(steps() + step_count);
  }
  const zxByteTest* tests() const {
    return reinterpret_cast<const zxByteTest*>(sets() + set_count);
  }
  const zxGroupMark* marks() const {
    return reinterpret_cast<const zxGroupMark*>(tests() + test_count);
  }
  const std::uint8_t* tables() const {
    return reinterpret_cast<const std::uint8_t*>(this) + tables_place;
  }
};
static_assert(sizeof(zxRegexPlan) == 24);

// Bits of choice_bits.
// What failed at a place fails there whatever happened before, so failures
// can be remembered.
inline constexpr std::uint8_t k_plan_remembers = 1;
// A try that fails fails at all later starts as well.
inline constexpr std::uint8_t k_plan_one_try = 2;
// Begins with a repetition without minimum above 1 that is never gone back
// into: a try that fails fails at all starts within that run of bytes.
inline constexpr std::uint8_t k_plan_skips_run = 4;

// A try that has failed leaves no count that a later one could read.
inline constexpr std::uint8_t k_plan_fresh_tries = 8;

// Makes the plan of a program and puts it behind it; returns the block, which
// may have moved.  An opcode that does not exist fails an assertion; null, and
// the block is gone, if that was dropped.
zxRegex* regex_plan(zxRegex* regex, int node_count);

#endif  // ZXREGEXC_IMPL_H
