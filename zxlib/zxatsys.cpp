// zxatsys.cpp - the failure core.
// Tests: tests/zxlib/zxatsys_test.cpp.
#include "zxatsys.h"

#include "zxatsys_impl.h"
#include "zxplat.h"
#include "zxstkdmp.h"
#include "zxtext.h"

namespace {

// Free texts are cut to this in the message.
constexpr std::size_t k_free_text = 140;
// The cuts of the two texts in the diagnostic line.
constexpr std::size_t k_line_text = 12;
constexpr std::size_t k_line_detail = 18;

char bail_message[k_bail_message_room];
char bail_line[k_bail_line_room];

struct EmergencyPair {
  zxEmergency first;
  zxEmergency second;
};
constinit EmergencyPair emergencies[k_max_emergencies] = {};
constinit std::size_t emergency_count = 0;

const char* no_text() { return ""; }
void no_modules(const char*, const char*) {}

// ---- what is reported

// A text of the caller, which may stand in a buffer that an emergency
// function or the hook uses as well.
class KeptText {
 public:
  const char* keep(const char* text) {
    if (text == nullptr) return nullptr;
    zxText copy(room);
    copy.add(text);
    return room;
  }

 private:
  char room[k_bail_message_room];
};
KeptText kept_text;
KeptText kept_detail;

struct Failure {
  std::int32_t number;
  const char* text;  // may be null
  BailDetail detail;
  int first_error;
  int second_error;
};

bool is_set(const char* text) { return text != nullptr && *text != '\0'; }

const char* or_empty(const char* text) { return text ? text : ""; }

// ---- message and line

// Adds a row of the message table with its place for the argument filled.
// The row is never handed to a formatter: an argument is text, whatever it
// holds.
void add_row(zxText& out, std::string_view row, const char* text) {
  const std::size_t place = row.find('%');
  out.add(row.substr(0, place));
  if (place == std::string_view::npos) return;
  row.remove_prefix(place);
  constexpr std::string_view k_cut_place = "%.140s";
  if (row.starts_with(k_cut_place)) {
    out.add(or_empty(text), k_free_text);
    out.add(row.substr(k_cut_place.size()));
  } else {
    out.add(or_empty(text));
    out.add(row.substr(2));
  }
}

void add_words(zxText& out, const Failure& failure) {
  if (const char* row = find_bail_message(failure.number))
    add_row(out, row, failure.text);
  else if (failure.text != nullptr)
    out.add(failure.text, k_free_text);
  else if (failure.number == 0)
    out.add("0:!");
}

// A message whose words begin with "=" is quiet; a blank takes its place.
bool take_quiet_mark(std::size_t words) {
  if (bail_message[words] != '=') return false;
  bail_message[words] = ' ';
  return true;
}

void add_detail(zxText& out, const BailDetail& detail) {
  const bool with_text = is_set(detail.text);
  if (detail.number == 0 && !with_text) return;
  out.add(" (");
  if (detail.number != 0) out.add_int(detail.number);
  if (detail.number != 0 && with_text) out.add(": ");
  if (with_text) out.add(detail.text);
  out.add(")");
}

// The message, in `out` on bail_message; true if it is a quiet one.
bool compose_message(zxText& out, const Failure& failure) {
  if (failure.number != 0) {
    out.add_int(failure.number);
    out.add(": ");
  }
  const std::size_t words = out.length();
  add_words(out, failure);
  const bool quiet = take_quiet_mark(words);
  add_detail(out, failure.detail);
  return quiet;
}

void compose_line(const Failure& failure) {
  zxText out(bail_line);
  out.add("[");
  out.add_int(failure.number);
  out.add("-");
  out.add_int(failure.number);
  out.add("-");
  out.add_int(failure.detail.number);
  out.add("/");
  out.add_int(failure.first_error);
  out.add("-0/");
  out.add_int(failure.second_error);
  out.add("/");
  out.add(or_empty(failure.text), k_line_text);
  out.add("/");
  out.add(or_empty(failure.detail.text), k_line_detail);
  out.add("]");
}

// ---- the core

// True if a failure is being handled: another one is dropped.
bool is_dropped() {
  if (!bail_guard) return false;
  if ((traits & k_trait_console) == 0)
    zxplat::process.last_words("Cleanup Failure");
  return true;
}

void report(const Failure& failure) {
  const auto whole = std::span(bail_message);
  zxText message(whole.first(whole.size() - k_bail_added_room));
  const bool quiet = compose_message(message, failure);
  compose_line(failure);
  if (quiet) bail_line[0] = '\0';
  if (bail_hook != nullptr) bail_hook(bail_message, bail_line);
  bail_hooks.tell_modules(bail_message, bail_line);
  zxText shown(whole, message.length());
  show_failure(shown, bail_line);
}

// Each of the two system numbers has its own place in the line; they can
// differ only if the system changes the value between the calls.
void bail_core(std::int32_t number, const char* text,
               const BailDetail& detail) {
  const int first_error = zxplat::last_error();
  const int second_error = zxplat::last_error();
  if (is_dropped()) return;
  bail_guard = true;
  const Failure failure{
      number, kept_text.keep(text),
      BailDetail(detail.number, kept_detail.keep(detail.text)), first_error,
      second_error};
  run_emergency_first();
  report(failure);
  zxplat::process.exit(k_exit_failure);
}

}  // namespace

constinit bool bail_guard = false;
constinit zxBailHook bail_hook = nullptr;
constinit zxBailHook bail_hook_early = nullptr;
constinit BailHooks bail_hooks = {
    no_text, no_text, no_text, bail_print_directly, dump_stack, no_modules};

// ---- entries

void bail_code(std::int32_t number) { bail_core(number, nullptr, no_detail); }

void bail_code(std::int32_t number, const char* text,
               const BailDetail& detail) {
  bail_core(number, text, detail);
}

void bail_detail(std::int32_t number, const BailDetail& detail) {
  bail_core(number, nullptr, detail);
}

void bail_detail(std::int32_t number, const char* text,
                 const BailDetail& detail) {
  bail_core(number, text, detail);
}

void assert_fail(std::int32_t line, const char* file) {
  // The position of the failure that is being reported must stand.
  if (is_dropped()) return;
  zx_pos = zxPos{file, line};
  bail_core(1000, pos_string(zx_pos), no_detail);
}

void fatal_exit(const char* text) {
  zxplat::process.debug_break();
  zxplat::process.last_words(text != nullptr ? text : "");
  zxplat::process.exit_at_once(k_exit_failure);
}

// ---- hooks and the emergency table

zxBailHook set_bail_hook(zxBailHook hook, bool which) {
  zxBailHook& slot = which ? bail_hook : bail_hook_early;
  const zxBailHook old = slot;
  slot = hook;
  return old;
}

zxEmergency at_emergency(zxEmergency first, zxEmergency second) {
  if (ZX_ASSERT(emergency_count < k_max_emergencies))
    emergencies[emergency_count++] = {first, second};
  return first;
}

void run_emergency_first() {
  for (std::size_t i = emergency_count; i > 0; --i)
    if (emergencies[i - 1].first != nullptr) emergencies[i - 1].first();
}

void run_emergency_second() {
  for (std::size_t i = 0; i < emergency_count; ++i)
    if (emergencies[i].second != nullptr) emergencies[i].second();
}
