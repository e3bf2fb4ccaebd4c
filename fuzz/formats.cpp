// formats.cpp - the fuzz target of the format language.
//
// An input is
//
//   FLAGS argument... format
//
// FLAGS: the lowest three bits, modulo 7, are the number of arguments; 8 has
// `out` hold the format itself; 16 has the last argument be a list of all the
// others.  An argument is its kind, modulo the number of kinds, and its value,
// as many bytes as Arguments::add() reads.  The rest is the format, up to its
// first NUL.
//
// Each format must come back with the same result and text twice, also where
// it is the text that it composes into.  Failed assertions return.
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <ctime>
#include <deque>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "fuzz/input.h"
#include "fuzz/targets.h"
#include "zxplat.h"
#include "zxsfmt.h"
#include "zxstrm.h"

namespace fuzz {
namespace {

constexpr std::size_t k_longest_format = 250;
// What a text is repeated or widened to stays small.
constexpr int k_most_digits = 4;
constexpr std::int32_t k_largest_width = 2000;

// ---- arguments

// A list as the module of variants would have one.
struct List {
  std::vector<zxFmtArg> elements;
  std::size_t taken = 0;
};

bool take_from_list(void* list, zxFmtArg& element, bool& is_last) {
  List& from = *static_cast<List*>(list);
  if (from.taken == from.elements.size()) return false;
  element = from.elements[from.taken++];
  is_last = from.taken == from.elements.size();
  return true;
}

constexpr std::string_view k_texts[] = {
    "",       "a",    "abc", "err",           "void", "[err]", "%s # $d $$",
    "\xE0 1", "a\nb", "0",   "12,345.67 abc", "#",    "\x01~",
};
constexpr double k_doubles[] = {
    0.0,    -0.0,           0.5,     1.5,      2.5,       0.125,
    99.999, -12.5,          1234567, 5000,     5000000,   1e15,
    1e-5,   123456789012.0, 1e308,   -1e30,    5e-324,    9.9995e22,
    0.0001, 999.95,         1e100,   INFINITY, -INFINITY, NAN,
};

// The arguments of one call, and what they point at.
class Arguments {
 public:
  Arguments(Reader& input, int flags, const zxStr& text_itself)
      : out(text_itself) {
    for (int left = (flags & 7) % 7; left > 0; --left) add(input);
    if ((flags & 16) == 0) return;
    list.elements = std::exchange(records, {});
    records.emplace_back(zxFmtArg::k_list, &list);
  }

  std::int32_t count() const {
    return static_cast<std::int32_t>(records.size());
  }
  const zxFmtArg* data() const { return records.data(); }
  bool has_out() const { return is_out_there; }

 private:
  void add(Reader& input);
  void add_number(Reader& input, std::uint32_t tag);
  void add_text(Reader& input, std::uint32_t tag);
  void add_out(Reader& input);
  void add_moment(Reader& input, std::uint32_t tag);
  void add_strings(Reader& input);

  // The argument points at a value that lives as long as the arguments.
  template <class Value>
  void add_kept(std::deque<Value>& kept, std::uint32_t tag, Value value) {
    kept.push_back(std::move(value));
    records.emplace_back(tag, &kept.back());
  }

  const zxStr& out;
  bool is_out_there = false;
  std::vector<zxFmtArg> records;
  List list;
  std::deque<zxStr> strings;
  std::deque<std::string> plain_texts;
  std::deque<zxDate> dates;
  std::deque<zxTime> times;
  std::deque<std::time_t> moments;
  std::deque<zxQVA<zxStr>> arrays;
  std::deque<zxSA<zxStr>> tables;
};

void Arguments::add(Reader& input) {
  constexpr std::string_view k_kinds = "ilvuczsf1tMmk3pbB0FOo?";
  const char kind = k_kinds[input.byte() % k_kinds.size()];
  switch (kind) {
    case 'z':
    case 's':
      return add_text(input, static_cast<std::uint32_t>(kind));
    case '1':
      return add_text(input, zxFmtArg::k_text);
    case 'f':
      records.emplace_back(k_doubles[input.byte() % std::size(k_doubles)]);
      return;
    case 'F':
      records.emplace_back(std::bit_cast<double>(input.number(8)));
      return;
    case 't':
    case 'M':
    case 'm':
      return add_moment(input, static_cast<std::uint32_t>(kind));
    case 'k':
    case '3':
      return add_strings(input);
    case 'O':
    case 'o':
      return add_out(input);
    case 'p':
      records.emplace_back(reinterpret_cast<const void*>(
          static_cast<std::uintptr_t>(input.number(8))));
      return;
    case '0':
      records.emplace_back(zxFmtArg::k_void, nullptr);
      return;
    case '?':  // no tag of ours
      records.emplace_back(200U + input.byte(), nullptr);
      return;
    default:
      return add_number(input, static_cast<std::uint32_t>(kind));
  }
}

// Two bytes of a number, which "*" may take, or four behind a byte 255.
void Arguments::add_number(Reader& input, std::uint32_t tag) {
  const auto low = static_cast<std::int16_t>(input.number(2));
  std::int32_t value = low % k_largest_width;
  if (tag != 'i' && (low & 0xFF) == 0xFF)
    value = static_cast<std::int32_t>(input.number(4));
  zxFmtArg record = value;
  record.tag = tag;
  if (tag == 'b') record.number &= 0xFF;
  if (tag == 'c') record.number = static_cast<signed char>(value);
  if (tag == zxFmtArg::k_bool) record.number &= 1;
  records.push_back(record);
}

// One of the texts, perhaps many times.
void Arguments::add_text(Reader& input, std::uint32_t tag) {
  const std::uint8_t choice = input.byte();
  std::string text;
  for (int left = choice >= 240 ? 60 : 1; left > 0; --left)
    text += k_texts[choice % std::size(k_texts)];
  if (tag == 'z') {
    plain_texts.push_back(text);
    records.emplace_back(plain_texts.back().c_str());
  } else {
    add_kept(strings, tag, zxStr(text));
  }
}

// What is composed into, as a string, a text or in the middle of it.
void Arguments::add_out(Reader& input) {
  is_out_there = true;
  switch (input.byte() % 4) {
    case 0:
      records.emplace_back(std::uint32_t{'s'}, &out);
      return;
    case 1:
      records.emplace_back(zxFmtArg::k_text, &out);
      return;
    case 2:
      records.emplace_back(out.c_str());
      return;
    default:
      records.emplace_back(out.c_str() + out.length() / 2);
  }
}

void Arguments::add_moment(Reader& input, std::uint32_t tag) {
  const auto number = static_cast<std::uint32_t>(input.number(4));
  if (tag == 't')
    add_kept(dates, tag,
             zxDate::from_stored(static_cast<std::int16_t>(number)));
  else if (tag == 'M')
    add_kept(times, tag,
             zxTime::from_stored(static_cast<std::int32_t>(number)));
  else if (number == 0)
    records.emplace_back(static_cast<const std::time_t*>(nullptr));
  else  // some beyond 32 bits
    add_kept(moments, tag, static_cast<std::time_t>(number) * 3);
}

// An array of up to 3 texts, or a table of them.
void Arguments::add_strings(Reader& input) {
  const std::uint8_t choice = input.byte();
  const bool as_table = choice >= 128;
  zxQVA<zxStr>& array = arrays.emplace_back();
  zxSA<zxStr>& table = tables.emplace_back();
  for (std::size_t i = 0; i < choice % 4; ++i) {
    const zxStr text(k_texts[(choice + i) % std::size(k_texts)]);
    array.append(text);
    table.set(text, zxStr(k_texts[i]));
  }
  if (as_table)
    records.emplace_back(table);
  else
    records.emplace_back(array);
}

// ---- the world that formats look at

class Environment : public zxFmtEnv {
 public:
  zxStr fmt_left(const zxFmtArg&) override { return "<left>"; }
  zxStr fmt_right(const zxFmtArg&) override { return {}; }
};

// A program, a match, a standing clock and lists; those of before at the end.
class World {
 public:
  World() {
    args.append("one");
    args.append("two # %s");
    zx_fmt_program = {&args, &path, &name};
    zx_fmt_take_from_list = take_from_list;
    zxplat::process.clock = [] { return std::int64_t{1'234'567'890}; };
    match(subject, "(b+)(x)?");
  }
  ~World() {
    zx_fmt_program = old_program;
    zx_fmt_take_from_list = old_take;
    zxplat::process.clock = old_clock;
    clear_match();
  }
  World(const World&) = delete;
  World& operator=(const World&) = delete;

 private:
  zxQVA<zxStr> args;
  zxStr path = "C:\\folder\\prog.exe";
  zxStr name = "prog";
  zxStr subject = "aabbc";
  zxFmtProgram old_program = zx_fmt_program;
  zxTakeFromList old_take = zx_fmt_take_from_list;
  std::int64_t (*old_clock)() = zxplat::process.clock;
};

// ---- runs

// Formats that ask for more than a few thousand bytes at a time are left out.
bool is_bounded(std::string_view format) {
  int digits = 0;
  for (const char byte : format) {
    digits = byte >= '0' && byte <= '9' ? digits + 1 : 0;
    if (digits > k_most_digits) return false;
  }
  return true;
}

struct Result {
  bool good;
  std::string text;
  bool has_out;

  bool operator==(const Result&) const = default;
};

Result run(Reader input, int flags, std::string_view format, bool in_out) {
  zxStr out(in_out ? format : "some text of before");
  const Arguments arguments(input, flags, out);
  const std::string apart(format);
  Environment environment;
  const bool good = sfmt_core(out, in_out ? out.c_str() : apart.c_str(),
                              environment, arguments.count(), arguments.data());
  return {good, std_str(out), arguments.has_out()};
}

}  // namespace

void formats(Bytes bytes) {
  const FailuresReturn failures_return;
  const World world;
  Reader input(bytes);
  const int flags = input.byte();
  const Reader at_arguments = input;
  const zxStr nothing;
  Arguments(input, flags, nothing);  // steps over them
  std::string_view format = input.text(k_longest_format);
  format = format.substr(0, format.find('\0'));
  if (!is_bounded(format)) return;

  const Result result = run(at_arguments, flags, format, false);
  require(run(at_arguments, flags, format, false) == result,
          "the same format gives something else");
  const Result in_place = run(at_arguments, flags, format, true);
  require(result.has_out || in_place == result,
          "a format in its own result gives something else");
}

}  // namespace fuzz
