// zxusage.cpp - command-line options and the usage screen.
// Tests: tests/zxlib/zxusage_test.cpp.
#include "zxusage.h"

#include <cstdlib>
#include <string_view>

#include "zxmainf.h"
#include "zxpkg.h"
#include "zxplat.h"
#include "zxsfmt.h"

constinit zxSA<zxStr> g_opts;

namespace {

// What a parameter must look like.
enum class Kind : std::uint8_t {
  flag,  // nothing, "+" or "-"
  text,  // anything but nothing
};

bool is_valid(const zxStr& value, Kind kind) {
  if (kind == Kind::text) return !value.is_empty();
  return value.is_empty() || value == "+" || value == "-";
}

// The declared options.
struct Declared {
  zxSA<zxStr> names;  // each spelling to its canonical name
  zxSA<Kind> kinds;   // by canonical name
};

// Takes the text ahead of the next byte for which `is_end` holds off the
// front of `rest`, that byte included; pieces that are empty are skipped.
// Empty at the end.
template <class IsEnd>
std::string_view next_piece(std::string_view& rest, IsEnd is_end) {
  std::size_t start = 0;
  while (start < rest.size() && is_end(rest[start])) ++start;
  std::size_t end = start;
  while (end < rest.size() && !is_end(rest[end])) ++end;
  const std::string_view piece = rest.substr(start, end - start);
  rest.remove_prefix(end);
  return piece;
}

bool ends_entry(char byte) { return byte == ',' || byte == ';'; }

// The kind that a word asks for: the first type letter behind a colon, the
// word's other characters do not matter.  False if there is none.
bool type_in(std::string_view word, Kind& kind) {
  for (std::size_t i = word.find(':'); i != word.npos && i + 1 < word.size();
       i = word.find(':', i + 1)) {
    if (word[i + 1] != 's' && word[i + 1] != 'b') continue;
    kind = word[i + 1] == 's' ? Kind::text : Kind::flag;
    return true;
  }
  return false;
}

// Declares the option of one entry.
void declare(std::string_view entry, Declared& declared) {
  const zxStr name(next_piece(entry, zx_is_space));
  if (name.is_empty()) return;
  declared.names.set(name, name);
  Kind kind = Kind::flag;
  for (;;) {
    const std::string_view word = next_piece(entry, zx_is_space);
    if (word.empty()) break;
    if (!type_in(word, kind)) declared.names.set(zxStr(word), name);
  }
  declared.kinds.set(name, kind);
}

void declare_all(const zxStr& declaration, Declared& declared) {
  std::string_view rest = declaration.view();
  for (;;) {
    const std::string_view entry = next_piece(rest, ends_entry);
    if (entry.empty()) return;
    declare(entry, declared);
  }
}

bool begins_with_dash(const zxStr& text) { return text.c_str()[0] == '-'; }

// A scan of the arguments; each step looks at the first.
class Scan {
 public:
  Scan(const Declared& options, zxQVA<zxStr>& arguments, zxSA<zxStr>& given)
      : declared(options), args(arguments), opts(given) {}

  zxStr run() {
    while (args.length() > 0 && step()) {
    }
    return error.is_empty() ? closing() : error;
  }

 private:
  // True if the scan goes on with the next argument.
  bool step() {
    const zxStr typed = args.get(0);
    if (const zxStr* name = declared.names.find(typed))
      return take_exact(*name, typed);
    if (!begins_with_dash(typed) || typed.length() < 2) return false;
    const zxStr* name = declared.names.find(zxStr(typed.c_str(), 2));
    return name != nullptr && take_attached(*name, typed);
  }

  // An option spelled in full, its parameter in the next argument.  One that
  // may be empty never takes the next argument.
  bool take_exact(const zxStr& name, const zxStr& typed) {
    const Kind kind = declared.kinds.get(name);
    args.drop_first();
    if (is_valid(zxStr(), kind)) {
      opts.set(name, zxStr());
      return true;
    }
    if (args.length() > 0 && is_valid(args.get(0), kind)) {
      opts.set(name, args.pop_first());
      return true;
    }
    error = "bad or missing parm for " + typed;
    return false;
  }

  // A dash and one character, with a parameter or further flags attached.
  bool take_attached(const zxStr& name, const zxStr& typed) {
    const Kind kind = declared.kinds.get(name);
    const zxStr rest(typed.c_str() + 2, typed.length() - 2);
    if (is_valid(rest, kind)) {
      opts.set(name, rest);
      args.drop_first();
      return true;
    }
    if (!is_valid(zxStr(), kind)) return false;
    opts.set(name, zxStr());
    args.ref(0) = '-' + rest;
    return true;
  }

  // What the argument at which the scan stopped means.
  zxStr closing() {
    const zxStr stop = args.get_or(0);
    if (stop == "-?") return " ";
    if (stop == "-" || stop == "--") {
      if (begins_with_dash(args.get_or(1))) args.drop_first();
      return {};
    }
    if (begins_with_dash(stop)) return "bad option: " + stop;
    return {};
  }

  const Declared& declared;
  zxQVA<zxStr>& args;
  zxSA<zxStr>& opts;
  zxStr error;
};

void clear_options() { g_opts.clear(); }

// The application's usage text with its line ends made CR LF.
void append_usage_text(zxStr& screen) {
  if (usage_text == nullptr) usage_text = "no usage info";
  for (const char* p = usage_text; *p != '\0'; ++p) {
    if (*p == '\r') continue;
    if (*p == '\n') screen.append('\r');
    screen.append(*p);
  }
}

zxStr usage_screen(const zxStr& message) {
  zxStr screen;
  if (!message.is_empty() && !(message == " "))
    screen.append("Error: ").append(message).append("\r\n");
  screen.append("Usage: ").append(program_name);
  if (!program_version.is_empty()) screen.append(' ').append(program_version);
  screen.append(' ');
  append_usage_text(screen);
  return screen.append("\r\n").append(packages_long());
}

}  // namespace

void init_opts(zxStr declaration) {
  std::atexit(clear_options);
  const zxStr wrong = parse_opts(declaration, g_args, g_opts);
  if (!wrong.is_empty()) show_usage(wrong);
}

zxStr parse_opts(const zxStr& declaration, zxQVA<zxStr>& args,
                 zxSA<zxStr>& opts) {
  Declared declared;
  declare_all(declaration, declared);
  return Scan(declared, args, opts).run();
}

bool opt_on(const zxStr& option) {
  const zxStr* parameter = g_opts.find(option);
  return parameter != nullptr && !(*parameter == "-");
}

void show_usage(const zxStr& message) {
  eprint("#", usage_screen(message));
  zxplat::process.exit(k_exit_usage);
}
