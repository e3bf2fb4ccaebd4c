// zxsfmt_page_test.cpp - the examples of docs/formats.md, and its table of
// directives.
// Tests zxlib/zxsfmt.h and zxsfmt*.cpp.
//
// The page's examples are indented blocks of columns, two blanks apart.  The
// names in the first line say what is compared.
#include <gtest/gtest.h>

#include <cstdint>
#include <ctime>
#include <deque>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "format_run.h"
#include "kit/failure.h"
#include "kit/pages.h"
#include "kit/text.h"
#include "zxsfmt.h"
#include "zxstrm.h"

namespace {

using format_run::bad;
using format_run::Composed;
using format_run::good;

using Cells = std::vector<std::string>;

constexpr char k_page[] = "docs/formats.md";

// Cuts a line at every place where a separator stands outside of quotes, and
// takes the blanks at the ends of the parts away.
Cells parts_of(std::string_view line, std::string_view separator) {
  Cells parts = {""};
  bool inside = false;
  for (std::size_t i = 0; i < line.size(); ++i) {
    if (line[i] == '\\' && inside) {
      parts.back() += line[i++];
    } else if (line[i] == '"') {
      inside = !inside;
    } else if (!inside && line.substr(i).starts_with(separator)) {
      if (!parts.back().empty()) parts.emplace_back();
      i += separator.size() - 1;
      continue;
    } else if (!inside && line[i] == ' ' && parts.back().empty()) {
      continue;
    }
    parts.back() += line[i];
  }
  if (parts.back().empty()) parts.pop_back();
  return parts;
}

// The byte that an escape of programs stands for; the place moves on over it.
char byte_at(std::string_view text, std::size_t& at) {
  if (text[at] != '\\') return text[at++];
  const char letter = text[at + 1];
  at += 2;
  if (letter == 'n') return '\n';
  if (letter == 'r') return '\r';
  if (letter != 'x') return letter;
  at += 2;
  const std::string digits(text.substr(at - 2, 2));
  return static_cast<char>(std::stoi(digits, nullptr, 16));
}

// The text in quotes that a cell is.
std::string text_in(std::string_view cell) {
  EXPECT_TRUE(cell.size() >= 2 && cell.front() == '"' && cell.back() == '"')
      << cell;
  if (cell.size() < 2) return "";
  cell = cell.substr(1, cell.size() - 2);
  std::string text;
  for (std::size_t at = 0; at < cell.size();) text += byte_at(cell, at);
  return text;
}

// The arguments that the page speaks of.
class Arguments {
 public:
  Arguments() {
    date.set(2009, 2, 25);
    time.set_time_t(moment);
    for (const char* name : {"one", "two", "three"}) names.append(zxStr(name));
    colours.ref("sky") = "blue";
  }
  Arguments(const Arguments&) = delete;
  Arguments& operator=(const Arguments&) = delete;

  zxFmtArg read(const std::string& text) {
    const auto byte = static_cast<unsigned char>(200);
    if (text == "date") return date;
    if (text == "time") return time;
    if (text == "moment") return &moment;
    if (text == "names") return names;
    if (text == "colours") return colours;
    if (text == "byte") return byte;
    if (text == "address")
      return reinterpret_cast<const void*>(std::uintptr_t{48879});
    if (text.starts_with("str("))
      return strings.emplace_back(
          text_in(text.substr(4, text.size() - 5)).c_str());
    if (text.starts_with('"'))
      return strings.emplace_back(text_in(text).c_str()).c_str();
    if (text.starts_with('\'')) {
      std::size_t at = 1;
      return byte_at(text, at);
    }
    return number(text);
  }

 private:
  static zxFmtArg number(const std::string& text) {
    if (text.find_first_of(".e") != text.npos) return std::stod(text);
    if (text.ends_with("UL")) return std::stoul(text);
    if (text.ends_with("U")) return static_cast<unsigned>(std::stoul(text));
    if (text.ends_with("L")) return std::stol(text);
    std::size_t length = 0;
    const int value = std::stoi(text, &length);
    EXPECT_EQ(length, text.size()) << text;
    return value;
  }

  zxDate date;
  zxTime time;
  const std::time_t moment = 1'236'434'706;
  zxQVA<zxStr> names;
  zxSA<zxStr> colours;
  std::deque<zxStr> strings;
};

// What the page says of the world.
class World {
 public:
  World() {
    for (const char* arg : {"-v", "in"}) args.append(zxStr(arg));
    match("the key=value; end", "(`w+)=(`w+)");
  }
  World(const World&) = delete;
  World& operator=(const World&) = delete;

 private:
  zxQVA<zxStr> args;
  const zxStr path = "tool";
  const zxStr name = "TOOL";
  const format_run::Program program{{&args, &path, &name}};
  const format_run::InZone zone{"UTC0"};
  const format_run::Clock clock{1'236'434'706};
  const format_run::Variable none{"NO_SUCH_NAME", nullptr};
};

void expect_example(const Cells& names, const Cells& cells) {
  ASSERT_EQ(names[1], "arguments");
  const std::string format = text_in(cells[0]);
  Arguments arguments;
  std::vector<zxFmtArg> records;
  if (cells[1] != "none")
    for (const std::string& argument : parts_of(cells[1], ","))
      records.push_back(arguments.read(argument));
  zxFmtEnv env;
  const auto compose = [&] {
    return format_run::compose_list(env, format.c_str(), records.data(),
                                    records.size());
  };
  if (names[2] == "fails an assertion") {
    EXPECT_EQ(cells.size(), 2U);
    const kit::Failure failure = kit::failure_of([&] { compose(); });
    EXPECT_TRUE(failure.message.starts_with("1000: ")) << failure.message;
    return;
  }
  ASSERT_EQ(cells.size(), 3U);
  const std::string text = text_in(cells[2]);
  ASSERT_TRUE(names[2] == "text" || names[2] == "leaves") << names[2];
  EXPECT_EQ(compose(), names[2] == "text" ? good(text) : bad(text));
}

TEST(zxsfmt_page, each_example_is_as_it_says) {
  const World world;
  Cells names;
  int count = 0;
  for (const std::string& line : kit::lines_of(k_page)) {
    SCOPED_TRACE(line);
    if (!line.starts_with("    ")) {
      names.clear();
      continue;
    }
    const std::string_view text = std::string_view(line).substr(4);
    if (text.starts_with("format  ") && text.find("=") == text.npos) {
      names = parts_of(text, "  ");
      ASSERT_EQ(names.size(), 3U);
    } else if (!names.empty()) {
      expect_example(names, parts_of(text, "  "));
      ++count;
    }
  }
  EXPECT_GT(count, 120);
}

// ---- tables

// The rows of the first table behind a heading, without its head.
std::vector<Cells> rows_behind(const std::string& heading) {
  std::vector<Cells> rows;
  bool is_there = false;
  for (std::string line : kit::lines_of(k_page)) {
    if (line == heading) is_there = true;
    if (!is_there) continue;
    if (line.starts_with("| ")) {
      std::erase(line, '`');
      rows.push_back(parts_of(line, "|"));
      for (std::string& cell : rows.back())
        while (cell.ends_with(' ')) cell.pop_back();
    } else if (!rows.empty() && !line.starts_with("|")) {
      break;
    }
  }
  if (!rows.empty()) rows.erase(rows.begin());
  return rows;
}

using Tags = std::set<std::string>;

std::string name_of(std::uint32_t tag) {
  return tag < 32 ? std::to_string(tag)
                  : std::string(1, static_cast<char>(tag));
}

Tags words_of(const std::string& cell) {
  std::istringstream in(cell);
  Tags words;
  for (std::string word; in >> word;) words.insert(word);
  return words;
}

// One record of every tag.
class Records {
 public:
  Records() {
    time.set_time_t(1'236'434'706);
    records = {1,
               1L,
               1U,
               1UL,
               '1',
               static_cast<unsigned char>(1),
               format_run::boolean(true),
               1.0,
               "1",
               text,
               zxFmtArg(zxFmtArg::k_text, &text),
               date,
               time,
               static_cast<const std::time_t*>(nullptr),
               texts,
               static_cast<const void*>(this),
               table,
               format_run::list_of(list),
               format_run::nothing()};
  }
  Records(const Records&) = delete;
  Records& operator=(const Records&) = delete;

  // The tags that a directive takes.
  Tags taken_by(const std::string& directive) const {
    Tags tags;
    zxFmtEnv env;
    for (const zxFmtArg& record : records)
      if (format_run::compose_list(env, directive.c_str(), &record, 1).good)
        tags.insert(name_of(record.tag));
    return tags;
  }

  Tags all() const {
    Tags tags;
    for (const zxFmtArg& record : records) tags.insert(name_of(record.tag));
    return tags;
  }

 private:
  const zxStr text = "1";
  zxDate date;
  zxTime time;
  zxQVA<zxStr> texts;
  zxSA<zxStr> table;
  format_run::List list;
  std::vector<zxFmtArg> records;
};

TEST(zxsfmt_page, the_types_are_all_that_there_are) {
  Tags tags;
  for (const Cells& row : rows_behind("## Types and default forms"))
    tags.insert(row[0]);
  EXPECT_EQ(tags, Records().all());
}

TEST(zxsfmt_page, each_directive_takes_the_types_that_it_says) {
  const Records records;
  std::string letters;
  std::string types;
  for (const Cells& row : rows_behind("## Directives")) {
    ASSERT_EQ(row.size(), 3U);
    if (row[1] != "the same") types = row[1];
    const bool is_bracketed = row[0].ends_with("with a bracket");
    for (const std::string& letter :
         words_of(is_bracketed ? row[0].substr(0, 1) : row[0])) {
      EXPECT_EQ(records.taken_by((is_bracketed ? "%[]" : "%") + letter),
                words_of(types))
          << letter;
      letters += letter;
    }
  }
  EXPECT_EQ(letters.size(), 21U);
  for (int byte = 1; byte < 256; ++byte) {
    const char letter = static_cast<char>(byte);
    if (letters.find(letter) != letters.npos) continue;
    if (letter == '<' || letter == '>') continue;
    EXPECT_EQ(records.taken_by(std::string("%") + letter), Tags()) << letter;
  }
}

TEST(zxsfmt_page, each_flag_of_a_picture_is_one) {
  int count = 0;
  for (const Cells& row : rows_behind("## Number pictures")) {
    ASSERT_EQ(row[0].size(), 1U);
    const std::string format = "%[" + row[0] + "]v";
    EXPECT_TRUE(format_run::compose(format.c_str(), 7).good) << format;
    ++count;
  }
  EXPECT_EQ(count, 14);
}

}  // namespace
