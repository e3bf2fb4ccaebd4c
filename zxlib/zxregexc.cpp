// The parser, which emits as it goes.  From the bottom up: the state, emitting,
// atoms, quantifiers, groups, the two passes.
//
// The parser runs twice over a pattern.  The first pass emits nothing but
// counts, so that the sizes are known; the second writes the nodes.  Open
// groups stand on a stack of our own: they nest without limit.

#include "zxregexc.h"

#include <algorithm>
#include <cstring>

#include "zxqva.h"
#include "zxregexc_impl.h"

namespace {

// A program is smaller than this: links are offsets of 16 bits, and places
// are compared as signed ones.
constexpr std::int64_t k_size_limit = 32767;

// The next group must have a number below this one, for either kind of group.
constexpr int k_group_limit = 12;

// The bytes that end a run of literal bytes.
constexpr bool is_meta(char byte) {
  constexpr std::string_view k_meta = "^$.[()|?+*\\`{}%";
  return k_meta.find(byte) != std::string_view::npos;
}
constexpr auto k_is_meta = [] {
  std::array<bool, 256> table{};
  for (std::size_t i = 0; i < table.size(); ++i)
    table[i] = is_meta(static_cast<char>(i));
  return table;
}();

// What a piece, an alternative or a group says about itself.
constexpr unsigned k_haswidth = 1;  // HASWIDTH: it can't match empty
constexpr unsigned k_simple = 2;    // SIMPLE: it takes exactly one byte
constexpr unsigned k_spstart = 4;   // SPSTART: it can begin with *, + or ?

// An atom, or what became of it behind its quantifier.
struct Piece {
  int place;  // of its first node; meaningless while counting
  unsigned flags;
};

enum class GroupKind : std::uint8_t { top, capturing, plain };

// A group that is not closed yet.
struct Group {
  GroupKind kind;
  std::uint8_t number;
  std::uint8_t flags;         // of the alternatives so far
  std::uint8_t branch_flags;  // of the present alternative so far
  int open;                   // its first node
  int branch;                 // the present alternative
  int chain;                  // the last piece in it; -1: none yet
};

// A counted quantifier as it is written.
struct Count {
  bool is_valid;  // it has the form of one
  int min;
  int max;
  const char* end;
};

// --------------------------------------------------------- the parser's state

struct Parser {
  const char* at;
  const char* end;
  std::uint8_t* program;  // null while counting
  std::int64_t size;      // of what has been emitted
  std::int64_t node_count;
  int group_count;  // the number of the next group
  int field_count;
  std::int64_t loose_braces;  // "{" taken as text, each of which excuses a "}"
  unsigned flags;             // of the whole pattern, at the end

  bool is_counting() const { return program == nullptr; }
  bool has_more() const { return at < end; }
  bool sees(char byte) const { return at < end && *at == byte; }
  bool sees_two(char byte) const {
    return end - at >= 2 && at[0] == byte && at[1] == byte;
  }
};

Parser parser;

void start_pass(const char* pattern, const char* end, std::uint8_t* program) {
  parser = Parser{pattern, end, program, 0, 0, 1, 0, 0, 0};
}

// -------------------------------------------------------------- emitting --

void emit(unsigned byte) {
  if (!parser.is_counting())
    parser.program[parser.size] = static_cast<std::uint8_t>(byte);
  ++parser.size;
}

void emit16(int number) {
  emit(static_cast<unsigned>(number) >> 8);
  emit(static_cast<unsigned>(number) & 0xFF);
}

void emit_block(const void* bytes, std::size_t size) {
  if (!parser.is_counting())
    std::memcpy(parser.program + parser.size, bytes, size);
  parser.size += static_cast<std::int64_t>(size);
}

constexpr unsigned opcode(zxNodeKind kind) {
  return static_cast<unsigned>(kind);
}

// Emits the head of a node and returns its place.
int emit_node(unsigned code) {
  const auto place = static_cast<int>(parser.size);
  emit(code);
  emit16(0);
  ++parser.node_count;
  return place;
}
int emit_node(zxNodeKind kind) { return emit_node(opcode(kind)); }

// Puts a node of `size` bytes ahead of the last atom, which moves behind it.
// Links inside the atom stay right: they are relative.
void insert_node(zxNodeKind kind, int place, int size = k_node_head) {
  parser.size += size;
  ++parser.node_count;
  if (parser.is_counting()) return;
  std::uint8_t* node = parser.program + place;
  std::memmove(node + size, node,
               static_cast<std::size_t>(parser.size - size - place));
  std::memset(node, 0, static_cast<std::size_t>(size));
  node[0] = static_cast<std::uint8_t>(kind);
}

// Links the last node of the chain that begins at `place` to `target`.
void link_tail(int place, int target) {
  if (parser.is_counting()) return;
  std::uint8_t* node = parser.program + place;
  while (const std::uint8_t* next = zxnode::next(node))
    node = parser.program + (next - parser.program);
  const auto from = static_cast<int>(node - parser.program);
  const auto distance = static_cast<unsigned>(
      zxnode::is(node, zxNodeKind::back) ? from - target : target - from);
  node[1] = static_cast<std::uint8_t>(distance >> 8);
  node[2] = static_cast<std::uint8_t>(distance & 0xFF);
}

// The same for the chain inside the BRANCH at `place`.
void link_operand_tail(int place, int target) {
  link_tail(place + k_node_head, target);
}

// ------------------------------------------------------- atoms: literals --

Piece emit_literal(const char* bytes, std::size_t length) {
  const int place = emit_node(zxNodeKind::exactly);
  emit(static_cast<unsigned>(length));
  emit_block(bytes, length);
  emit('\0');
  return {place, length == 1 ? k_haswidth | k_simple : k_haswidth};
}
Piece emit_literal(char byte) { return emit_literal(&byte, 1); }

// Digits, as a number; those above the limit all come out as one more.
int read_number(const char*& at, const char* end, int limit) {
  int number = 0;
  for (; at < end && zx_is_digit(*at); ++at)
    number = std::min(number * 10 + (*at - '0'), limit + 1);
  return number;
}

// counted: { digits [ , [ digits ] ] }
Count read_count(const char* at, const char* end) {
  constexpr Count k_none = {false, 0, 0, nullptr};
  if (at == end || *at != '{') return k_none;
  const char* digits = ++at;
  const int min = read_number(at, end, k_regex_max_count);
  if (at == digits) return k_none;
  int max = min;
  if (at < end && *at == ',') {
    digits = ++at;
    max = read_number(at, end, k_regex_max_count);
    if (at == digits) max = k_regex_max_count;
  }
  if (at == end || *at != '}') return k_none;
  return {true, min, max, at + 1};
}

bool is_quantifier(const char* at, const char* end) {
  if (at == end) return false;
  return *at == '*' || *at == '+' || *at == '?' || read_count(at, end).is_valid;
}

// A run of bytes without meaning.  Its last byte is left for the next atom
// if a quantifier follows, which is for that byte alone.
Piece parse_run() {
  const char* start = parser.at;
  const char* limit =
      start + std::min<std::ptrdiff_t>(parser.end - start, k_max_literal);
  const char* run = start;
  while (run < limit && !k_is_meta[static_cast<unsigned char>(*run)]) ++run;
  if (run - start >= 2 && is_quantifier(run, parser.end)) --run;
  parser.at = run;
  return emit_literal(start, static_cast<std::size_t>(run - start));
}

// A brace that has no meaning: any "{" that begins no quantifier, and a "}"
// for each of these.
bool parse_brace(Piece& piece) {
  if (*parser.at == '{') {
    if (read_count(parser.at, parser.end).is_valid) return false;
    ++parser.loose_braces;
  } else if (--parser.loose_braces < 0) {
    return false;
  }
  piece = emit_literal(*parser.at++);
  return true;
}

// -------------------------------------------------------- atoms: escapes --

constexpr std::string_view k_class_letters = "hHaAwWsSdD";
constexpr zxNodeKind k_class_nodes[] = {
    zxNodeKind::hebdos,   zxNodeKind::nhebdos, zxNodeKind::hebansi,
    zxNodeKind::nhebansi, zxNodeKind::word,    zxNodeKind::nword,
    zxNodeKind::space,    zxNodeKind::nspace,  zxNodeKind::digit,
    zxNodeKind::ndigit};

// The node of a class letter; `end` if it is none.
zxNodeKind class_node(char letter) {
  const std::size_t i = k_class_letters.find(letter);
  return i == std::string_view::npos ? zxNodeKind::end : k_class_nodes[i];
}

bool sees_three_digits() {
  const char* at = parser.at;
  return parser.end - at >= 3 && zx_is_digit(at[0]) && zx_is_digit(at[1]) &&
         zx_is_digit(at[2]);
}

// Three digits, as the byte of that octal number.
bool read_octal(char& byte) {
  int value = 0;
  for (int i = 0; i < 3; ++i) {
    const int digit = *parser.at++ - '0';
    if (digit > 7) return false;
    value = value * 8 + digit;
  }
  byte = static_cast<char>(value);
  return value < 256;
}

// The byte that the escape stands for, where it is no other thing.
bool read_escaped_byte(char& byte) {
  if (sees_three_digits()) return read_octal(byte);
  const char letter = *parser.at++;
  byte = letter == '0' ? '\0' : zx_control_byte(letter);
  return true;
}

// The byte behind "`" or "\" that are passed already.
bool parse_escape(Piece& piece) {
  if (!parser.has_more()) return false;
  const char letter = *parser.at;
  if (const zxNodeKind kind = class_node(letter); kind != zxNodeKind::end) {
    ++parser.at;
    piece = {emit_node(kind), k_haswidth | k_simple};
  } else if (letter == 'b' || letter == 'B') {
    ++parser.at;
    piece = {emit_node(letter == 'b' ? zxNodeKind::wordb : zxNodeKind::nwordb),
             0};
  } else if (letter >= '1' && letter <= '9' && !sees_three_digits()) {
    ++parser.at;
    piece = {emit_node(zxNodeKind::backref), 0};
    emit16(letter - '0');
  } else {
    char byte;
    if (!read_escaped_byte(byte)) return false;
    piece = emit_literal(byte);
  }
  return true;
}

// -------------------------------------------------------- atoms: classes --

using Bitmap = std::array<std::uint8_t, k_bitmap_bytes>;

void add_range(Bitmap& members, unsigned first, unsigned last) {
  for (unsigned c = first; c <= last; ++c)
    members[c / 8] |= static_cast<std::uint8_t>(1U << (c % 8));
}

void add_class(Bitmap& members, zxNodeKind kind) {
  const unsigned bits = k_node_infos[opcode(kind)].class_bits;
  const bool negated = opcode(kind) % 2 == 1;
  for (unsigned c = 0; c < 256; ++c)
    if (((zxCharClass[c] & bits) != 0) != negated) add_range(members, c, c);
}

// One member of a class: a byte, or a whole class, which is added here.
struct Member {
  bool is_class;
  unsigned char byte;
};

bool read_member(Bitmap& members, Member& member) {
  char byte = *parser.at++;
  member.is_class = false;
  if (byte == '`' || byte == '\\') {
    if (!parser.has_more()) return false;
    const zxNodeKind kind = class_node(*parser.at);
    member.is_class = kind != zxNodeKind::end;
    if (member.is_class) {
      ++parser.at;
      add_class(members, kind);
    } else if (!read_escaped_byte(byte)) {
      return false;
    }
  }
  member.byte = static_cast<unsigned char>(byte);
  return true;
}

// member: byte [ - byte ] | whole class
bool parse_member(Bitmap& members) {
  Member first;
  if (!read_member(members, first)) return false;
  const bool is_range =
      parser.end - parser.at >= 2 && parser.at[0] == '-' && parser.at[1] != ']';
  if (!is_range) {
    if (!first.is_class) add_range(members, first.byte, first.byte);
    return true;
  }
  ++parser.at;
  Member last;
  if (!read_member(members, last)) return false;
  if (first.is_class || last.is_class || last.byte < first.byte) return false;
  add_range(members, first.byte, last.byte);
  return true;
}

// class: [ [ ^ ] member { member } ]
// A "]" that stands first is a member.
bool parse_class(Piece& piece) {
  const bool negated = parser.sees('^');
  if (negated) ++parser.at;
  Bitmap members{};
  do {
    if (!parser.has_more() || !parse_member(members)) return false;
  } while (!parser.sees(']'));
  ++parser.at;
  // The node holds the bytes that don't match.
  if (!negated)
    for (std::uint8_t& byte : members) byte = static_cast<std::uint8_t>(~byte);
  piece = {emit_node(zxNodeKind::anyof), k_haswidth | k_simple};
  emit_block(members.data(), members.size());
  return true;
}

// --------------------------------------------------------- atoms: fields --

struct FieldSpec {
  unsigned flags = 0;
  int width = k_field_not_given;
  int precision = k_field_not_given;
};

constexpr std::string_view k_field_letters = "dxfvstC";
constexpr std::string_view k_flag_bytes = "0* +-=";
constexpr unsigned k_flag_values[] = {k_field_zero,  k_field_star,
                                      k_field_blank, k_field_plus,
                                      k_field_minus, k_field_equals};

// Flags from `at` on; true if "_" is among them.
bool read_flags(const char*& at, const char* end, unsigned& flags) {
  bool is_drawn = false;
  for (; at < end; ++at) {
    const std::size_t i = k_flag_bytes.find(*at);
    if (i != std::string_view::npos)
      flags |= k_flag_values[i];
    else if (*at == '_')
      is_drawn = true;
    else
      break;
  }
  return is_drawn;
}

// What stands between "%" and the letter: flags, width, precision, and bytes
// that mean nothing.
bool read_field_spec(const char* at, const char* letter, FieldSpec& spec) {
  const auto drawn_width = letter - at + 2;
  const bool is_drawn = read_flags(at, letter, spec.flags);
  if (at < letter && zx_is_digit(*at)) {
    if (is_drawn) return false;
    spec.width = read_number(at, letter, k_max_field_width);
  } else if (is_drawn) {
    spec.width = static_cast<int>(
        std::min<std::ptrdiff_t>(drawn_width, k_max_field_width + 1));
  }
  if (at < letter && *at == '.')
    spec.precision = std::min(read_number(++at, letter, k_max_field_width),
                              k_max_field_width);
  return spec.width <= k_max_field_width;
}

// field: % { flag } [ width ] [ . precision ] { other byte } letter
bool parse_field(Piece& piece) {
  const char* letter = parser.at;
  while (letter < parser.end &&
         k_field_letters.find(*letter) == std::string_view::npos)
    ++letter;
  FieldSpec spec;
  if (letter == parser.end || !read_field_spec(parser.at, letter, spec))
    return false;
  if (*letter == 's' && (spec.flags & (k_field_plus | k_field_equals)) != 0)
    return false;
  if (parser.field_count == k_regex_fields) return false;
  parser.at = letter + 1;
  const bool has_width =
      spec.width != k_field_not_given || (spec.flags & k_field_blank) == 0;
  piece = {emit_node(zxNodeKind::field), has_width ? k_haswidth : 0};
  emit(static_cast<unsigned>(parser.field_count++));
  emit(static_cast<unsigned>(spec.width) & 0xFF);
  emit(static_cast<unsigned>(spec.precision) & 0xFF);
  emit(spec.flags);
  emit(static_cast<unsigned char>(*letter));
  return true;
}

// ----------------------------------------------------------------- atoms --

// atom: ^ | $ | . | class | field | escape | brace | run
// Groups are not for here.
bool parse_atom(Piece& piece) {
  switch (*parser.at) {
    case '^':
      ++parser.at;
      piece = {emit_node(zxNodeKind::bol), 0};
      return true;
    case '$':
      ++parser.at;
      piece = {emit_node(zxNodeKind::eol), 0};
      return true;
    case '.':
      ++parser.at;
      piece = {emit_node(zxNodeKind::any), k_haswidth | k_simple};
      return true;
    case '[':
      ++parser.at;
      return parse_class(piece);
    case '%':
      ++parser.at;
      return parse_field(piece);
    case '`':
    case '\\':
      ++parser.at;
      return parse_escape(piece);
    case '{':
    case '}':
      return parse_brace(piece);
    case '*':
    case '+':
    case '?':
      return false;
    default:
      piece = parse_run();
      return true;
  }
}

// ----------------------------------------------------------- quantifiers --

// Takes the "?" that makes a repetition lazy.
bool takes_lazy_mark() {
  if (!parser.sees('?')) return false;
  ++parser.at;
  return true;
}

void repeat_simple(const Piece& piece, char sign) {
  const bool lazy = takes_lazy_mark();
  if (sign == '*')
    insert_node(lazy ? zxNodeKind::starmin : zxNodeKind::star, piece.place);
  else
    insert_node(lazy ? zxNodeKind::plusmin : zxNodeKind::plus, piece.place);
}

void put_count(std::uint8_t* at, int count) {
  at[0] = static_cast<std::uint8_t>(count >> 8);
  at[1] = static_cast<std::uint8_t>(count & 0xFF);
}

void repeat_counted(const Piece& piece, const Count& count) {
  const bool lazy = takes_lazy_mark();
  insert_node(lazy ? zxNodeKind::curlymin : zxNodeKind::curly, piece.place,
              k_node_head + k_counts_bytes);
  if (parser.is_counting()) return;
  std::uint8_t* operand = parser.program + piece.place + k_node_head;
  put_count(operand, count.min);
  put_count(operand + 2, count.max);
}

// x* as BRANCH x BACK (to the BRANCH), BRANCH NOTHING
void loop_star(int atom) {
  insert_node(zxNodeKind::branch, atom);
  const int back = emit_node(zxNodeKind::back);
  link_operand_tail(atom, back);
  link_operand_tail(atom, atom);
  link_tail(atom, emit_node(zxNodeKind::branch));
  link_tail(atom, emit_node(zxNodeKind::nothing));
}

// x+ as x, BRANCH BACK (to x), BRANCH NOTHING
void loop_plus(int atom) {
  const int branch = emit_node(zxNodeKind::branch);
  link_tail(atom, branch);
  link_tail(emit_node(zxNodeKind::back), atom);
  link_tail(branch, emit_node(zxNodeKind::branch));
  link_tail(atom, emit_node(zxNodeKind::nothing));
}

// x? as BRANCH x, BRANCH NOTHING
void make_optional(int atom) {
  insert_node(zxNodeKind::branch, atom);
  link_tail(atom, emit_node(zxNodeKind::branch));
  const int nothing = emit_node(zxNodeKind::nothing);
  link_tail(atom, nothing);
  link_operand_tail(atom, nothing);
}

// quantifier: * | + | ? | counted, and ? behind those of simple atoms
bool parse_quantifier(Piece& piece) {
  const Count count = read_count(parser.at, parser.end);
  const char sign = *parser.at;
  const bool simple = (piece.flags & k_simple) != 0;
  if (sign != '?' && (piece.flags & k_haswidth) == 0) return false;
  if (count.is_valid) {
    if (!simple || count.min > count.max || count.max > k_regex_max_count)
      return false;
    parser.at = count.end;
    repeat_counted(piece, count);
  } else {
    ++parser.at;
    if (sign == '?')
      make_optional(piece.place);
    else if (simple)
      repeat_simple(piece, sign);
    else if (sign == '*')
      loop_star(piece.place);
    else
      loop_plus(piece.place);
  }
  piece.flags = sign == '*' || sign == '?' ? k_spstart : k_haswidth;
  return !is_quantifier(parser.at, parser.end);
}

// ---------------------------------------------------------------- groups --

// The open groups, the whole pattern first.
using GroupStack = zxQVA<Group>;

void start_branch(Group& group) {
  group.branch_flags = 0;
  group.chain = -1;
}

// Adds a finished piece to the alternative.
void add_piece(Group& group, const Piece& piece) {
  group.branch_flags |= static_cast<std::uint8_t>(piece.flags & k_haswidth);
  if (group.chain < 0)
    group.branch_flags |= static_cast<std::uint8_t>(piece.flags & k_spstart);
  else
    link_tail(group.chain, piece.place);
  group.chain = piece.place;
}

// An alternative without a piece matches empty.
void end_branch(Group& group) {
  if (group.chain < 0) emit_node(zxNodeKind::nothing);
  group.flags |= group.branch_flags & k_spstart;
  if ((group.branch_flags & k_haswidth) == 0)
    group.flags &= static_cast<std::uint8_t>(~k_haswidth);
}

void add_branch(Group& group) {
  const int branch = emit_node(zxNodeKind::branch);
  link_tail(group.branch, branch);
  group.branch = branch;
  start_branch(group);
}

// The node that opens group `number`; those of which there are too many
// capture nothing.
int emit_open(GroupKind kind, int number) {
  if (kind == GroupKind::plain) return emit_node(zxNodeKind::open0);
  if (number > k_regex_groups) return emit_node(zxNodeKind::nothing);
  return emit_node(opcode(zxNodeKind::open) + static_cast<unsigned>(number) -
                   1);
}

int emit_close(const Group& group) {
  if (group.kind == GroupKind::top) return emit_node(zxNodeKind::end);
  if (group.kind == GroupKind::plain) return emit_node(zxNodeKind::close0);
  if (group.number > k_regex_groups) return emit_node(zxNodeKind::nothing);
  return emit_node(opcode(zxNodeKind::close) + group.number - 1U);
}

Group make_group(GroupKind kind, int number) {
  Group group{kind, static_cast<std::uint8_t>(number), k_haswidth, 0, 0, 0, 0};
  if (kind == GroupKind::top) {
    group.open = group.branch = emit_node(zxNodeKind::branch);
  } else {
    group.open = emit_open(kind, number);
    group.branch = emit_node(zxNodeKind::branch);
    link_tail(group.open, group.branch);
  }
  start_branch(group);
  return group;
}

// "(" or "{{", which are passed here
bool open_group(GroupStack& groups) {
  const bool plain = parser.sees('{');
  parser.at += plain ? 2 : 1;
  if (parser.group_count >= k_group_limit) return false;
  groups.append(plain ? make_group(GroupKind::plain, 0)
                      : make_group(GroupKind::capturing, parser.group_count++));
  return true;
}

// Links the ends of all alternatives to the node that closes the group.
void close_group(const Group& group, Piece& piece) {
  const int close = emit_close(group);
  link_tail(group.branch, close);
  piece = {group.open, group.flags};
  if (parser.is_counting()) return;
  const std::uint8_t* node = parser.program + group.open;
  if (group.kind != GroupKind::top) node = zxnode::next(node);
  for (; zxnode::is(node, zxNodeKind::branch); node = zxnode::next(node))
    link_operand_tail(static_cast<int>(node - parser.program), close);
}

// True where an alternative ends: at the end, "|", ")", "}}".
bool is_at_branch_end() {
  return !parser.has_more() || *parser.at == '|' || *parser.at == ')' ||
         parser.sees_two('}');
}

bool finish_piece(Group& group, Piece piece) {
  if (is_quantifier(parser.at, parser.end) && !parse_quantifier(piece))
    return false;
  add_piece(group, piece);
  return true;
}

// ")" or "}}", which must belong to the innermost group
bool parse_close(GroupStack& groups) {
  const bool plain = parser.sees('}');
  parser.at += plain ? 2 : 1;
  const Group group = groups.last();
  if (group.kind != (plain ? GroupKind::plain : GroupKind::capturing))
    return false;
  Piece piece;
  close_group(group, piece);
  groups.drop_last();
  return finish_piece(groups.last(), piece);
}

// One step of the parser inside an alternative.
bool parse_piece(GroupStack& groups) {
  if (*parser.at == '(' || parser.sees_two('{')) return open_group(groups);
  Piece piece;
  return parse_atom(piece) && finish_piece(groups.last(), piece);
}

// regex: branch { | branch }
// branch: { piece }
// piece: atom [ quantifier ]
// The second and the third rule nest through groups, which stand on a stack.
bool parse_regex() {
  GroupStack groups;
  emit(k_regex_magic);
  groups.append(make_group(GroupKind::top, 0));
  for (;;) {
    if (!is_at_branch_end()) {
      if (!parse_piece(groups)) return false;
      continue;
    }
    end_branch(groups.last());
    if (parser.sees('|')) {
      ++parser.at;
      add_branch(groups.last());
    } else if (parser.has_more()) {
      if (!parse_close(groups)) return false;
    } else {
      break;
    }
  }
  if (groups.last().kind != GroupKind::top) return false;
  Piece whole;
  close_group(groups.last(), whole);
  parser.flags = whole.flags;
  return true;
}

// ---------------------------------------------------------------- header --

std::uint8_t first_byte(zxnode::Node literal) {
  return zxnode::operand(literal)[1];
}

// The longest literal of the chain, the last of several.  Alternatives and
// loops hang below the chain, so all that stands in it is in every match.
void find_must(zxRegex& regex, zxnode::Node node) {
  for (; node != nullptr; node = zxnode::next(node)) {
    if (!zxnode::is(node, zxNodeKind::exactly)) continue;
    const std::uint8_t length = *zxnode::operand(node);
    if (length < regex.regmlen) continue;
    regex.regmlen = length;
    regex.regmust = reinterpret_cast<const char*>(zxnode::operand(node) + 1);
  }
}

void fill_header(zxRegex& regex) {
  const zxnode::Node top = regex.program() + 1;
  if (zxnode::next_alternative(top) != nullptr) return;
  const zxnode::Node first = zxnode::operand(top);
  if (zxnode::is(first, zxNodeKind::exactly)) {
    regex.regstart = first_byte(first);
  } else if (zxnode::is(first, zxNodeKind::bol)) {
    const zxnode::Node second = zxnode::next(first);
    regex.reganch = 1;
    if (zxnode::is(second, zxNodeKind::exactly)) {
      regex.reganch = 2;
      regex.regstart = first_byte(second);
    }
  }
  if ((parser.flags & k_spstart) != 0) find_must(regex, first);
}

// --------------------------------------------------------------- passes --

bool count_size(const char* pattern, const char* end) {
  start_pass(pattern, end, nullptr);
  return parse_regex();
}

void refuse(const char* pattern, const char* end) {
  constexpr std::ptrdiff_t k_shown = 140;
  char text[k_shown + 1];
  const std::ptrdiff_t length = std::min(end - pattern, k_shown);
  if (length > 0) std::memcpy(text, pattern, static_cast<std::size_t>(length));
  text[length] = '\0';
  bail_code(1752, text);
}

zxRegex* make_block(std::size_t size) {
  void* block = zx_realloc(nullptr, zxRegex::k_program_place + size);
  if (block == nullptr) return nullptr;
  return ::new (block) zxRegex{k_regex_no_start,
                               0,
                               0,
                               0,
                               nullptr,
                               static_cast<std::uint32_t>(size),
                               1,
                               0};
}

}  // namespace

zxRegex* regcomp(const char* pattern, const char* end) {
  if (!ZX_ASSERT(pattern != nullptr && end >= pattern)) return nullptr;
  if (!count_size(pattern, end)) {
    refuse(pattern, end);
    return nullptr;
  }
  if (parser.size >= k_size_limit) {
    bail_code(1751);
    return nullptr;
  }
  zxRegex* regex = make_block(static_cast<std::size_t>(parser.size));
  if (regex == nullptr) return nullptr;
  start_pass(pattern, end, const_cast<std::uint8_t*>(regex->program()));
  if (!ZX_ASSERT(parse_regex() && parser.size == regex->size)) {
    zx_realloc(regex, 0);
    return nullptr;
  }
  fill_header(*regex);
  return regex_plan(regex, static_cast<int>(parser.node_count));
}

bool regcheck(const char* pattern, const char* end) {
  return ZX_ASSERT(pattern != nullptr && end >= pattern) &&
         count_size(pattern, end);
}
