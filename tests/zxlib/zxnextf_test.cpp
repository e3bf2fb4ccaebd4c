// zxnextf_test.cpp - names of files: taken apart and put together, compared
// with a literal model on all short texts; unique names; patterns; and the
// walk, compared with a recursion of the standard library on real folders.
// Tests zxlib/zxnextf.h, zxnextf.cpp and zxnextf_walk.cpp.
#include "zxnextf.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "kit/cases.h"
#include "kit/failure.h"
#include "kit/failure_road.h"
#include "kit/faults.h"
#include "kit/target.h"
#include "kit/tempdir.h"
#include "kit/text.h"
#include "kit/ticks.h"
#include "zxmainf.h"
#include "zxplat.h"
#include "zxsfmt.h"

namespace {

namespace fs = std::filesystem;

using namespace std::string_literals;
using kit::Call;
using kit::expect_assertion_at;
using kit::Faults;
using kit::names_in;
using kit::TempDir;
using kit::Ticks;
using kit::WorkingIn;
using kit::write_file;
using Names = std::vector<std::string>;

// ---------------------------------------------------------------- helpers --

using kit::str;
using kit::text_of;

std::string lower(std::string text) {
  for (char& c : text)
    if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
  return text;
}

Names sorted(Names names) {
  std::sort(names.begin(), names.end());
  return names;
}

std::string repeated(const std::string& text, int count) {
  std::string result;
  for (int i = 0; i < count; ++i) result += text;
  return result;
}

// Calls back with every text over an alphabet, from the empty one to those
// of `longest` bytes.
void for_all_texts(const std::string& alphabet, std::size_t longest,
                   const std::function<void(const std::string&)>& call) {
  Names texts = {""};
  for (std::size_t length = 0;; ++length) {
    for (const std::string& text : texts) call(text);
    if (length == longest) return;
    Names longer;
    for (const std::string& text : texts)
      for (const char c : alphabet) longer.push_back(text + c);
    texts.swap(longer);
  }
}

// ------------------------------------------------------- a model of names --

bool is_separator(char c) { return c == '\\' || c == '/'; }

bool is_letter(char c) {
  return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

bool begins_with_drive(const std::string& text) {
  return text.size() >= 2 && is_letter(text[0]) && text[1] == ':';
}

bool is_drive_root(const std::string& text) {
  return text.size() == 3 && begins_with_drive(text) && text[2] == '\\';
}

// What a stripped text is, how many backslashes went, and whether there was
// one too many.
struct Stripped {
  std::string text;
  int removed = 0;
  bool asserts = false;
};

Stripped model_of_strip(std::string text) {
  const auto may_lose_one = [&] {
    return !text.empty() && text[text.size() - 1] == '\\' && text != "\\" &&
           !is_drive_root(text);
  };
  int removed = 0;
  if (may_lose_one()) {
    text.erase(text.size() - 1);
    removed = 1;
  }
  if (removed == 1 && may_lose_one()) {
    text.erase(text.size() - 1);
    removed = 2;
  }
  return {text, removed, removed == 2 && may_lose_one()};
}

// A name taken apart step by step; `assertion` is the line of one that fails.
struct Model {
  std::string name = {};
  std::string dir = {};
  std::string server = {};
  char letter = '\0';
  int drive = -1;
  bool relative = true;
  bool valid = false;
  bool recursive = false;
  int assertion = 0;

  bool operator==(const Model&) const = default;
};

bool model_of_valid(const std::string& rest) {
  std::size_t bytes_in_component = 0;
  std::size_t components = 0;
  for (std::size_t i = 0; i < rest.size(); ++i) {
    const char c = rest[i];
    if (c == '"' || c == '*' || c == ':' || c == '<' || c == '>' || c == '?' ||
        c == '|')
      return false;
    if (c == '\\' || c == '/') {
      const bool is_first = components == 0;
      if (bytes_in_component == 0 && !is_first) return false;
      components += 1;
      bytes_in_component = 0;
      continue;
    }
    bytes_in_component += 1;
    if (bytes_in_component >= 215) return false;
  }
  return true;
}

// Strips the model's directory; how many backslashes went.
int strip_model(Model& model) {
  const Stripped stripped = model_of_strip(model.dir);
  model.dir = stripped.text;
  if (stripped.removed == 2) model.recursive = true;
  if (stripped.asserts) model.assertion = 261;
  return stripped.removed;
}

Model model_of(const std::string& text, bool is_dir) {
  Model model;
  if (text.empty()) {
    model.assertion = 93;
    return model;
  }
  std::size_t position = 0;
  if (text.size() >= 2 && text[0] == '\\' && text[1] == '\\') {
    position = 2;
    while (position < text.size() && !is_separator(text[position]))
      model.server += text[position++];
  } else if (begins_with_drive(text)) {
    const bool is_small = text[0] >= 'a';
    model.letter = is_small ? static_cast<char>(text[0] - 32) : text[0];
    model.drive = model.letter - 64;
    position = 2;
  }
  if (position == text.size()) return model;
  model.relative = !is_separator(text[position]);
  model.dir = text;
  const int removed = strip_model(model);
  if (model.assertion != 0) return model;
  if (!is_dir && removed == 0) {
    std::size_t cut = position;
    for (std::size_t i = position; i < text.size(); ++i)
      if (is_separator(text[i])) cut = i + 1;
    model.dir = text.substr(0, cut);
    model.name = text.substr(cut);
    strip_model(model);
    if (model.assertion != 0) return model;
  }
  model.valid = model_of_valid(text.substr(position));
  return model;
}

// What the library says, in the same form.
Model taken_apart(const std::string& text, bool is_dir) {
  const zxPath path(str(text), is_dir);
  EXPECT_EQ(text_of(path.path), text);
  Model model;
  model.name = text_of(path.name);
  model.dir = text_of(path.dir);
  model.server = text_of(path.server);
  model.letter = path.drive_letter;
  model.drive = path.drive;
  model.relative = path.relative;
  model.valid = path.valid;
  model.recursive = path.recursive;
  return model;
}

// For the words of a test that fails.
std::ostream& operator<<(std::ostream& out, const Model& model) {
  return out << "dir " << model.dir << " name " << model.name << " server "
             << model.server << " drive " << model.drive
             << (model.relative ? " relative" : "")
             << (model.valid ? " valid" : "")
             << (model.recursive ? " recursive" : "") << " assertion "
             << model.assertion;
}

std::string position_of(const Model& model) {
  return "zxnextf:" + std::to_string(model.assertion);
}

// Compares all that can be asked of a name with the model.
void expect_as_model(const std::string& text, bool is_dir) {
  const Model model = model_of(text, is_dir);
  if (model.assertion != 0) {
    SCOPED_TRACE(text);
    expect_assertion_at([&] { zxPath(text.c_str(), is_dir); },
                        position_of(model));
    kit::with_failures_dropped([&] { zxPath(text.c_str(), is_dir); });
    return;
  }
  EXPECT_EQ(taken_apart(text, is_dir), model) << text << ' ' << is_dir;
}

// ------------------------------------------------------- names taken apart --

TEST(zxnextf, names_come_apart_as_worked_out_by_hand) {
  const struct {
    const char* text;
    const char* dir;
    const char* name;
    const char* server;
    int drive;
    const char* also;  // r relative, v valid, R recursive
  } rows[] = {
      {"a", "", "a", "", -1, "rv"},
      {"a\\b.txt", "a", "b.txt", "", -1, "rv"},
      {"a/b.txt", "a/", "b.txt", "", -1, "rv"},
      {"a\\b\\c", "a\\b", "c", "", -1, "rv"},
      {"a\\b\\", "a\\b", "", "", -1, "rv"},
      {"\\", "\\", "", "", -1, "v"},
      {"\\a", "\\", "a", "", -1, "v"},
      {"/", "/", "", "", -1, "v"},
      {"/a", "/", "a", "", -1, "v"},
      {"a/", "a/", "", "", -1, "rv"},
      {"a\\b/", "a\\b/", "", "", -1, "rv"},
      {"C:", "", "", "", 3, "r"},
      {"C:b.txt", "C:", "b.txt", "", 3, "rv"},
      {"c:\\", "c:\\", "", "", 3, "v"},
      {"z:\\a\\b", "z:\\a", "b", "", 26, "v"},
      {"A:/a", "A:/", "a", "", 1, "v"},
      {"1:a", "", "1:a", "", -1, "r"},
      {"\\\\srv", "", "", "srv", -1, "r"},
      {"\\\\srv\\", "\\\\srv", "", "srv", -1, "v"},
      {"\\\\srv\\share\\a", "\\\\srv\\share", "a", "srv", -1, "v"},
      {"\\\\srv/share", "\\\\srv/", "share", "srv", -1, "v"},
      {"//srv/share", "//srv/", "share", "", -1, ""},
      {"\\\\*.x", "", "", "*.x", -1, "r"},
      {"t\\\\*.txt", "t", "*.txt", "", -1, "rR"},
      {"t\\\\x.txt", "t", "x.txt", "", -1, "rR"},
      {"t\\\\", "t", "", "", -1, "rR"},
      {".\\\\*.x", ".", "*.x", "", -1, "rR"},
      {"C:\\\\*.x", "C:\\", "*.x", "", 3, ""},
      {"C:\\\\\\*.x", "C:\\", "*.x", "", 3, "R"},
      {"a//b", "a//", "b", "", -1, "r"},
      {"*", "", "*", "", -1, "r"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    const std::string_view also = row.also;
    const zxPath path{zxStr(row.text)};
    EXPECT_EQ(text_of(path.path), row.text);
    EXPECT_EQ(text_of(path.dir), row.dir);
    EXPECT_EQ(text_of(path.name), row.name);
    EXPECT_EQ(text_of(path.server), row.server);
    EXPECT_EQ(path.drive, row.drive);
    EXPECT_EQ(path.drive_letter, row.drive < 0 ? '\0' : '@' + row.drive);
    EXPECT_EQ(path.relative, also.find('r') != also.npos);
    EXPECT_EQ(path.recursive, also.find('R') != also.npos);
    EXPECT_EQ(path.valid, also.find('v') != also.npos);
  }
}

TEST(zxnextf, as_a_directory_a_name_has_no_last_component) {
  const zxPath path("C:\\a\\b", true);
  EXPECT_EQ(text_of(path.dir), "C:\\a\\b");
  EXPECT_EQ(text_of(path.name), "");
  EXPECT_FALSE(path.relative);
  EXPECT_TRUE(path.valid);
}

TEST(zxnextf, every_short_text_comes_apart_as_in_the_model) {
  for_all_texts("aC:\\/*.", 6, [](const std::string& text) {
    expect_as_model(text, false);
    expect_as_model(text, true);
  });
}

TEST(zxnextf, every_byte_comes_apart_as_in_the_model) {
  for (int byte = 0; byte < 256; ++byte) {
    const std::string c(1, static_cast<char>(byte));
    for (const std::string& text :
         {c, c + ":", c + ":\\", c + ":x", "\\\\" + c + "\\x", "a\\" + c,
          "a\\\\" + c, c + "\\a", c + c + "a", "C:" + c + "a"}) {
      expect_as_model(text, false);
      expect_as_model(text, true);
    }
  }
}

TEST(zxnextf, components_are_valid_up_to_214_bytes) {
  const std::string longest(214, 'x');
  const std::string too_long(215, 'x');
  for (const char* format :
       {"%", "C:%", "\\%", "\\\\srv\\%", "%\\", "a\\%", "%\\a", "a/%/b"}) {
    const std::string pattern = format;
    const std::size_t at = pattern.find('%');
    for (const std::string& component : {longest, too_long}) {
      const std::string text = std::string(pattern).replace(at, 1, component);
      for (const bool is_dir : {false, true}) {
        EXPECT_EQ(zxPath(str(text), is_dir).valid, component == longest)
            << format << ' ' << component.size();
        expect_as_model(text, is_dir);
      }
    }
  }
  // The server is no component, and each component counts for itself.
  EXPECT_TRUE(zxPath(str("\\\\" + too_long + "\\a")).valid);
  EXPECT_TRUE(zxPath(str(repeated(longest + "\\", 20))).valid);
}

TEST(zxnextf, random_long_names_come_apart_as_in_the_model) {
  const Names pieces = {"\\",
                        "\\",
                        "/",
                        "C:",
                        "a.b",
                        "\\\\",
                        "*",
                        "x",
                        "\"",
                        "<",
                        ">|",
                        "?",
                        " ",
                        "\xE0",
                        std::string(100, 'y'),
                        std::string(107, 'z'),
                        std::string(213, 'w'),
                        std::string(214, 'u')};
  std::mt19937 random(20);
  for (int i = 0; i < 30'000; ++i) {
    std::string text;
    for (auto count = random() % 8 + 1; count > 0; --count)
      text += pieces[random() % pieces.size()];
    expect_as_model(text, i % 2 == 0);
  }
}

TEST(zxnextf, an_empty_name_fails_an_assertion) {
  for (const bool is_dir : {false, true})
    expect_assertion_at([&] { zxPath("", is_dir); }, "zxnextf:93");
  expect_assertion_at([] { file_part(""); }, "zxnextf:93");
  expect_assertion_at([] { dir_part(""); }, "zxnextf:93");
  expect_assertion_at([] { path_relative(""); }, "zxnextf:93");
  kit::with_failures_dropped([] {
    const zxPath path("");
    EXPECT_EQ(text_of(path.dir) + text_of(path.name), "");
    EXPECT_FALSE(path.valid);
    EXPECT_FALSE(path.recursive);
    EXPECT_EQ(text_of(dir_part("")), "");
  });
}

TEST(zxnextf, trailing_backslashes_are_stripped_up_to_two) {
  const struct {
    const char* text;
    const char* left;
    int removed;
  } rows[] = {
      {"", "", 0},           {"a", "a", 0},           {"a\\", "a", 1},
      {"a\\\\", "a", 2},     {"\\", "\\", 0},         {"\\\\", "\\", 1},
      {"\\\\\\", "\\", 2},   {"C:", "C:", 0},         {"C:\\", "C:\\", 0},
      {"z:\\", "z:\\", 0},   {"C:\\\\", "C:\\", 1},   {"C:\\\\\\", "C:\\", 2},
      {"1:\\", "1:", 1},     {"C:/", "C:/", 0},       {"a/", "a/", 0},
      {"a\\/", "a\\/", 0},   {"a/\\", "a/", 1},       {"C:/\\", "C:/", 1},
      {"C:a\\", "C:a", 1},   {"CC:\\", "CC:", 1},     {"\\a\\", "\\a", 1},
      {"\\a\\\\", "\\a", 2}, {"\\\\s\\", "\\\\s", 1},
  };
  for (const auto& row : rows) {
    zxStr text(row.text);
    EXPECT_EQ(strip_slash(text), row.removed) << row.text;
    EXPECT_EQ(text_of(text), row.left);
  }
}

TEST(zxnextf, every_short_text_is_stripped_as_in_the_model) {
  for_all_texts("C:\\/", 6, [](const std::string& text) {
    const Stripped model = model_of_strip(text);
    SCOPED_TRACE(text);
    zxStr left = str(text);
    if (!model.asserts) {
      EXPECT_EQ(strip_slash(left), model.removed);
      EXPECT_EQ(text_of(left), model.text);
      return;
    }
    expect_assertion_at(
        [&] {
          zxStr stripped = str(text);
          strip_slash(stripped);
        },
        "zxnextf:261");
    kit::with_failures_dropped(
        [&] { EXPECT_EQ(strip_slash(left), model.removed); });
    EXPECT_EQ(text_of(left), model.text);
  });
}

TEST(zxnextf, stripping_leaves_the_sharers_alone) {
  zxStr text("folder\\\\");
  const zxStr other = text;
  EXPECT_EQ(strip_slash(text), 2);
  EXPECT_EQ(text_of(other), "folder\\\\");
}

TEST(zxnextf, the_parts_of_a_name_alone) {
  const struct {
    const char* text;
    const char* folder;
    const char* file;
    bool recursive;
  } rows[] = {
      {"a\\b.txt", "a\\", "b.txt", false},
      {"a/b.txt", "a\\", "b.txt", false},
      {"b.txt", "", "b.txt", false},
      {"C:b", "C:", "b", false},
      {"C:\\b", "C:\\", "b", false},
      {"\\b", "\\", "b", false},
      {"/b", "\\", "b", false},
      {"a\\", "a\\", "", false},
      {"t\\\\*.x", "t\\", "*.x", true},
      {"\\\\s\\h\\f", "\\\\s\\h\\", "f", false},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.text);
    EXPECT_EQ(text_of(file_part(row.text)), row.file);
    EXPECT_EQ(text_of(dir_part(row.text)), row.folder);
    zxStr dir("old");
    zxStr name("old");
    EXPECT_EQ(split_path(row.text, dir, name), row.recursive);
    EXPECT_EQ(text_of(name), row.file);
    EXPECT_EQ(text_of(with_slash(dir)), row.folder);
  }
}

TEST(zxnextf, a_name_is_split_into_itself) {
  zxStr text("a\\b\\\\c");
  zxStr name;
  EXPECT_TRUE(split_path(text, text, name));
  EXPECT_EQ(text_of(text) + "|" + text_of(name), "a\\b|c");
  zxStr again("d\\e");
  zxStr dir;
  EXPECT_FALSE(split_path(again, dir, again));
  EXPECT_EQ(text_of(dir) + "|" + text_of(again), "d|e");
}

TEST(zxnextf, whole_names_are_judged_as_directories) {
  const struct {
    const char* text;
    bool valid;
    bool relative;
  } rows[] = {
      {"a", true, true},           {"a\\b", true, true},
      {"a\\b\\", true, true},      {"a/b/", true, true},
      {"\\", true, false},         {"/a", true, false},
      {"C:", false, true},         {"C:\\", true, false},
      {"C:a", true, true},         {"\\\\srv", false, true},
      {"\\\\srv\\a", true, false}, {"a\\\\\\b", false, true},
      {"a*", false, true},         {"a\\b?", false, true},
      {"ab:c", false, true},       {"a\"", false, true},
      {"\\<", false, false},       {">", false, true},
      {"C:|", false, true},        {"a\\\\b", false, true},
      {"C:\\\\b", false, false},   {"C:\\a/\\b", false, false},
      {" ", true, true},           {".", true, true},
      {"..\\..", true, true},      {"\xE0\x01", true, true},
      {"a\\\\", false, true},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(path_valid(row.text), row.valid) << row.text;
    EXPECT_EQ(path_relative(row.text), row.relative) << row.text;
  }
  EXPECT_FALSE(path_valid(""));
}

TEST(zxnextf, parts_and_judgements_of_every_short_text_are_those_of_the_model) {
  for_all_texts("aC:\\/*", 5, [](const std::string& text) {
    const Model file = model_of(text, false);
    const Model folder = model_of(text, true);
    if (file.assertion != 0 || folder.assertion != 0) return;
    EXPECT_EQ(text_of(file_part(str(text))), file.name) << text;
    EXPECT_EQ(dir_part(str(text)), with_slash(str(file.dir))) << text;
    EXPECT_EQ(path_valid(str(text)), folder.valid) << text;
    EXPECT_EQ(path_relative(str(text)), folder.relative) << text;
  });
}

// ------------------------------------------------------- names put together --

std::string model_of_with_slash(const std::string& folder) {
  if (folder.empty()) return folder;
  if (folder.size() == 2 && begins_with_drive(folder)) return folder;
  const char last = folder[folder.size() - 1];
  if (last == '\\') return folder;
  if (last == '/') return folder.substr(0, folder.size() - 1) + "\\";
  return folder + "\\";
}

std::string model_of_join(const std::string& folder, const std::string& name) {
  const std::string start = model_of_with_slash(folder);
  if (name.empty() || name == ".") return start;
  if (name.size() >= 2 && name[0] == '.' && is_separator(name[1]))
    return start + name.substr(2);
  return start + name;
}

TEST(zxnextf, a_directory_gets_a_backslash_at_its_end) {
  const struct {
    const char* text;
    const char* expected;
  } rows[] = {
      {"", ""},           {"a", "a\\"},
      {"a\\", "a\\"},     {"a/", "a\\"},
      {"a\\\\", "a\\\\"}, {"/", "\\"},
      {"\\", "\\"},       {"C:", "C:"},
      {"c:", "c:"},       {"1:", "1:\\"},
      {"C:\\", "C:\\"},   {"C:/", "C:\\"},
      {"C:a", "C:a\\"},   {"xC:", "xC:\\"},
      {"a//", "a/\\"},    {"\\\\s", "\\\\s\\"},
      {".", ".\\"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(text_of(with_slash(row.text)), row.expected) << row.text;
}

TEST(zxnextf, a_directory_that_is_given_a_backslash_leaves_its_sharers_alone) {
  const zxStr text("folder/");
  const zxStr other = text;
  EXPECT_EQ(text_of(with_slash(text)), "folder\\");
  EXPECT_EQ(text_of(other), "folder/");
}

TEST(zxnextf, directory_and_name_are_joined) {
  const struct {
    const char* folder;
    const char* name;
    const char* expected;
  } rows[] = {
      {"a", "b", "a\\b"},
      {"a\\", "b", "a\\b"},
      {"a/", "b", "a\\b"},
      {"a", ".\\b", "a\\b"},
      {"a", "./b", "a\\b"},
      {"a", "", "a\\"},
      {"a", ".", "a\\"},
      {"", "b", "b"},
      {"", "", ""},
      {"", ".", ""},
      {"", ".\\b", "b"},
      {"C:", "x", "C:x"},
      {"C:\\", "x", "C:\\x"},
      {"a", "\\b", "a\\\\b"},
      {"a", "..", "a\\.."},
      {"a", "..\\b", "a\\..\\b"},
      {"a", ".b", "a\\.b"},
      {"a", ".\\", "a\\"},
      {"a", ".\\.\\b", "a\\.\\b"},
      {"a", "C:\\b", "a\\C:\\b"},
      {"a", "b/c", "a\\b/c"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << row.folder << " + " << row.name);
    const zxStr folder(row.folder);
    const zxStr name(row.name);
    EXPECT_EQ(text_of(path_join(folder, name)), row.expected);
    EXPECT_EQ(text_of(folder / name), row.expected);
    EXPECT_EQ(text_of(folder / row.name), row.expected);
    EXPECT_EQ(text_of(row.folder / name), row.expected);
    zxStr grown = folder;
    EXPECT_EQ(&(grown /= name), &grown);
    EXPECT_EQ(text_of(grown), row.expected);
    grown = folder;
    EXPECT_EQ(&(grown /= row.name), &grown);
    EXPECT_EQ(text_of(grown), row.expected);
    EXPECT_EQ(text_of(folder), row.folder);
  }
}

TEST(zxnextf, all_short_texts_are_joined_as_in_the_model) {
  Names texts;
  for_all_texts("C:\\/.", 3, [&](const std::string& t) { texts.push_back(t); });
  for (const std::string& folder : texts) {
    EXPECT_EQ(text_of(with_slash(str(folder))), model_of_with_slash(folder));
    for (const std::string& name : texts)
      EXPECT_EQ(text_of(path_join(str(folder), str(name))),
                model_of_join(folder, name))
          << folder << " + " << name;
  }
}

TEST(zxnextf, a_text_is_joined_with_itself) {
  zxStr text("a");
  text /= text;
  EXPECT_EQ(text_of(text), "a\\a");
  text /= text.c_str();
  EXPECT_EQ(text_of(text), "a\\a\\a\\a");
}

TEST(zxnextf, names_with_a_blank_are_quoted) {
  const struct {
    const char* text;
    const char* expected;
  } rows[] = {
      {"", ""},
      {"a", "a"},
      {" ", "\" \""},
      {"a b", "\"a b\""},
      {"C:\\My files\\x", "\"C:\\My files\\x\""},
      {"\"a b\"", "\"a b\""},
      {"\"a b", "\"\"a b\""},
      {"a b\"", "\"a b\"\""},
      {"\"", "\""},
      {"\"\"", "\"\""},
      {"a\tb", "a\tb"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(text_of(quote_path(row.text)), row.expected) << row.text;
}

// ------------------------------------------------------------ unique names --

// A folder whose next unique names are known, since time stands still.
class UniqueFolder {
 public:
  UniqueFolder() {
    zxStr name;
    EXPECT_TRUE(try_uniqfile(path(), "", name));
    const std::string text = text_of(file_part(name));
    tried = static_cast<std::uint32_t>(std::stoul(text.substr(3)));
  }

  zxStr path() const { return str(folder.path()); }
  const std::string& path_text() const { return folder.path(); }

  // The n-th name from now on, without and with the folder.
  std::string file(std::uint32_t n) const {
    return "tmp" + std::to_string((tried + n) % 99'991) + ".csv";
  }
  std::string name(std::uint32_t n) const {
    return folder.path() + "\\" + file(n);
  }

  void take(std::uint32_t first, std::uint32_t last) const {
    for (std::uint32_t n = first; n <= last; ++n)
      write_file(folder.file(file(n)), "taken");
  }

 private:
  const TempDir folder;
  const Ticks zero{0};
  std::uint32_t tried = 0;
};

TEST(zxnextf, a_unique_name_passes_over_29_taken_ones) {
  const UniqueFolder folder;
  folder.take(1, 29);
  zxStr name;
  EXPECT_TRUE(try_uniqfile(folder.path(), "csv", name));
  EXPECT_EQ(text_of(name), folder.name(30));
  EXPECT_EQ(names_in(folder.path_text()).size(), 29U);
}

TEST(zxnextf, thirty_taken_names_are_none) {
  const UniqueFolder folder;
  folder.take(1, 30);
  zxStr name;
  EXPECT_FALSE(try_uniqfile(folder.path(), "csv", name));
  EXPECT_EQ(text_of(name), folder.name(30));
  EXPECT_TRUE(try_uniqfile(folder.path(), "csv", name));
  EXPECT_EQ(text_of(name), folder.name(31));
}

TEST(zxnextf, names_in_a_missing_folder_cannot_be_judged) {
  const UniqueFolder folder;
  zxStr name;
  EXPECT_FALSE(try_uniqfile(folder.path() / "none", "csv", name));
  EXPECT_EQ(text_of(name), folder.path_text() + "\\none\\" + folder.file(30));
}

TEST(zxnextf, the_extension_of_a_unique_name) {
  const struct {
    const char* extension;
    const char* ending;
  } rows[] = {{nullptr, ".tmp"}, {"", ""}, {"a", ".a"}, {"a.", ".a"}};
  const TempDir folder;
  for (const auto& row : rows) {
    zxStr name;
    EXPECT_TRUE(try_uniqfile(str(folder.path()), row.extension, name));
    const std::string text = text_of(file_part(name));
    const std::size_t digits = text.find_first_not_of("0123456789", 3);
    EXPECT_EQ(text.substr(0, 3), "tmp");
    EXPECT_GT(std::min(digits, text.size()), 3U);
    EXPECT_EQ(digits == text.npos ? "" : text.substr(digits), row.ending);
  }
}

constexpr zxCreateNew k_ways_to_create[] = {&zxBFile::try_create_new,
                                            &zxBFile::try_create_private};

TEST(zxnextf, a_file_is_created_under_a_unique_name) {
  for (const zxCreateNew create : k_ways_to_create) {
    const UniqueFolder folder;
    folder.take(1, 3);
    zxBFile file;
    zxStr name;
    EXPECT_EQ(create_unique(file, create, folder.path(), "csv", name),
              zxUnique::created);
    EXPECT_EQ(text_of(name), folder.name(4));
    ASSERT_TRUE(file.is_open());
    EXPECT_EQ(file.name, name);
    file.puts("mine");
    EXPECT_TRUE(file.close());
    EXPECT_EQ(kit::read_file(folder.path_text() + "/" + folder.file(4)),
              "mine");
    EXPECT_EQ(kit::read_file(folder.path_text() + "/" + folder.file(3)),
              "taken");
  }
}

// Has the next files that are made turn out to be taken already.
class LostRaces {
 public:
  explicit LostRaces(int count) {
    left = count;
    zxplat::files.open = [](std::string_view name, zxplat::OpenMode mode) {
      if (left-- <= 0) return zxplat::system_files.open(name, mode);
      zxplat::set_last_error(zxplat::k_err_exists_on_create);
      return zxplat::k_no_fd;
    };
  }
  LostRaces(const LostRaces&) = delete;
  LostRaces& operator=(const LostRaces&) = delete;
  ~LostRaces() { zxplat::files.open = zxplat::system_files.open; }

 private:
  static inline int left = 0;
};

TEST(zxnextf, a_name_that_is_taken_in_between_is_left_to_the_other) {
  for (const int lost : {1, 29}) {
    const UniqueFolder folder;
    const LostRaces races(lost);
    zxBFile file;
    zxStr name;
    EXPECT_EQ(create_unique(file, &zxBFile::try_create_new, folder.path(),
                            "csv", name),
              zxUnique::created);
    const auto n = static_cast<std::uint32_t>(lost) + 1;
    EXPECT_EQ(text_of(name), folder.name(n));
    EXPECT_EQ(names_in(folder.path_text()), Names{folder.file(n)});
  }
}

// The number of files that are tried to be made, all of which fail.
struct Refusal {
  int error;
  int opened;
};

TEST(zxnextf, a_unique_file_that_cannot_be_created) {
  for (const Refusal& refusal :
       {Refusal{zxplat::k_err_exists_on_create, 30},
        Refusal{zxplat::k_err_denied, 1}, Refusal{zxplat::k_err_disk_full, 1},
        Refusal{zxplat::k_err_exists, 1}}) {
    const UniqueFolder folder;
    Faults faults;
    faults.fail_all(Call::open, refusal.error);
    zxBFile file;
    zxStr name;
    EXPECT_EQ(create_unique(file, &zxBFile::try_create_new, folder.path(),
                            "csv", name),
              zxUnique::not_created);
    EXPECT_EQ(faults.count(Call::open), refusal.opened);
    EXPECT_EQ(text_of(name),
              folder.name(static_cast<std::uint32_t>(refusal.opened)));
    EXPECT_EQ(zxplat::last_error(), refusal.error);
    EXPECT_FALSE(file.is_open());
    EXPECT_TRUE(names_in(folder.path_text()).empty());
  }
}

TEST(zxnextf, no_unique_name_means_no_file) {
  const UniqueFolder folder;
  folder.take(1, 30);
  const Faults faults;
  zxBFile file;
  zxStr name;
  EXPECT_EQ(
      create_unique(file, &zxBFile::try_create_new, folder.path(), "csv", name),
      zxUnique::no_name);
  EXPECT_EQ(text_of(name), folder.name(30));
  EXPECT_FALSE(file.is_open());
  EXPECT_EQ(faults.count(Call::open), 0);
}

TEST(zxnextf, a_unique_file_is_not_made_behind_a_link) {
  const UniqueFolder folder;
  const TempDir elsewhere;
  if (!kit::make_link(elsewhere.file("victim"),
                      folder.path_text() + "/" + folder.file(1)))
    GTEST_SKIP() << "a program cannot make links here";
  zxBFile file;
  zxStr name;
  EXPECT_EQ(
      create_unique(file, &zxBFile::try_create_new, folder.path(), "csv", name),
      zxUnique::created);
  EXPECT_EQ(text_of(name), folder.name(2));
  EXPECT_TRUE(names_in(elsewhere.path()).empty());
}

// ---------------------------------------------------------------- patterns --

// Every way to share out the bytes is tried.
bool fits(std::string_view pattern, std::string_view name) {
  if (pattern.empty()) return name.empty();
  if (pattern[0] == '*')
    return fits(pattern.substr(1), name) ||
           (!name.empty() && fits(pattern, name.substr(1)));
  if (name.empty()) return false;
  const bool is_same =
      pattern[0] == '?' || lower({pattern[0]}) == lower({name[0]});
  return is_same && fits(pattern.substr(1), name.substr(1));
}

bool model_of_match(const std::string& pattern, const std::string& name) {
  if (pattern.empty()) return false;
  return fits(pattern == "*.*" ? "*" : pattern, name);
}

TEST(zxnextf, names_that_patterns_stand_for) {
  const struct {
    const char* pattern;
    const char* name;
    bool expected;
  } rows[] = {
      {"*", "a", true},
      {"*", "", true},
      {"*", ".x", true},
      {"*.*", "noext", true},
      {"*.*", "a.b", true},
      {"*.*.*", "noext", false},
      {"*.*.*", "a.b.c", true},
      {"*.txt", "a.txt", true},
      {"*.txt", "A.TXT", true},
      {"*.TXT", "a.txt", true},
      {"*.txt", "a.txtx", false},
      {"*.txt", "txt", false},
      {"*.txt", ".txt", true},
      {"*.", "a", false},
      {"*.", "a.", true},
      {"a?c", "abc", true},
      {"a?c", "ac", false},
      {"a?", "a", false},
      {"?", "a", true},
      {"?", "", false},
      {"??", "\xE0\xE1", true},
      {"\xE0*", "\xE0x", true},
      {"\xC0", "\xE0", false},
      {"[", "{", false},
      {"@", "`", false},
      {"abc", "abc", true},
      {"abc", "ABC", true},
      {"abc", "abcd", false},
      {"abcd", "abc", false},
      {"", "", false},
      {"", "a", false},
      {"*a*b*", "xxaxxbxx", true},
      {"*a*b*", "xxbxxaxx", false},
      {"**", "abc", true},
      {"*?", "", false},
      {"*?*?", "ab", true},
      {"?*?", "a", false},
      {"*ab", "aab", true},
      {"*abab", "ababab", true},
      {"a*", "ba", false},
  };
  for (const auto& row : rows)
    EXPECT_EQ(name_matches(row.pattern, row.name), row.expected)
        << row.pattern << " and " << row.name;
}

TEST(zxnextf, all_short_patterns_fit_as_in_the_model) {
  Names names;
  for_all_texts("aB.", 4, [&](const std::string& t) { names.push_back(t); });
  for_all_texts("Ab.*?", 4, [&](const std::string& pattern) {
    for (const std::string& name : names)
      EXPECT_EQ(name_matches(pattern, name), model_of_match(pattern, name))
          << pattern << " and " << name;
  });
}

TEST(zxnextf, random_patterns_fit_as_in_the_model) {
  std::mt19937 random(7);
  const auto random_text = [&](const std::string& alphabet, unsigned longest) {
    std::string text;
    for (auto count = random() % (longest + 1); count > 0; --count)
      text += alphabet[random() % alphabet.size()];
    return text;
  };
  int fitting = 0;
  for (int i = 0; i < 100'000; ++i) {
    const std::string pattern = random_text("aAb.**?", 8);
    const std::string name = random_text("aBb.", 12);
    const bool expected = model_of_match(pattern, name);
    if (expected) ++fitting;
    EXPECT_EQ(name_matches(pattern, name), expected)
        << pattern << " and " << name;
  }
  EXPECT_GT(fitting, 5'000);
}

using Clock = std::chrono::steady_clock;

double seconds_since(Clock::time_point start) {
  return std::chrono::duration<double>(Clock::now() - start).count();
}

TEST(zxnextf, a_pattern_of_many_stars_takes_no_time) {
  const auto start = Clock::now();
  const std::string pattern = repeated("a*", 100) + "b";
  const std::string name(10'000, 'a');
  EXPECT_FALSE(name_matches(pattern, name));
  EXPECT_TRUE(name_matches(pattern, name + "b"));
  EXPECT_FALSE(name_matches(repeated("*a", 200) + "*b*a", name));
  EXPECT_FALSE(name_matches(repeated("*?", 200) + "b", name));
  EXPECT_LT(seconds_since(start), 5.0);
}

// ----------------------------------------------------------------- walking --

zxQVA<zxStr>& fill(zxQVA<zxStr>& list, const Names& specifications) {
  for (const std::string& text : specifications) list.append(str(text));
  return list;
}

Names texts_of(const zxQVA<zxStr>& list) {
  Names texts;
  for (const zxStr& text : list) texts.push_back(text_of(text));
  return texts;
}

// All names of a walk, in its order.
Names walk(const Names& specifications, bool with_dirs = false) {
  zxQVA<zxStr> list;
  fill(list, specifications);
  Names names;
  for (zxStr name; next_file(list, name, with_dirs);)
    names.push_back(text_of(name));
  EXPECT_EQ(list.length(), 0);
  return names;
}

// A specification, and what it stands for: the folder itself, how the names
// in it begin, and the pattern.
struct Specification {
  std::string text;
  std::string folder;
  std::string shown;
  std::string pattern;
  bool recursive = false;
};

void add_names(const fs::path& folder, const std::string& shown,
               const Specification& wanted, bool with_dirs, Names& names) {
  for (const auto& entry : fs::directory_iterator(folder)) {
    const std::string name = entry.path().filename().string();
    const bool is_folder = entry.is_directory();
    if ((!is_folder || with_dirs) && model_of_match(wanted.pattern, name))
      names.push_back(lower(shown + name));
    if (is_folder && wanted.recursive && !entry.is_symlink())
      add_names(entry.path(), shown + name + "\\", wanted, with_dirs, names);
  }
}

Names model_of_walk(const Specification& wanted, bool with_dirs) {
  Names names;
  add_names(wanted.folder, wanted.shown, wanted, with_dirs, names);
  return sorted(names);
}

// The folder that a walked name is in, with its backslash.
std::string folder_of(const std::string& name) {
  return name.substr(0, name.rfind('\\') + 1);
}

// A folder's names must come in one piece, followed by all those from below,
// one folder after the other.
void expect_folders_in_order(const Names& names) {
  Names above;  // the folders that are open, each inside the one ahead of it
  Names closed;
  for (const std::string& name : names) {
    const std::string folder = folder_of(name);
    while (!above.empty() && !folder.starts_with(above.back())) {
      closed.push_back(above.back());
      above.pop_back();
    }
    if (!above.empty() && above.back() == folder) continue;
    for (const std::string& other : closed)
      EXPECT_FALSE(folder.starts_with(other)) << "back in " << folder;
    for (const std::string& other : above) EXPECT_NE(folder, other);
    above.push_back(folder);
  }
}

// A thousand files in fifty folders, one in the other as chance has it.
// Names are in mixed case, and no two of them differ in case alone.
class Tree {
 public:
  Tree() {
    std::mt19937 random(50);
    folders.push_back(fs::path(root.path()) / "Top");
    fs::create_directory(folders[0]);
    for (int i = 1; i < 50; ++i) {
      const std::size_t parent = i < 12 ? folders.size() - 1  // a deep branch
                                        : random() % folders.size();
      folders.push_back(folders[parent] /
                        (k_folders[random() % 4] + number(i)));
      fs::create_directory(folders.back());
    }
    for (int i = 0; i < 1000; ++i) {
      const std::string name =
          k_stems[random() % 4] + number(i) + k_endings[random() % 6];
      const fs::path file = folders[random() % folders.size()] / name;
      write_file(file.string(), "");
    }
  }

  const std::string& path() const { return root.path(); }
  std::string top() const { return folders[0].string(); }

  // A folder in the deep branch, and its name with backslashes from the
  // tree's path on.
  std::string deep_folder() const { return folders[5].string(); }
  std::string deep_name() const {
    std::string name = deep_folder().substr(path().size() + 1);
    std::replace(name.begin(), name.end(), '/', '\\');
    return name;
  }

 private:
  static std::string number(int i) { return std::to_string(i); }

  static constexpr const char* k_folders[] = {"Sub", "lower", "UPPER", "x.txt"};
  static constexpr const char* k_stems[] = {"File", "a", "READ.me", "b c"};
  static constexpr const char* k_endings[] = {".txt", ".TXT", ".c",
                                              "",     ".",    ".txt.old"};
  const TempDir root;
  std::vector<fs::path> folders;
};

// Windows drops a dot at the end of a name when the file is made, and so it
// is missing in what the folder shows; both sides see that.
const Names k_patterns = {"*",     "*.*",    "*.txt", "*.TXT", "*.C",
                          "a*",    "?1*",    "*?",    "*me*",  "*.",
                          "s*b1?", "*7.txt", "none",  "none*"};

void expect_walk_as_model(const Specification& wanted) {
  for (const bool with_dirs : {false, true}) {
    SCOPED_TRACE(wanted.text + (with_dirs ? " and folders" : ""));
    const Names names = walk({wanted.text}, with_dirs);
    const Names expected = model_of_walk(wanted, with_dirs);
    if (expected.empty() && !wanted.recursive && wanted.pattern == "none") {
      EXPECT_EQ(names, Names{wanted.text});
      continue;
    }
    EXPECT_EQ(sorted(names), expected);
    expect_folders_in_order(names);
  }
}

// The walks for a folder by one name of it; `shown` is the folder as walked
// names show it.
void expect_walks_as_model(const std::string& name, const std::string& folder,
                           const std::string& shown) {
  for (const std::string& pattern : k_patterns) {
    expect_walk_as_model({name + pattern, folder, shown, pattern, false});
    if (name.ends_with('\\'))
      expect_walk_as_model(
          {name + "\\" + pattern, folder, shown, pattern, true});
  }
}

TEST(zxnextf, relative_walks_give_the_names_of_the_model) {
  const Tree tree;
  const WorkingIn there(tree.path());
  expect_walks_as_model("", ".", "");
  expect_walks_as_model(".\\", ".", ".\\");
  expect_walks_as_model("Top\\", "Top", "Top\\");
  expect_walks_as_model("tOP\\", "Top", "top\\");
  expect_walks_as_model("Top/", "Top", "top\\");
  expect_walks_as_model("Top\\..\\tOp\\", "Top", "top\\..\\top\\");
  expect_walks_as_model(tree.deep_name() + "\\", tree.deep_folder(),
                        tree.deep_name() + "\\");
}

TEST(zxnextf, absolute_walks_give_the_names_of_the_model) {
  const Tree tree;
  expect_walks_as_model(tree.path() + "\\", tree.path(), tree.path() + "\\");
  expect_walks_as_model(tree.path() + "/", tree.path(), tree.path() + "\\");
  expect_walks_as_model(tree.path() + "/Top/", tree.top(),
                        tree.path() + "/top\\");
  expect_walks_as_model(tree.path() + "/Top\\", tree.top(),
                        tree.path() + "/top\\");
}

TEST(zxnextf, the_tree_of_these_tests_is_as_it_should_be) {
  const Tree tree;
  std::size_t folders = 0;
  std::size_t files = 0;
  for (const auto& entry : fs::recursive_directory_iterator(tree.path()))
    ++(entry.is_directory() ? folders : files);
  EXPECT_EQ(folders, 50U);
  EXPECT_EQ(files, 1000U);
  EXPECT_EQ(walk({tree.path() + "\\\\*"}).size(), 1000U);
  EXPECT_EQ(walk({tree.path() + "\\\\*"}, true).size(), 1050U);
}

// Files of these names, empty, in a fresh folder that is the working one;
// a name that ends in a slash is a folder.
class Place {
 public:
  explicit Place(const Names& names) : there(folder.path()) {
    for (const std::string& name : names) {
      if (name.ends_with('/'))
        fs::create_directories(name.substr(0, name.size() - 1));
      else
        write_file(name, "");
    }
  }
  const std::string& path() const { return folder.path(); }

 private:
  const TempDir folder;
  const WorkingIn there;
};

TEST(zxnextf, a_plain_name_comes_back_as_it_is) {
  const Place place({"There.TXT", "Folder/"});
  for (const char* name :
       {"There.TXT", "THERE.txt", "None.TXT", "Folder", "Folder\\", "No/Such",
        "NoSuch\\x", "C:", "C:\\", "\\\\Srv", "Folder/None", "."}) {
    EXPECT_EQ(walk({name}), Names{name});
    EXPECT_EQ(walk({name}, true), Names{name});
  }
}

TEST(zxnextf, a_pattern_without_a_match_is_no_name) {
  const Place place({"there.txt", "folder/"});
  for (const char* pattern :
       {"none*", "*.none", "folder\\*", "nofolder\\*", "nofolder\\\\*",
        "nofolder\\\\x", "folder\\\\there.txt", "no*folder\\x", "fold?r\\x",
        "there.txt\\*", "there.txt\\\\*", "\\\\*.txt", "folder\\\\", "?"})
    EXPECT_EQ(walk({pattern}), Names()) << pattern;
  zxQVA<zxStr> none;
  zxStr name("old");
  EXPECT_FALSE(next_file(none, name));
}

TEST(zxnextf, empty_specifications_are_skipped) {
  const Place place({"a.x"});
  EXPECT_EQ(walk({"", "One", "", "", "none*", "", "*.x", "", "Two", ""}),
            (Names{"One", "a.x", "Two"}));
  EXPECT_EQ(walk({"", "", ""}), Names());
}

TEST(zxnextf, matched_names_are_in_lower_case_and_so_is_their_folder) {
  const Place place(
      {"FOLDER/", "FOLDER/Sub/", "FOLDER/FILE.TXT", "FOLDER/Sub/\xC0\xE0.TXT"});
  EXPECT_EQ(
      walk({"FOLDER\\FILE.TXT", "FOLDER\\F*", "FOLDER\\\\FILE.TXT"}),
      (Names{"FOLDER\\FILE.TXT", "folder\\file.txt", "folder\\file.txt"}));
}

TEST(zxnextf, folders_come_only_if_wanted) {
  const Place place({"a/", "b", "a/c/"});
  EXPECT_EQ(walk({"*"}), Names{"b"});
  EXPECT_EQ(sorted(walk({"*"}, true)), (Names{"a", "b"}));
  EXPECT_EQ(walk({"a\\*"}), Names());
  EXPECT_EQ(walk({"a\\*"}, true), Names{"a\\c"});
  EXPECT_EQ(sorted(walk({".\\\\*"}, true)), (Names{".\\a", ".\\a\\c", ".\\b"}));
}

TEST(zxnextf, two_backslashes_stand_for_all_folders_below) {
  const Place place(
      {"t/", "t/u/", "t/u/v/", "t/x", "t/u/x", "t/u/v/x", "x", "t/u/v/y"});
  EXPECT_EQ(walk({"t\\\\x"}), (Names{"t\\x", "t\\u\\x", "t\\u\\v\\x"}));
  EXPECT_EQ(walk({"t\\\\y"}), Names{"t\\u\\v\\y"});
  EXPECT_EQ(walk({".\\\\x"}),
            (Names{".\\x", ".\\t\\x", ".\\t\\u\\x", ".\\t\\u\\v\\x"}));
  EXPECT_EQ(walk({"t\\x", "t\\\\x", "x"}),
            (Names{"t\\x", "t\\x", "t\\u\\x", "t\\u\\v\\x", "x"}));
}

TEST(zxnextf, what_is_still_to_do_stands_in_the_list) {
  const Place place({"t/", "t/u/", "t/X", "t/u/x"});
  zxQVA<zxStr> list;
  fill(list, {"t\\\\*", "Last"});
  zxStr name;
  EXPECT_TRUE(next_file(list, name, true));
  Names names = {text_of(name)};
  Names rest = texts_of(list);
  ASSERT_EQ(rest.size(), 3U);
  names.push_back(rest[0]);
  EXPECT_EQ(sorted(names), (Names{"t\\u", "t\\x"}));
  EXPECT_EQ(rest[1], "t\\u\\\\*");
  EXPECT_EQ(rest[2], "Last");
  EXPECT_TRUE(next_file(list, name, true));
  EXPECT_TRUE(next_file(list, name, true));
  EXPECT_EQ(text_of(name), "t\\u\\x");
  EXPECT_EQ(texts_of(list), Names{"Last"});
}

TEST(zxnextf, a_caller_may_add_to_the_list_in_the_middle) {
  const Place place({"a1", "a2"});
  zxQVA<zxStr> list;
  fill(list, {"a*"});
  zxStr name;
  EXPECT_TRUE(next_file(list, name));
  list.append("Behind");
  Names names = {text_of(name)};
  while (next_file(list, name)) names.push_back(text_of(name));
  EXPECT_EQ(names.size(), 3U);
  EXPECT_EQ(names[2], "Behind");
}

TEST(zxnextf, too_many_backslashes_in_a_specification_fail_an_assertion) {
  const Place place({"a/", "a/x"});
  for (const char* text : {"a\\\\\\x", "a\\\\\\", "\\\\\\\\x"}) {
    SCOPED_TRACE(text);
    expect_assertion_at(
        [&] {
          zxQVA<zxStr> list;
          list.append(text);
          zxStr name;
          next_file(list, name);
        },
        "zxnextf:261");
    kit::with_failures_dropped([&] { walk({text}); });
  }
}

TEST(zxnextf, names_that_differ_in_case_alone_come_once) {
  const Place place(
      {"Same.x", "SAME.x", "same.x", "other.x", "sub/", "sub/SAME.X"});
  EXPECT_EQ(sorted(walk({"*.x"})), (Names{"other.x", "same.x"}));
  EXPECT_EQ(sorted(walk({".\\\\same.x"})),
            (Names{".\\same.x", ".\\sub\\same.x"}));
}

TEST(zxnextf, folders_that_differ_in_case_alone_are_entered_once) {
  const Place place({"t/", "t/Sub/", "t/SUB/", "t/SUB/x"});
  EXPECT_EQ(walk({"t\\\\x"}), Names{"t\\sub\\x"});
}

TEST(zxnextf, entries_that_have_no_name_here_are_left_out) {
  if (kit::on_windows()) GTEST_SKIP() << "the system has no such names";
  const Place place({"good", "a*b", "a?b", "a:b", "a\\b", "a\"b", "a<b", "a>b",
                     "a|b", "st*r/", "st*r/x", "a b", "nul"});
  EXPECT_EQ(sorted(walk({"*"}, true)), (Names{"a b", "good"}));
  EXPECT_EQ(sorted(walk({".\\\\*"}, true)), (Names{".\\a b", ".\\good"}));
}

TEST(zxnextf, a_walk_never_leaves_a_folder_through_a_link) {
  const Place place({"t/", "t/in/", "t/in/x", "out/", "out/x"});
  const std::string root = place.path();
  if (!kit::make_link(root + "/t", "t/in/up") ||
      !kit::make_link(root + "/t/in", "t/side") ||
      !kit::make_link(root + "/out", "t/away") ||
      !kit::make_link(".", "t/self"))
    GTEST_SKIP() << "a program cannot make links here";
  EXPECT_EQ(walk({"t\\\\*"}), Names{"t\\in\\x"});
  EXPECT_EQ(sorted(walk({"t\\\\*"}, true)),
            (Names{"t\\away", "t\\in", "t\\in\\up", "t\\in\\x", "t\\self",
                   "t\\side"}));
  EXPECT_EQ(walk({"t\\*"}), Names());
  // One that is named is followed.
  EXPECT_EQ(walk({"t\\away\\*"}), Names{"t\\away\\x"});
  EXPECT_EQ(walk({"t\\side\\\\*"}), Names{"t\\side\\x"});
  EXPECT_EQ(walk({"t\\in\\up\\in\\*"}), Names{"t\\in\\up\\in\\x"});
}

TEST(zxnextf, a_link_to_a_file_is_a_file) {
  const Place place({"target"});
  if (!kit::make_link("target", "link.x") || !kit::make_link("none", "gone.x"))
    GTEST_SKIP() << "a program cannot make links here";
  EXPECT_EQ(sorted(walk({"*.x"})), (Names{"gone.x", "link.x"}));
}

TEST(zxnextf, walked_names_can_be_opened_whatever_their_case_on_the_disk) {
  const Place place({"UPPER/", "UPPER/Deep.Er/", "lower/"});
  const Names files = {"UPPER/FILE.TXT", "UPPER/Deep.Er/MiXeD", "lower/plain",
                       "lower/CAPS"};
  for (const std::string& file : files) write_file(file, lower(file));
  const Names names = walk({".\\\\*"});
  EXPECT_EQ(names.size(), files.size());
  for (const std::string& name : names) {
    zxBFile file;
    ASSERT_TRUE(file.open(str(name))) << name;
    zxStr bytes;
    file.gets(bytes);
    std::string expected = name.substr(2);
    std::replace(expected.begin(), expected.end(), '\\', '/');
    EXPECT_EQ(text_of(bytes), expected);
  }
}

TEST(zxnextf, all_names_of_a_walk_are_added_to_an_array) {
  const Place place({"a.x", "t/", "t/b.x", "t/c.x"});
  zxQVA<zxStr> list;
  zxQVA<zxStr> names;
  names.append("before");
  all_files_of(fill(list, {"Plain", "*.x", "t\\\\*", "none*"}), names);
  EXPECT_EQ(list.length(), 0);
  Names texts = texts_of(names);
  ASSERT_EQ(texts.size(), 5U);
  std::sort(texts.begin() + 3, texts.end());
  EXPECT_EQ(texts, (Names{"before", "Plain", "a.x", "t\\b.x", "t\\c.x"}));
  all_files_of(list, names);
  EXPECT_EQ(names.length(), 5);
}

TEST(zxnextf, a_folder_of_many_files_is_walked_in_no_time) {
  const Place place({});
  // Where names do not tell case apart, making many files takes its time.
  const int files = kit::on_windows() ? 4'000 : 20'000;
  for (int i = 0; i < files; ++i)
    write_file((i % 2 == 0 ? "LARGE" : "small") + std::to_string(i), "");
  const auto start = Clock::now();
  const auto count = static_cast<std::size_t>(files);
  EXPECT_EQ(walk({"*"}).size(), count);
  EXPECT_EQ(walk({".\\\\large*"}).size(), count / 2);
  EXPECT_EQ(walk({"*none"}), Names());
  EXPECT_LT(seconds_since(start), 10.0);
}

TEST(zxnextf_slow, a_long_list_of_patterns_is_walked_within_seconds) {
  const Place place({"a1", "a2", "a3"});
  const Names specifications(60'000, "a*");
  const auto start = Clock::now();
  EXPECT_EQ(walk(specifications).size(), 180'000U);
  EXPECT_LT(seconds_since(start), 12.0);
}

// ------------------------------------------------------------- open_next --

ZX_CASE(zxnextf_opens_one_after_the_other) {
  init_zxlib_args(argc, argv);
  zxQVA<zxStr> list;
  fill(list,
       {"None.TXT", "one", "no*match", "folder", "", "t\\\\*.x", "NO\\x"});
  zxBFile file;
  while (open_next(file, list)) {
    zxStr text;
    file.gets(text);
    oprint("# # ", file.get_name(), text);
  }
  oprint(file.is_open() ? "open" : "closed");
  return 0;
}

TEST(zxnextf, files_are_opened_one_after_the_other_and_the_others_reported) {
  const Place place({"folder/", "t/", "t/u/"});
  write_file("one", "1");
  write_file("t/Two.X", "2");
  write_file("t/u/three.x", "3");
  kit::ProcessOptions options;
  options.directory = place.path();
  const kit::ProcessResult result =
      kit::run_case("zxnextf_opens_one_after_the_other", {}, options);
  EXPECT_EQ(result.exit_code, 0);
  EXPECT_EQ(result.out, "one 1 t\\two.x 2 t\\u\\three.x 3 closed");
  EXPECT_EQ(result.err,
            "Can't open file None.TXT\r\nCan't open file folder\r\n"
            "Can't open file NO\\x\r\n");
}

ZX_CASE(zxnextf_fails_to_close) {
  kit::start();
  Faults faults;
  zxBFile file;
  file.create("written");
  file.puts("x");
  faults.fail_nth(Call::close, 1, zxplat::k_err_io);
  zxQVA<zxStr> list;
  list.append("other");
  open_next(file, list);
  return 0;
}

TEST(zxnextf, a_file_that_cannot_be_closed_ends_the_process) {
  const kit::Outcome outcome = kit::outcome_of("zxnextf_fails_to_close");
  kit::expect_end(outcome.process,
                  kit::screen("1010: close: 'written' failed",
                              "[1010-1010-0/31-0/31/written/]"));
}

TEST(zxnextf, behind_a_dropped_failure_to_close_the_next_file_is_open) {
  const Place place({"next"});
  zxBFile file;
  file.create("written");
  zxQVA<zxStr> list;
  fill(list, {"next"});
  Faults faults;
  faults.fail_nth(Call::close, 1);
  kit::with_failures_dropped([&] { EXPECT_TRUE(open_next(file, list)); });
  EXPECT_EQ(text_of(file.name), "next");
  EXPECT_FALSE(open_next(file, list));
  EXPECT_FALSE(file.is_open());
}

// Notes the size of each read.
class ReadSizes {
 public:
  ReadSizes() {
    sizes.clear();
    zxplat::files.read = [](zxplat::Fd fd, void* buffer, std::size_t size) {
      sizes.push_back(size);
      return zxplat::system_files.read(fd, buffer, size);
    };
  }
  ReadSizes(const ReadSizes&) = delete;
  ReadSizes& operator=(const ReadSizes&) = delete;
  ~ReadSizes() { zxplat::files.read = zxplat::system_files.read; }

  static inline std::vector<std::size_t> sizes;
};

TEST(zxnextf, an_opened_file_is_read_in_large_pieces) {
  const Place place({});
  write_file("large", std::string(16'384, 'x'));
  zxQVA<zxStr> list;
  fill(list, {"large"});
  zxBFile file;
  const ReadSizes reads;
  ASSERT_TRUE(open_next(file, list));
  int bytes = 0;
  while (file.getc() != -1) ++bytes;
  EXPECT_EQ(bytes, 16'384);
  ASSERT_EQ(ReadSizes::sizes.size(), 2U);
  EXPECT_GE(ReadSizes::sizes[0], 16'384U);
}

}  // namespace
