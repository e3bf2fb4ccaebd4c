// Looking at programs: the dumper, the checker.

#include <algorithm>

#include "zxqva.h"
#include "zxregexc_impl.h"

using zxnode::Node;

namespace {

// ---------------------------------------------------------------- dumper --

void add_number(zxStr& out, int number) {
  if (number < 0) out.append('-');
  const unsigned value = static_cast<unsigned>(number < 0 ? -number : number);
  char digits[12];
  char* at = digits + sizeof digits;
  unsigned rest = value;
  do *--at = static_cast<char>('0' + rest % 10);
  while ((rest /= 10) != 0);
  out.append(at,
             zx_count(static_cast<std::size_t>(digits + sizeof digits - at)));
}

// A byte as itself, or as ` and three octal digits if it is not printable or
// one of `special`.
void add_byte(zxStr& out, unsigned byte, std::string_view special) {
  const auto c = static_cast<char>(byte);
  if (byte >= ' ' && byte <= '~' && special.find(c) == special.npos) {
    out.append(c);
    return;
  }
  out.append('`');
  for (int shift = 6; shift >= 0; shift -= 3)
    out.append(static_cast<char>('0' + ((byte >> shift) & 7)));
}

void add_quoted(zxStr& out, const std::uint8_t* bytes, std::size_t length) {
  out.append('"');
  for (std::size_t i = 0; i < length; ++i) add_byte(out, bytes[i], "\"`");
  out.append('"');
}

// The members of a class; three and more that follow one another as a range.
void add_members(zxStr& out, const std::uint8_t* bitmap) {
  constexpr std::string_view k_special = "]-^\"`";
  const auto is_member = [bitmap](unsigned c) {
    return c < 256 && (bitmap[c / 8] >> (c % 8) & 1) == 0;
  };
  out.append('[');
  for (unsigned c = 0; c < 256; ++c) {
    if (!is_member(c)) continue;
    unsigned last = c;
    while (is_member(last + 1)) ++last;
    add_byte(out, c, k_special);
    if (last >= c + 2) {
      out.append('-');
      add_byte(out, last, k_special);
      c = last;
    }
  }
  out.append(']');
}

void add_spaced(zxStr& out, int number) {
  out.append(' ');
  add_number(out, number);
}

void add_field(zxStr& out, const std::uint8_t* operand) {
  add_spaced(out, operand[0]);
  add_spaced(out, static_cast<std::int8_t>(operand[1]));
  add_spaced(out, static_cast<std::int8_t>(operand[2]));
  add_spaced(out, operand[3]);
  out.append(' ');
  out.append(static_cast<char>(operand[4]));
}

void add_operands(zxStr& out, Node node) {
  const std::uint8_t* operand = zxnode::operand(node);
  if (zxnode::is_open(node) || zxnode::is_close(node))
    add_spaced(out, zxnode::group_of(node));
  switch (zxnode::info(node).operand) {
    case zxOperand::bitmap:
      out.append(' ');
      add_members(out, operand);
      break;
    case zxOperand::literal:
      out.append(' ');
      add_quoted(out, operand + 1, *operand);
      break;
    case zxOperand::group:
      add_spaced(out, static_cast<int>(zxnode::big16(operand)));
      break;
    case zxOperand::counts:
      add_spaced(out, zxnode::minimum(node));
      add_spaced(out, zxnode::maximum(node));
      break;
    case zxOperand::field:
      add_field(out, operand);
      break;
    case zxOperand::none:
    case zxOperand::branch:
    case zxOperand::simple:
      break;
  }
}

void add_header(zxStr& out, const zxRegex& regex) {
  out.append("regstart");
  add_spaced(out, regex.regstart);
  out.append(" reganch");
  add_spaced(out, regex.reganch);
  out.append(" regmust ");
  add_quoted(out, reinterpret_cast<const std::uint8_t*>(regex.regmust),
             regex.regmlen);
  out.append('\n');
}

void add_node(zxStr& out, const zxRegex& regex, Node node) {
  const Node program = regex.program();
  add_number(out, static_cast<int>(node - program));
  out.append(' ');
  out.append(zxnode::info(node).name);
  add_operands(out, node);
  if (const Node next = zxnode::next(node); next != nullptr) {
    out.append(" -> ");
    add_number(out, static_cast<int>(next - program));
  }
  out.append('\n');
}

// --------------------------------------------------------------- checker --

// Walks the nodes in the order of their places, each of which it marks.
class Checker {
 public:
  explicit Checker(const zxRegex& regex)
      : program(regex.program()), size(static_cast<std::int64_t>(regex.size)) {}

  bool is_sound() {
    if (size < 2 || program[0] != k_regex_magic || !mark_nodes()) return false;
    for (std::int64_t place = 1; place < size; ++place)
      if (marks[place] != k_inside && !is_linked_well(place)) return false;
    return true;
  }

  ~Checker() { zx_realloc(marks, 0); }
  Checker(const Checker&) = delete;
  Checker& operator=(const Checker&) = delete;

 private:
  static constexpr char k_inside = 0;    // no node begins here
  static constexpr char k_node = 1;      // a node
  static constexpr char k_repeated = 2;  // the one that is repeated

  bool mark_nodes() {
    marks =
        static_cast<char*>(zx_realloc(nullptr, static_cast<std::size_t>(size)));
    if (marks == nullptr) return false;
    std::fill(marks, marks + size, k_inside);
    char kind = k_node;
    std::int64_t place = 1;
    while (place < size) {
      const std::int64_t length = length_at(place);
      if (length == 0 || length > size - place) return false;
      marks[place] = kind;
      if (kind == k_repeated && !is_simple(place)) return false;
      kind = zxnode::is_repeat(program + place) ? k_repeated : k_node;
      place += length;
    }
    return kind == k_node;
  }

  // The node's size; 0 for a node that does not exist or is cut off.
  std::int64_t length_at(std::int64_t place) const {
    const Node node = program + place;
    if (zxnode::info(node).name == nullptr || size - place < k_node_head)
      return 0;
    const bool is_literal = zxnode::is(node, zxNodeKind::exactly);
    if (is_literal && size - place <= k_node_head) return 0;
    const int length = zxnode::size_of(node);
    return length <= size - place && has_sound_operand(node) ? length : 0;
  }

  static bool has_sound_operand(Node node) {
    const Node operand = zxnode::operand(node);
    switch (zxnode::info(node).operand) {
      case zxOperand::literal:
        return *operand >= 1 && *operand <= k_max_literal &&
               operand[1 + *operand] == '\0';
      case zxOperand::group:
        return zxnode::big16(operand) >= 1 && zxnode::big16(operand) <= 9;
      case zxOperand::counts:
        return zxnode::minimum(node) <= zxnode::maximum(node) &&
               zxnode::maximum(node) <= k_regex_max_count;
      case zxOperand::field:
        return operand[0] < k_regex_fields &&
               std::string_view("dxfvstC").find(
                   static_cast<char>(operand[4])) != std::string_view::npos;
      default:
        return true;
    }
  }

  bool is_simple(std::int64_t place) const {
    const Node node = program + place;
    return zxnode::takes_bytes(node) &&
           (!zxnode::is(node, zxNodeKind::exactly) ||
            *zxnode::operand(node) == 1);
  }

  // Only the last node has no link, and what is repeated has none of its own;
  // BACK leads backward, all others lead forward.
  bool is_linked_well(std::int64_t place) const {
    const Node node = program + place;
    const Node next = zxnode::next(node);
    const bool ends = zxnode::is(node, zxNodeKind::end);
    if (marks[place] == k_repeated) return next == nullptr;
    if (ends || next == nullptr)
      return ends && next == nullptr && place + k_node_head == size;
    const std::int64_t target = next - program;
    return target >= 1 && target < size && marks[target] == k_node;
  }

  const Node program;
  const std::int64_t size;
  char* marks = nullptr;
};

}  // namespace

zxStr regex_dump(const zxRegex& regex) {
  zxStr out;
  add_header(out, regex);
  const Node end = regex.program() + regex.size;
  for (Node node = regex.program() + 1; node < end;
       node += zxnode::size_of(node))
    add_node(out, regex, node);
  return out;
}

bool regex_is_sound(const zxRegex& regex) { return Checker(regex).is_sound(); }
