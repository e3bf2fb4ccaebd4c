// zxsfmt_model_test.cpp - the format language against a second interpreter,
// over random formats and arguments.
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp; the model is format_model.h.
#include <gtest/gtest.h>

#include <cstdint>
#include <deque>
#include <map>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "format_model.h"
#include "format_run.h"
#include "kit/failure.h"
#include "kit/text.h"
#include "zxsfmt.h"
#include "zxstrm.h"

namespace {

using format_model::Kind;
using format_model::Model;
using format_model::Outcome;
using format_model::Value;
using format_model::World;
using format_run::Composed;

// ---- the arguments: each as a record and as the model knows it

constexpr std::int64_t k_moment = 1'236'434'706;  // 2009-03-07 14:05:06, Sat
constexpr std::int64_t k_day_moment = 1'236'384'000;  // that day, 0:00
constexpr char k_moment_forms[6][18] = {
    "07-03-09 14:05:06", "07-03-09",       "14:05:06",
    "09/03/07 14:05:06", "07-03-09 14:05", "Mar-07 14:05"};

std::tm fields_of(std::int32_t hour, std::int32_t minute, std::int32_t second) {
  std::tm fields = {};
  fields.tm_year = 109;
  fields.tm_mon = 2;
  fields.tm_mday = 7;
  fields.tm_wday = 6;
  fields.tm_yday = 65;
  fields.tm_hour = hour;
  fields.tm_min = minute;
  fields.tm_sec = second;
  return fields;
}

struct Argument {
  zxFmtArg record;
  Value value;
};

// All arguments that random formats are given.
class Pool {
 public:
  Pool() {
    add_numbers();
    add_texts();
    add_moments();
    add_others();
  }
  Pool(const Pool&) = delete;
  Pool& operator=(const Pool&) = delete;

  const std::vector<Argument>& all() const { return arguments; }
  const std::map<std::string, std::string>& table_entries() const {
    return entries;
  }

 private:
  void add(const zxFmtArg& record, Value value) {
    value.tag = record.tag;
    arguments.push_back({record, std::move(value)});
  }

  void add_number(const zxFmtArg& record, std::int64_t number) {
    Value value;
    value.number = number;
    add(record, value);
  }

  void add_numbers() {
    for (const int n : {0, 1, 7, -1, -42, 12345, INT32_MAX, INT32_MIN})
      add_number(n, n);
    for (const int width : {0, 1, 3, 5, 9, 12, -6}) add_number(width, width);
    for (const long n : {0L, 250L, -99999L, 2147483647L}) add_number(n, n);
    for (const unsigned n : {0U, 8U, 65U, 4294967295U}) add_number(n, n);
    for (const unsigned long n : {0UL, 90UL, 4294967295UL}) add_number(n, n);
    for (const char c : {'\0', 'a', '%', '\n', '\xE0', '\x80'})
      add_number(c, static_cast<signed char>(c));
    for (const int b : {0, 5, 65, 200, 255})
      add_number(static_cast<unsigned char>(b), b);
    add_number(format_run::boolean(true), 1);
    add_number(format_run::boolean(false), 0);
    // None is a tie behind an even digit, at no number of decimals.
    for (const double x : {0.0, 1.5, -3.75, 12.0, 1e10, 3e-7, 1e100}) {
      Value value;
      value.real = x;
      add(x, value);
    }
    Value hundreds;
    hundreds.number = 1234;
    hundreds.pictures = {{",", "1,234"}, {"", "1234"}, {"+", "+1234"}};
    add(1234, hundreds);
    Value half;
    half.real = 1.5;
    half.pictures = {{",", "1.5000"}, {"", "1.5000"}, {"0", "1.5"}};
    add(1.5, half);
  }

  void add_text(std::string_view text) {
    Value value;
    value.text = text;
    const zxStr& kept = strings.emplace_back(text);
    add(kept, value);
    add(zxFmtArg(zxFmtArg::k_text, &kept), value);
    if (text.find('\0') == text.npos) add(kept.c_str(), value);
  }

  void add_texts() {
    for (const std::string_view text :
         {std::string_view(""), std::string_view("x"),
          std::string_view("abcdef"), std::string_view("err"),
          std::string_view("void"), std::string_view("errs"),
          std::string_view("a\0b", 3), std::string_view("l\nm%d#$0"),
          std::string_view("a text of some length, for columns and cuts")})
      add_text(text);
  }

  void add_moments() {
    Value day;
    day.text = day.date = "07-03-09";
    day.fields = fields_of(0, 0, 0);
    date.set_days(k_day_moment / 86400);
    add(date, day);
    Value at_once;
    at_once.text = "07-03-2009 14:05:06";
    at_once.date = "07-03-09";
    at_once.fields = fields_of(14, 5, 6);
    for (std::size_t i = 0; i < 6; ++i) at_once.forms[i] = k_moment_forms[i];
    time.set_time_t(k_moment);
    add(time, at_once);
    at_once.text = k_moment_forms[0];
    add(&moment, at_once);
    add(static_cast<const std::time_t*>(nullptr), at_once);  // now
  }

  void add_others() {
    Value none;
    add(list_0, none);
    Value three;
    three.texts = {"one", "", "x%y"};
    for (const std::string& text : three.texts)
      list_3.append(zxStr(text.c_str()));
    add(list_3, three);
    Value address;
    address.address = 0x12AB34;
    add(reinterpret_cast<const void*>(address.address), address);
    Value named;
    entries = {{"A", "first"}, {"b", "#$%"}, {"", "nameless"}};
    for (const auto& [name, text] : entries)
      table.ref(zxStr(name.c_str())) = text.c_str();
    named.table = &entries;
    add(table, named);
    add(format_run::nothing(), Value());
  }

  std::vector<Argument> arguments;
  std::deque<zxStr> strings;
  zxDate date;
  zxTime time;
  std::time_t moment = k_moment;
  zxQVA<zxStr> list_0;
  zxQVA<zxStr> list_3;
  zxSA<zxStr> table;
  std::map<std::string, std::string> entries;
};

// ---- the world of the formats

// Directives of its own, by what they are given.
class Sides : public zxFmtEnv {
 public:
  zxStr fmt_left(const zxFmtArg& arg) override {
    return kit::str("<" + std::to_string(arg.tag) + "\n");
  }
  zxStr fmt_right(const zxFmtArg& arg) override {
    return kit::str(std::to_string(arg.tag) + ">");
  }
};

class Setting {
 public:
  Setting() {
    for (const char* arg : {"-v", "in.vtx", "#"}) args.append(zxStr(arg));
    match("the key=value; end", "(`w+)=(`w+)");
    world.groups = {"key=value", "key", "value"};
    world.groups[10] = "the ";
    world.groups[11] = "; end";
    world.now_3 = k_moment_forms[3];
    world.now_1 = k_moment_forms[1];
    world.now_2 = k_moment_forms[2];
    world.program_args = {"-v", "in.vtx", "#"};
    world.program_path = "c:\\bin\\prog.exe";
    world.program_name = "PROG";
    world.variables = {{"A", "value of A"}, {"TZ", "UTC0"}};
    world.left = [](const Value& value) {
      return "<" + std::to_string(value.tag) + "\n";
    };
    world.right = [](const Value& value) {
      return std::to_string(value.tag) + ">";
    };
  }
  Setting(const Setting&) = delete;
  Setting& operator=(const Setting&) = delete;

  World world;

 private:
  zxQVA<zxStr> args;
  const zxStr path = "c:\\bin\\prog.exe";
  const zxStr name = "PROG";
  const format_run::Program program{{&args, &path, &name}};
  const format_run::InZone zone{"UTC0"};
  const format_run::Variable variable_a{"A", "value of A"};
  const format_run::Variable variable_b{"B", nullptr};
  const format_run::Variable underline{"_", nullptr};  // shells set it
  const format_run::Clock clock{k_moment};
  const format_run::Lists lists;
};

// ---- random formats

class Random {
 public:
  explicit Random(unsigned seed) : bits(seed) {}

  std::size_t below(std::size_t n) {
    return static_cast<std::size_t>(bits() % n);
  }
  bool chance(std::size_t percent) { return below(100) < percent; }
  char one_of(std::string_view bytes) { return bytes[below(bytes.size())]; }
  template <std::size_t N>
  const char* one_of(const char* const (&texts)[N]) {
    return texts[below(N)];
  }

 private:
  std::mt19937_64 bits;
};

// A format, and the arguments that would fit it as positions in the pool.
class Writer {
 public:
  Writer(Random& a_random, const Pool& a_pool)
      : random(a_random), pool(a_pool) {}

  std::string format;
  std::vector<std::size_t> args;

  void write() {
    for (std::size_t pieces = 1 + random.below(5); pieces > 0; --pieces)
      piece();
    if (random.chance(6)) args.push_back(any());
    if (random.chance(4) && !args.empty()) args.pop_back();
  }

  // Bytes that mean something, in any order.
  void write_noise() {
    constexpr std::string_view k_bytes =
        "%%%###$$$*..[]<>+- 0159ldsczxhtTvLkrMp{}%`'_Aa\n";
    for (std::size_t n = random.below(12); n > 0; --n)
      format += random.one_of(k_bytes);
    for (std::size_t n = random.below(5); n > 0; --n) args.push_back(any());
  }

 private:
  void piece() {
    static constexpr const char* k_plain[] = {"",   "a",  "\n", "##",    "$$",
                                              "%%", "]l", "{}", "abc 12"};
    if (random.chance(30)) format += random.one_of(k_plain);
    const std::size_t kind = random.below(10);
    if (kind < 1)
      placeholder();
    else if (kind < 4)
      escape();
    else
      directive();
  }

  void placeholder() {
    format += '#';
    args.push_back(any());
  }

  void escape() {
    static constexpr const char* k_escapes[] = {
        "0",   "1",   "2",      "3",    "9",     "`",    "'",    "T",   "d",
        "t",   "M",   "c",      "c5",   "c0",    "c12",  "s",    "s3",  "s20",
        "s0",  "rx3", "rab2",   "r35",  "r#$4",  "r\n2", "rx",   "r",   "rx0",
        "%*",  "%0",  "%-",     "%1",   "%3",    "%4",   "{*",   "{2}", "%a%",
        "{A}", "{b}", "{no_1}", "%a",   "{}",    "%%",   "{A%",  "%b-", "q",
        "",    "C5",  "{9",     "c300", "s0012", "r-10", "%_A%", "{a}b"};
    if (random.chance(10)) args.push_back(with_tag(zxFmtArg::k_table));
    format += '$';
    format += random.one_of(k_escapes);
  }

  void directive() {
    format += '%';
    if (random.chance(4)) {
      format += random.one_of("<>");
      args.push_back(any());
      return;
    }
    while (random.chance(25)) format += random.one_of(" #+-");
    if (random.chance(40)) number();
    if (random.chance(30)) {
      format += '.';
      if (random.chance(85)) number();
    }
    const bool is_bracketed = random.chance(12);
    if (is_bracketed) bracket();
    if (random.chance(8)) format += 'l';
    letter(is_bracketed);
  }

  void number() {
    static constexpr const char* k_numbers[] = {
        "0", "1", "2", "3", "5", "8", "10", "12", "05", "33", "00", "256"};
    if (random.chance(85)) {
      format += random.one_of(k_numbers);
      return;
    }
    format += '*';
    args.push_back(random.chance(85) ? with_tag('i') : any());
  }

  void bracket() {
    static constexpr const char* k_brackets[] = {
        "",
        "%H:%M",
        "%y%m%d",
        ",",
        "0",
        "%Q",
        "x",
        "%d%%",
        "+",
        "%a %b %j",
        "a[b",
        "%",
        "0123456789abcdefghi",    // 19 bytes
        "0123456789abcdefghij"};  // 20 bytes
    format += '[';
    format += random.one_of(k_brackets);
    if (random.chance(97)) format += ']';
  }

  void letter(bool is_bracketed) {
    constexpr std::string_view k_letters = "diouxXceEfgGpszhLTtv";
    const bool is_known = random.chance(95);
    const char letter = !is_known      ? random.one_of("aAnZ0*!%$#\n")
                        : is_bracketed ? random.one_of("tvTsd")
                                       : random.one_of(k_letters);
    format += letter;
    args.push_back(is_known && random.chance(75) ? fitting(letter) : any());
  }

  std::size_t any() { return random.below(pool.all().size()); }

  std::size_t with_tag(std::uint32_t tag) {
    for (;;) {
      const std::size_t i = any();
      if (pool.all()[i].value.tag == tag) return i;
    }
  }

  std::size_t fitting(char letter) {
    switch (letter) {
      case 'c':
        return with_tag(static_cast<unsigned char>(random.one_of("iulvcb")));
      case 'e':
      case 'E':
      case 'f':
      case 'g':
      case 'G':
        return with_tag('f');
      case 'p':
        return with_tag('p');
      case 's':
      case 'h':
        return with_tag(static_cast<unsigned char>(random.one_of("sz")));
      case 'z':
        return with_tag('z');
      case 'L':
        return with_tag('k');
      case 'T':
        return with_tag(static_cast<unsigned char>(random.one_of("Mm")));
      case 't':
        return with_tag(static_cast<unsigned char>(random.one_of("tMm")));
      case 'v':
        return with_tag(static_cast<unsigned char>(random.one_of("if")));
      default:
        return with_tag(static_cast<unsigned char>(random.one_of("lviuBcb")));
    }
  }

  Random& random;
  const Pool& pool;
};

// ---- the comparison

// How often each kind of outcome came up.
using Counts = std::map<Kind, int>;

class Comparison {
 public:
  Counts counts;

  void run(const std::string& format, const std::vector<std::size_t>& chosen,
           std::size_t listed) {
    std::vector<zxFmtArg> records;
    std::vector<Value> values;
    format_run::List list;
    Value list_value;
    list_value.tag = zxFmtArg::k_list;
    for (std::size_t i = 0; i < chosen.size(); ++i) {
      const Argument& argument = pool.all()[chosen[i]];
      const bool is_listed = i >= listed && argument.value.tag != 3;
      (is_listed ? list : records).push_back(argument.record);
      (is_listed ? list_value.elements : values).push_back(argument.value);
    }
    if (listed < 15) {
      records.push_back(format_run::list_of(list));
      values.push_back(list_value);
    }
    const Outcome expected = Model(format, values, setting.world).run();
    ++counts[expected.kind];
    expect(format, records, expected);
  }

  const Pool pool;

 private:
  void expect(const std::string& format, const std::vector<zxFmtArg>& records,
              const Outcome& expected) {
    if (expected.kind == Kind::huge) return;
    Sides env;
    Composed composed = {};
    const kit::Failure failure = kit::failure_of([&] {
      composed = format_run::compose_list(env, format.c_str(), records.data(),
                                          records.size());
    });
    if (expected.kind == Kind::not_told) return;
    ASSERT_EQ(failure.message.substr(0, 20),
              expected.kind == Kind::assertion ? "1000: bailed out: zx" : "")
        << failure.message << told(format, records);
    if (expected.kind == Kind::assertion) return;
    const Composed wanted = {expected.kind == Kind::good, expected.text};
    ASSERT_EQ(composed, wanted) << told(format, records);
  }

  static std::string told(const std::string& format,
                          const std::vector<zxFmtArg>& records) {
    std::string text = "format '" + format + "', tags";
    for (const zxFmtArg& record : records)
      text += ' ' + (record.tag < 32
                         ? std::to_string(record.tag)
                         : std::string(1, static_cast<char>(record.tag)));
    return text;
  }

  Setting setting;
};

Counts compare(int count, unsigned seed) {
  Comparison comparison;
  Random random(seed);
  for (int i = 0; i < count; ++i) {
    Writer writer(random, comparison.pool);
    if (random.chance(80))
      writer.write();
    else
      writer.write_noise();
    if (writer.args.size() > 15) writer.args.resize(15);
    const bool has_list = writer.args.size() < 14 && random.chance(10);
    const std::size_t listed =
        has_list ? random.below(writer.args.size() + 1) : 15;
    comparison.run(writer.format, writer.args, listed);
    if (testing::Test::HasFatalFailure()) {
      ADD_FAILURE() << "round " << i;
      break;
    }
  }
  return comparison.counts;
}

TEST(zxsfmt_model, random_formats_are_as_the_model_reads_them) {
  const Counts counts = compare(100'000, 1);
  EXPECT_GT(counts.at(Kind::good), 20'000);
  EXPECT_GT(counts.at(Kind::bad), 20'000);
  EXPECT_GT(counts.at(Kind::assertion), 300);
  EXPECT_LT(counts.at(Kind::not_told), 15'000);
  EXPECT_LT(counts.at(Kind::huge), 15'000);
}

TEST(zxsfmt_model_slow, a_million_random_formats) { compare(1'000'000, 2); }

// ---- the model itself, by hand

Outcome model_of(const char* format, const std::vector<Value>& values) {
  World world;
  world.groups[1] = "one";
  return Model(format, values, world).run();
}

Value number_of(std::uint32_t tag, std::int64_t number) {
  Value value;
  value.tag = tag;
  value.number = number;
  return value;
}

Value text_of(std::uint32_t tag, const char* text) {
  Value value;
  value.tag = tag;
  value.text = text;
  return value;
}

TEST(zxsfmt_model, the_model_knows_formats_by_hand) {
  const struct {
    const char* format;
    std::vector<Value> values;
    Outcome outcome;
  } rows[] = {
      {"100%%\n", {}, {Kind::good, "100%\r\n"}},
      {"a#", {}, {Kind::bad, "a#"}},
      {"a", {number_of('i', 1)}, {Kind::bad, "a"}},
      {"%10.3s", {text_of('s', "abcdef")}, {Kind::good, "       abc"}},
      {"%#.3s", {text_of('z', "abcdef")}, {Kind::good, "def"}},
      {"%-5s|", {text_of('z', "ab")}, {Kind::good, "ab   |"}},
      {"a%sb", {text_of('z', "err")}, {Kind::good, "errb"}},
      {"a%sb", {text_of('s', "err")}, {Kind::good, "aerrb"}},
      {"x%dy\n", {text_of('s', "1")}, {Kind::bad, "x%dy\n"}},
      {"x%*dy", {text_of('s', "1")}, {Kind::bad, "x"}},
      {"%05d", {number_of('i', -3)}, {Kind::good, "-0003"}},
      {"%3c", {number_of('i', 0)}, {Kind::good, "  "}},
      {"$1$rab3$s20|$c5", {}, {Kind::good, "oneab"}},
      {"abcdefg$s|", {}, {Kind::good, "abcdefg   |"}},
      {"$q", {}, {Kind::bad, "$q"}},
      {"%+[]v", {number_of('i', 1)}, {Kind::assertion, ""}},
      {"%300d", {number_of('i', 1)}, {Kind::assertion, ""}},
  };
  for (const auto& row : rows) {
    const Outcome outcome = model_of(row.format, row.values);
    EXPECT_EQ(outcome.kind, row.outcome.kind) << row.format;
    EXPECT_EQ(outcome.text, row.outcome.text) << row.format;
  }
}

}  // namespace
