// floors_test.cpp - tests of the sources themselves, as the environment
// variable ZX_SOURCE_DIR tells where they are: who includes whom, system
// headers, the shape of headers.

#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include "kit/tempdir.h"

namespace {

namespace fs = std::filesystem;

// -------------------------------------------------------------- the rules --

// A module includes modules of its own floor and of floors below it.  zxvar
// stands above the others of its floor, which none of them may know.
constexpr double k_platform = -1;
constexpr double k_ground = 0;
constexpr double k_programs = 8;
const std::map<std::string, double> k_floors = {
    {"zxplat", k_platform},
    {"zxmisc", 0},
    {"zxatsys", 0},
    {"zxstkdmp", 0},
    {"zxle", 0},
    {"zxtext", 0},
    {"zxguid", 0},
    {"zxstr", 1},
    {"zxqva", 1},
    {"zxaa", 1},
    {"zxfile", 2},
    {"zxbfile", 2},
    {"zxsys2", 2},
    {"zxnextf", 2},
    {"zxisfile", 2},
    {"zxistr", 2},
    {"zxdate", 2},
    {"zxdate2", 2},
    {"zxtime", 2},
    {"zxsfmt", 3},
    {"zxregexc", 3},
    {"zxregexe", 3},
    {"zxstrm", 3},
    {"zxstrm2", 3},
    {"zxp2l", 3},
    {"zxstr2", 3},
    {"zxvar", 3.5},
    {"zxmainf", 4},
    {"zxpkg", 4},
    {"zxusage", 4},
    {"zxlogf", 5},
    {"zxconf", 5},
    {"zxpack", 5},
    {"zxlang", 5},
    {"zxexprv3", 6},
    {"zxvarobj", 6},
    {"zxcea", 6},
    {"zxzxl", 7},
};

// Modules that make up one engine share their private headers.
const std::set<std::string> k_pattern_engine = {"zxregexc", "zxregexe",
                                                "zxstrm", "zxstrm2"};

// All others in angle brackets are headers of a system, or no part of the
// language any more; but for that of the processor, which both targets share.
const std::set<std::string> k_standard_headers = {
    "algorithm",
    "any",
    "array",
    "atomic",
    "barrier",
    "bit",
    "bitset",
    "cassert",
    "cctype",
    "cerrno",
    "cfenv",
    "cfloat",
    "charconv",
    "chrono",
    "cinttypes",
    "climits",
    "clocale",
    "cmath",
    "compare",
    "complex",
    "concepts",
    "condition_variable",
    "coroutine",
    "csetjmp",
    "csignal",
    "cstdarg",
    "cstddef",
    "cstdint",
    "cstdio",
    "cstdlib",
    "cstring",
    "ctime",
    "cuchar",
    "cwchar",
    "cwctype",
    "deque",
    "emmintrin.h",
    "exception",
    "execution",
    "filesystem",
    "format",
    "forward_list",
    "fstream",
    "functional",
    "future",
    "initializer_list",
    "iomanip",
    "ios",
    "iosfwd",
    "iostream",
    "istream",
    "iterator",
    "latch",
    "limits",
    "list",
    "locale",
    "map",
    "memory",
    "memory_resource",
    "mutex",
    "new",
    "numbers",
    "numeric",
    "optional",
    "ostream",
    "queue",
    "random",
    "ranges",
    "ratio",
    "regex",
    "scoped_allocator",
    "semaphore",
    "set",
    "shared_mutex",
    "source_location",
    "span",
    "sstream",
    "stack",
    "stdexcept",
    "stop_token",
    "streambuf",
    "string",
    "string_view",
    "syncstream",
    "system_error",
    "thread",
    "tuple",
    "type_traits",
    "typeindex",
    "typeinfo",
    "unordered_map",
    "unordered_set",
    "utility",
    "valarray",
    "variant",
    "vector",
    "version",
};

// The library has its own string, containers and streams.
const std::set<std::string> k_replaced_headers = {
    "deque",   "forward_list", "fstream", "iomanip",       "ios",
    "iosfwd",  "iostream",     "istream", "list",          "map",
    "ostream", "queue",        "regex",   "set",           "sstream",
    "stack",   "streambuf",    "string",  "unordered_map", "unordered_set",
    "vector",
};

// -------------------------------------------------------- reading sources --

struct Source {
  std::string folder;  // "zxlib", "hvl"; "obautil" or "tests" for all below
  std::string name;    // with the ending
  std::string text;
};

std::string stem_of(const std::string& name) {
  return name.substr(0, name.find('.'));
}

bool is_header(const std::string& name) { return name.ends_with(".h"); }

bool is_private(const std::string& name) { return name.ends_with("_impl.h"); }

// The module of a source of the library: its stem, or what stands ahead of
// an underscore in it; empty if there is no such module.
std::string module_of(const std::string& name) {
  for (std::string word = stem_of(name); !word.empty();) {
    if (k_floors.contains(word)) return word;
    const std::size_t cut = word.rfind('_');
    word = cut == std::string::npos ? "" : word.substr(0, cut);
  }
  return "";
}

std::string without_comments(const std::string& text) {
  std::string code;
  for (std::size_t i = 0; i < text.size();) {
    if (text.compare(i, 2, "//") == 0) {
      i = std::min(text.find('\n', i), text.size());
    } else if (text.compare(i, 2, "/*") == 0) {
      const std::size_t end = text.find("*/", i);
      i = end == std::string::npos ? text.size() : end + 2;
    } else {
      code += text[i++];
    }
  }
  return code;
}

std::vector<std::string> lines_of(const std::string& text) {
  std::vector<std::string> lines;
  std::istringstream in(text);
  for (std::string line; std::getline(in, line);) {
    if (line.ends_with('\r')) line.pop_back();
    lines.push_back(line);
  }
  return lines;
}

// The directives of the preprocessor without blanks around the "#".
std::vector<std::string> directives_of(const std::string& text) {
  std::vector<std::string> directives;
  for (std::string line : lines_of(without_comments(text))) {
    line.erase(0, line.find_first_not_of(" \t"));
    if (!line.starts_with('#')) continue;
    line.erase(0, line.find_first_not_of(" \t", 1));
    while (line.ends_with(' ')) line.pop_back();
    directives.push_back(line);
  }
  return directives;
}

// What is included between these two marks, as in <span> or "zxstr.h".
std::vector<std::string> included(const Source& source, char open, char close) {
  std::vector<std::string> names;
  for (const std::string& directive : directives_of(source.text)) {
    if (!directive.starts_with("include")) continue;
    const std::size_t from = directive.find(open);
    const std::size_t to = directive.find(close, from + 1);
    if (from == std::string::npos || to == std::string::npos) continue;
    names.push_back(directive.substr(from + 1, to - from - 1));
  }
  return names;
}

// ------------------------------------------------------- checking sources --

// What is wrong, one text for each finding.
using Findings = std::vector<std::string>;

class Checker {
 public:
  explicit Checker(const std::vector<Source>& all) : sources(all) {
    for (const Source& source : sources)
      if (is_header(source.name)) folder_of[source.name] = source.folder;
  }

  Findings floors() {
    findings.clear();
    for (const Source& source : sources) {
      if (source.folder == "zxlib" && module_of(source.name).empty())
        found(source, "has no floor");
      for (const std::string& name : included(source, '"', '"'))
        check_include(source, name);
    }
    return findings;
  }

  Findings systems() {
    findings.clear();
    for (const Source& source : sources) {
      if (is_of_platform(source)) continue;
      for (const std::string& name : included(source, '<', '>'))
        check_system_header(source, name);
      for (const std::string& directive : directives_of(source.text))
        check_condition(source, directive);
    }
    return findings;
  }

  Findings header_shapes() {
    findings.clear();
    for (const Source& source : sources)
      if (is_header(source.name)) check_header(source);
    return findings;
  }

 private:
  void found(const Source& source, const std::string& what) {
    findings.push_back(source.folder + "/" + source.name + " " + what);
  }

  static double floor_of(const std::string& folder, const std::string& name) {
    if (folder == "obautil") return k_programs;
    const auto floor = k_floors.find(module_of(name));
    return floor == k_floors.end() ? k_programs : floor->second;
  }

  void check_include(const Source& source, const std::string& name) {
    const auto folder = folder_of.find(name);
    if (folder == folder_of.end())
      return found(source, "includes the unknown " + name);
    const bool allowed =
        source.folder == "obautil" ||
        (folder->second == "zxlib" && is_below(source, name)) ||
        (source.folder == "hvl" && folder->second == "hvl");
    if (!allowed) found(source, "must not know " + name);
    if (is_private(name) && !is_of_one_module(source, folder->second, name))
      found(source, "includes the private " + name);
  }

  // Storage stands on the ground floor alone.
  static bool is_below(const Source& source, const std::string& name) {
    const double floor = floor_of("zxlib", name);
    if (source.folder == "hvl") return floor == k_ground;
    return floor <= floor_of(source.folder, source.name);
  }

  static bool is_of_one_module(const Source& source, const std::string& folder,
                               const std::string& header) {
    if (source.folder != folder) return false;
    const std::string owner = folder == "zxlib"
                                  ? module_of(header)
                                  : header.substr(0, header.rfind("_impl.h"));
    if (k_pattern_engine.contains(owner) &&
        k_pattern_engine.contains(module_of(source.name)))
      return true;
    return stem_of(source.name) == owner ||
           source.name.starts_with(owner + "_");
  }

  static bool is_of_platform(const Source& source) {
    if (source.folder == "zxlib") return source.name.starts_with("zxplat_");
    return source.folder == "tests" && (source.name.ends_with("_posix.cpp") ||
                                        source.name.ends_with("_win32.cpp"));
  }

  void check_system_header(const Source& source, const std::string& name) {
    const bool of_tests = source.folder == "tests";
    const bool tool =
        name.starts_with("gtest/") || name.starts_with("sanitizer/");
    if (!k_standard_headers.contains(name) && !(of_tests && tool))
      found(source, "includes the system's <" + name + ">");
    if (of_tests) return;
    if (k_replaced_headers.contains(name))
      found(source, "includes <" + name + ">, for which we have our own");
    if (name == "cstdio" && source.folder != "obautil")
      found(source, "includes <cstdio>, for which we have our own");
  }

  // The compiler's names for systems, in any condition.
  void check_condition(const Source& source, const std::string& directive) {
    if (!directive.starts_with("if") && !directive.starts_with("elif")) return;
    for (const char* word :
         {"WIN32", "WIN64", "MINGW", "linux", "unix", "__APPLE__", "_MSC_VER"})
      if (directive.find(word) != std::string::npos)
        return found(source, "asks for the system: #" + directive);
  }

  void check_header(const Source& source) {
    const std::vector<std::string> lines = lines_of(source.text);
    if (!source.text.starts_with("// " + source.name + " - "))
      found(source, "does not begin with its name and what it is");
    std::string guard = stem_of(source.name) + "_H";
    for (char& byte : guard)
      byte = static_cast<char>(std::toupper(static_cast<unsigned char>(byte)));
    const std::vector<std::string> directives = directives_of(source.text);
    const bool guarded =
        directives.size() >= 3 && directives[0] == "ifndef " + guard &&
        directives[1] == "define " + guard && directives.back() == "endif" &&
        !lines.empty() && lines.back() == "#endif  // " + guard;
    if (!guarded) found(source, "has no include guard " + guard);
  }

  std::vector<Source> sources;
  std::map<std::string, std::string> folder_of;  // of headers
  Findings findings;
};

// ------------------------------------------------------- the real sources --

std::string source_dir() {
  const char* folder = std::getenv("ZX_SOURCE_DIR");
  return folder != nullptr ? folder : "";
}

std::vector<Source> sources_in(const std::vector<std::string>& folders) {
  std::vector<Source> sources;
  for (const std::string& folder : folders) {
    for (const auto& entry :
         fs::recursive_directory_iterator(source_dir() + "/" + folder)) {
      const std::string name = entry.path().filename().string();
      if (!is_header(name) && !name.ends_with(".cpp")) continue;
      sources.push_back({folder, name, kit::read_file(entry.path().string())});
    }
  }
  return sources;
}

std::vector<Source> real_sources() {
  return sources_in({"zxlib", "hvl", "obautil"});
}

std::string joined(const Findings& findings) {
  std::string text;
  for (const std::string& finding : findings) text += finding + "\n";
  return text;
}

constexpr char k_no_sources[] =
    "ZX_SOURCE_DIR does not tell where the sources are";

TEST(floors, all_folders_are_read) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  const std::vector<Source> sources = real_sources();
  for (const char* name : {"zxstr.h", "zxplat.h", "hvldec.h", "vtx2csv.cpp"})
    EXPECT_EQ(std::count_if(sources.begin(), sources.end(),
                            [&](const Source& s) { return s.name == name; }),
              1)
        << name;
}

TEST(floors, modules_know_their_own_floor_and_those_below) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  EXPECT_EQ(joined(Checker(real_sources()).floors()), "");
}

TEST(floors, the_system_is_known_to_the_platform_line_alone) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  EXPECT_EQ(joined(Checker(real_sources()).systems()), "");
}

TEST(floors, the_system_is_known_to_the_kit_alone_among_the_tests) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  EXPECT_EQ(joined(Checker(sources_in({"tests"})).systems()), "");
}

TEST(floors, headers_say_what_they_are_and_are_guarded) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  EXPECT_EQ(joined(Checker(real_sources()).header_shapes()), "");
}

// An include gives a name alone.
TEST(floors, no_two_headers_have_one_name) {
  if (source_dir().empty()) GTEST_SKIP() << k_no_sources;
  std::set<std::string> names;
  for (const Source& source : real_sources()) {
    const bool is_new = names.insert(source.name).second;
    EXPECT_TRUE(is_new || !is_header(source.name)) << source.name;
  }
}

// ------------------------------------------------- the checker's own test --

// A small tree with all that is allowed, to which a test adds one source.
std::vector<Source> sound_tree() {
  const auto header = [](const char* folder, const std::string& stem,
                         const std::string& body) {
    std::string guard = stem + "_H";
    for (char& byte : guard)
      byte = static_cast<char>(std::toupper(static_cast<unsigned char>(byte)));
    return Source{folder, stem + ".h",
                  "// " + stem + ".h - what it is.\n#ifndef " + guard +
                      "\n#define " + guard + "\n" + body + "\n#endif  // " +
                      guard + "\n"};
  };
  return {
      header("zxlib", "zxplat", "#include <span>"),
      header("zxlib", "zxplat_posix_impl", "#include <unistd.h>"),
      header("zxlib", "zxmisc", "#include <array>"),
      header("zxlib", "zxatsys", "#include \"zxmisc.h\""),
      header("zxlib", "zxatsys_impl", ""),
      header("zxlib", "zxstr", "#include \"zxatsys.h\""),
      header("zxlib", "zxsfmt", "#include \"zxstr.h\""),
      header("zxlib", "zxvar", "#include \"zxsfmt.h\""),
      header("hvl", "hvldec", "#include \"zxatsys.h\""),
      header("obautil", "tool", "#include \"hvldec.h\"\n#include \"zxvar.h\""),
      {"zxlib", "zxatsys_messages.cpp", "#include \"zxatsys_impl.h\"\n"},
      {"zxlib", "zxplat_win32_files.cpp", "#ifdef _WIN32\n#include <io.h>\n"},
      {"zxlib", "zxmisc.cpp",
       "#include \"zxmisc.h\"\n#include \"zxatsys.h\"\n#include "
       "\"zxplat.h\"\n"},
      {"hvl", "hvldec.cpp", "#include \"hvldec.h\"\n#include <cmath>\n"},
      {"obautil", "tool.cpp", "#include \"tool.h\"\n#include <cstdio>\n"},
      {"tests", "files_win32.cpp", "#ifdef _WIN32\n#include <io.h>\n"},
      {"tests", "zxstr_test.cpp",
       "#include <gtest/gtest.h>\n#include <vector>\n"},
      {"zxlib", "zxstr.cpp",
       "// like #include <vector>\n/* #include <windows.h>\n#ifdef _WIN32 "
       "*/\n"},
  };
}

TEST(floors, the_checker_finds_nothing_in_a_sound_tree) {
  Checker checker(sound_tree());
  EXPECT_EQ(joined(checker.floors()), "");
  EXPECT_EQ(joined(checker.systems()), "");
  EXPECT_EQ(joined(checker.header_shapes()), "");
}

TEST(floors, the_checker_finds_each_fault) {
  const struct {
    Source source;
    std::string finding;
  } rows[] = {
      {{"zxlib", "zxmisc_a.cpp", "#include \"zxstr.h\"\n"},
       "zxlib/zxmisc_a.cpp must not know zxstr.h\n"},
      {{"zxlib", "zxstr_a.cpp", "#  include \"zxsfmt.h\"\n"},
       "zxlib/zxstr_a.cpp must not know zxsfmt.h\n"},
      {{"zxlib", "zxsfmt_a.cpp", "#include \"zxvar.h\"\n"},
       "zxlib/zxsfmt_a.cpp must not know zxvar.h\n"},
      {{"zxlib", "zxplat_posix.cpp", "#include \"zxmisc.h\"\n"},
       "zxlib/zxplat_posix.cpp must not know zxmisc.h\n"},
      {{"zxlib", "zxvar.cpp", "#include \"hvldec.h\"\n"},
       "zxlib/zxvar.cpp must not know hvldec.h\n"},
      {{"zxlib", "zxvar.cpp", "#include \"tool.h\"\n"},
       "zxlib/zxvar.cpp must not know tool.h\n"},
      {{"hvl", "hvldec_a.cpp", "#include \"zxstr.h\"\n"},
       "hvl/hvldec_a.cpp must not know zxstr.h\n"},
      {{"hvl", "hvldec_a.cpp", "#include \"zxplat.h\"\n"},
       "hvl/hvldec_a.cpp must not know zxplat.h\n"},
      {{"hvl", "hvldec_a.cpp", "#include \"tool.h\"\n"},
       "hvl/hvldec_a.cpp must not know tool.h\n"},
      {{"zxlib", "zxstr_a.cpp", "#include \"zxatsys_impl.h\"\n"},
       "zxlib/zxstr_a.cpp includes the private zxatsys_impl.h\n"},
      {{"zxlib", "zxstrm_a.cpp", "#include \"zxatsys_impl.h\"\n"},
       "zxlib/zxstrm_a.cpp includes the private zxatsys_impl.h\n"},
      {{"obautil", "tool_a.cpp", "#include \"zxatsys_impl.h\"\n"},
       "obautil/tool_a.cpp includes the private zxatsys_impl.h\n"},
      {{"zxlib", "zxstr_a.cpp", "#include \"other.h\"\n"},
       "zxlib/zxstr_a.cpp includes the unknown other.h\n"},
      {{"zxlib", "zxother.cpp", ""}, "zxlib/zxother.cpp has no floor\n"},
      {{"zxlib", "zxstrange.cpp", ""}, "zxlib/zxstrange.cpp has no floor\n"},
      {{"zxlib", "zxstr_a.cpp", "#include <windows.h>\n"},
       "zxlib/zxstr_a.cpp includes the system's <windows.h>\n"},
      {{"hvl", "hvldec_a.cpp", "# include <sys/stat.h> // x\n"},
       "hvl/hvldec_a.cpp includes the system's <sys/stat.h>\n"},
      {{"obautil", "tool_a.cpp", "#include <unistd.h>\n"},
       "obautil/tool_a.cpp includes the system's <unistd.h>\n"},
      {{"zxlib", "zxstr_a.cpp", "#include <vector>\n"},
       "zxlib/zxstr_a.cpp includes <vector>, for which we have our own\n"},
      {{"zxlib", "zxstr_a.cpp", "#include <cstdio>\n"},
       "zxlib/zxstr_a.cpp includes <cstdio>, for which we have our own\n"},
      {{"obautil", "tool_a.cpp", "#ifdef _WIN32\n#endif\n"},
       "obautil/tool_a.cpp asks for the system: #ifdef _WIN32\n"},
      {{"zxlib", "zxstr_a.cpp", "#if defined(__linux__)\n#endif\n"},
       "zxlib/zxstr_a.cpp asks for the system: #if defined(__linux__)\n"},
      {{"tests", "zxstr_b_test.cpp", "#include <unistd.h>\n"},
       "tests/zxstr_b_test.cpp includes the system's <unistd.h>\n"},
      {{"tests", "zxstr_b_test.cpp", "#ifndef __unix__\n#endif\n"},
       "tests/zxstr_b_test.cpp asks for the system: #ifndef __unix__\n"},
      {{"hvl", "hvla.h", "// hvla.h - a.\n#pragma once\n"},
       "hvl/hvla.h has no include guard HVLA_H\n"},
      {{"hvl", "hvla.h",
        "// hvla.h - a.\n#ifndef HVLB_H\n#define HVLB_H\n#endif  // HVLB_H\n"},
       "hvl/hvla.h has no include guard HVLA_H\n"},
      {{"hvl", "hvla.h",
        "// hvla.h - a.\n#ifndef HVLA_H\n#define HVLA_H\n#endif\n"},
       "hvl/hvla.h has no include guard HVLA_H\n"},
      {{"hvl", "hvla.h",
        "// A.\n#ifndef HVLA_H\n#define HVLA_H\n#endif  // HVLA_H\n"},
       "hvl/hvla.h does not begin with its name and what it is\n"},
  };
  for (const auto& row : rows) {
    std::vector<Source> tree = sound_tree();
    tree.push_back(row.source);
    Checker checker(tree);
    EXPECT_EQ(joined(checker.floors()) + joined(checker.systems()) +
                  joined(checker.header_shapes()),
              row.finding);
  }
}

}  // namespace
