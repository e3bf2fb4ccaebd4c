// The caches, the searches, the readers.

#include "zxstrm.h"

#include <cstdlib>
#include <cstring>

#include "zxregexe_impl.h"
#include "zxstrm_impl.h"

namespace {

// ---------------------------------------------------------------- caches --

// Programs belong to those who hold them: slots of either cache.
void let_go(zxRegex*& regex) {
  if (regex != nullptr && --regex->holders == 0) zx_realloc(regex, 0);
  regex = nullptr;
}

zxRegex* shared(zxRegex* regex) {
  ++regex->holders;
  return regex;
}

// The patterns by address.  No chains: a slot goes to whoever comes last.
struct AddressSlot {
  const char* address;
  zxRegex* regex;
};
constexpr std::size_t k_address_slots = 1024;

// The slot of an address, by the lower half of it where it is longer.
std::size_t slot_number(const char* address) {
  const auto low =
      static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(address));
  return (137 * low + 97 * (low >> 16)) % k_address_slots;
}

// The patterns of strings by contents.  They would be compiled at each use
// otherwise, since their addresses tell nothing.
struct TextSlot {
  zxStr text;
  zxRegex* regex;
};
constexpr std::size_t k_text_slots = 256;

std::size_t text_number(const char* text, std::int32_t length) {
  return crc16(text, zx_size(length)) % k_text_slots;
}

struct Cache {
  AddressSlot by_address[k_address_slots];
  TextSlot by_text[k_text_slots];
  zxRegexCounts counts;
  bool is_flushed_at_exit;
  zxStr subject;  // the holder
};
constinit Cache cache{};

void flush_at_exit() {
  if (cache.is_flushed_at_exit) return;
  cache.is_flushed_at_exit = true;
  std::atexit(flush_regex_cache);
}

AddressSlot& slot_of(const char* address) {
  return cache.by_address[slot_number(address)];
}

zxRegex* put(AddressSlot& slot, const char* address, zxRegex* regex) {
  let_go(slot.regex);
  slot = {address, regex};
  return regex;
}

zxRegex* compile(const char* pattern, std::int32_t length) {
  flush_at_exit();
  return regcomp(pattern, pattern + length);
}

// The program of that text from the second cache, compiled if need be.
zxRegex* known_regex(const char* text, std::int32_t length) {
  TextSlot& slot = cache.by_text[text_number(text, length)];
  const std::string_view wanted(text, zx_size(length));
  if (slot.regex != nullptr && slot.text.view() == wanted) return slot.regex;
  zxRegex* regex = compile(text, length);
  if (regex == nullptr) return nullptr;
  let_go(slot.regex);
  slot.text.build(text, length);
  if (slot.text.view() == wanted)
    slot.regex = regex;
  else
    let_go(regex);  // a failure was dropped
  return slot.regex;
}

// -------------------------------------------------------------- searching --

bool is_rejected(const zxRegex& regex, const zxStr& subject) {
  return zxregexe::is_rejected(regex, subject.begin(), subject.end());
}

bool search(const zxRegex& regex, const zxStr& subject) {
  return zxregexe::search(regex, subject.begin(), subject.end(),
                          zxregexe::k_at_start);
}

// False if the failure of a copy was dropped.
bool hold(const zxStr& subject) {
  cache.subject = subject;
  return cache.subject.length() == subject.length();
}

bool match_with(const zxRegex* regex, const zxStr& subject) {
  return regex != nullptr && zxstrm::search_held(*regex, subject);
}

// Moves a pointer into one text to the same place in another.
void rebase(const char*& pointer, const char* from, const char* to) {
  if (pointer != nullptr) pointer = to + (pointer - from);
}

void rebase_match(const char* from, const char* to) {
  for (std::int32_t n = 0; n < zxMatch::k_slots; ++n) {
    rebase(zx_match.start[n], from, to);
    rebase(zx_match.end[n], from, to);
  }
  for (zxMatch::Field& field : zx_match.field) {
    rebase(field.start, from, to);
    rebase(field.end, from, to);
  }
}

bool imatch_with(const zxRegex* regex, const zxStr& subject) {
  if (regex == nullptr) return false;
  zxIStr folded(subject);
  folded.to_lower();
  if (is_rejected(*regex, folded)) return false;
  if (!hold(subject) || !search(*regex, folded)) return false;
  rebase_match(folded.begin(), cache.subject.begin());
  return true;
}

bool match_buf_with(const zxRegex* regex, const char* start, const char* end) {
  return regex != nullptr && regexec(regex, start, end);
}

}  // namespace

const zxRegex* zxstrm::regex_of(const zxStr& pattern) {
  forget(pattern.c_str());
  ++cache.counts.misses;
  zxRegex* regex = known_regex(pattern.c_str(), pattern.length());
  if (regex == nullptr) return nullptr;
  return put(slot_of(pattern.c_str()), pattern.c_str(), shared(regex));
}

// The results that a rejected match leaves lie in the old subject, so the
// holder changes only when they are cleared.
bool zxstrm::search_held(const zxRegex& regex, const zxStr& subject) {
  if (is_rejected(regex, subject)) return false;
  return hold(subject) && search(regex, cache.subject);
}

const zxStr& zxstrm::held_subject() { return cache.subject; }

bool match(const zxStr& subject, const char* pattern) {
  return match_with(get_regex(pattern), subject);
}
bool match(const zxStr& subject, const char* pattern, std::int32_t length) {
  return match_with(get_regex(pattern, length), subject);
}
bool match(const zxStr& subject, const zxStr& pattern) {
  return match_with(zxstrm::regex_of(pattern), subject);
}

bool imatch(const zxStr& subject, const char* pattern) {
  return imatch_with(get_regex(pattern), subject);
}
bool imatch(const zxStr& subject, const char* pattern, std::int32_t length) {
  return imatch_with(get_regex(pattern, length), subject);
}
bool imatch(const zxStr& subject, const zxStr& pattern) {
  return imatch_with(zxstrm::regex_of(pattern), subject);
}

bool match_buf(const char* pattern, const char* start, const char* end) {
  return match_buf_with(get_regex(pattern), start, end);
}
bool match_buf(const char* pattern, std::int32_t length, const char* start,
               const char* end) {
  return match_buf_with(get_regex(pattern, length), start, end);
}
bool match_buf(const zxStr& pattern, const char* start, const char* end) {
  return match_buf_with(zxstrm::regex_of(pattern), start, end);
}

bool check_pattern(const zxStr& pattern) {
  return regcheck(pattern.begin(), pattern.end());
}

// -------------------------------------------------------- reading a match --

namespace {

std::string_view text_between(const char* start, const char* end) {
  // Inside a loop a group can have begun again behind its old end.
  if (start == nullptr || end == nullptr || end < start) return {};
  return {start, static_cast<std::size_t>(end - start)};
}

bool is_slot(std::int32_t n) {
  return ZX_ASSERT(n >= 0 && n < zxMatch::k_slots);
}

std::string_view slot_text(std::int32_t n) {
  return is_slot(n) ? text_between(zx_match.start[n], zx_match.end[n])
                    : std::string_view();
}

const zxMatch::Field& field_of(std::int32_t n) {
  static constexpr zxMatch::Field k_unset{};
  return ZX_ASSERT(n >= 1 && n <= zxMatch::k_fields) ? zx_match.field[n - 1]
                                                     : k_unset;
}

}  // namespace

zxStr group_text(std::int32_t n) { return zxStr(slot_text(n)); }

std::int32_t group_length(std::int32_t n) {
  return zx_count(slot_text(n).size());
}

void group_assign(std::int32_t n, zxStr& out) {
  const std::string_view text = slot_text(n);
  if (text.empty())
    out.clear();
  else
    out.build(text.data(), zx_count(text.size()));
}

zxStr field_text(std::int32_t n) {
  const zxMatch::Field& field = field_of(n);
  return zxStr(text_between(field.start, field.end));
}

char field_type(std::int32_t n) { return field_of(n).type; }

std::int32_t alternative(std::int32_t n) {
  return is_slot(n) ? zx_match.alternative[n] - 1 : -1;
}

// -------------------------------------------------------------- the cache --

const zxRegex* get_regex(const char* pattern, std::int32_t length) {
  if (!ZX_ASSERT(pattern != nullptr && length >= -1)) return nullptr;
  AddressSlot& slot = slot_of(pattern);
  if (slot.address == pattern && slot.regex != nullptr) {
    ++cache.counts.hits;
    return slot.regex;
  }
  ++cache.counts.misses;
  if (length < 0) length = zx_count(std::strlen(pattern));
  zxRegex* regex = compile(pattern, length);
  return regex == nullptr ? nullptr : put(slot, pattern, regex);
}

void forget(const char* pattern) {
  AddressSlot& slot = slot_of(pattern);
  if (slot.address == pattern) put(slot, nullptr, nullptr);
}

void flush_regex_cache() {
  ++cache.counts.flushes;
  clear_match();
  cache.subject.clear();
  if (!cache.is_flushed_at_exit) return;  // nothing has been compiled
  for (AddressSlot& slot : cache.by_address) put(slot, nullptr, nullptr);
  for (TextSlot& slot : cache.by_text) {
    let_go(slot.regex);
    slot.text.clear();
  }
}

const zxRegexCounts& regex_counts() { return cache.counts; }
