// Replacing and cutting.

#include "zxstrm2.h"

#include <algorithm>
#include <cstring>

#include "zxregexc_impl.h"
#include "zxstrm_impl.h"

namespace {

// Text that is built from many pieces in a block whose size at least doubles.
// It is of no use once a piece has found no room: a string has a limit, which
// is an assertion.
class Builder {
 public:
  Builder() = default;
  ~Builder() { zx_realloc(block, 0); }
  Builder(const Builder&) = delete;
  Builder& operator=(const Builder&) = delete;

  void append(const char* bytes, std::size_t size) {
    if (size > room - used && !make_room(size)) {
      is_whole = false;
      return;
    }
    if (size != 0) std::memcpy(block + used, bytes, size);
    used += size;
  }
  void append(char byte) { append(&byte, 1); }

  const char* begin() const { return block; }
  std::size_t length() const { return used; }
  void cut(std::size_t length) { used = length; }
  bool is_usable() const { return is_whole; }

 private:
  bool make_room(std::size_t more) {
    constexpr std::size_t k_most = 0x7FFFFFFF;
    constexpr std::size_t k_least = 256;
    if (!ZX_ASSERT(more <= k_most - used)) return false;
    const std::size_t wanted =
        std::max({k_least, used + more, std::min(k_most, 2 * room)});
    void* bigger = zx_realloc(block, wanted);
    if (bigger == nullptr) return false;
    block = static_cast<char*>(bigger);
    room = wanted;
    return true;
  }

  char* block = nullptr;
  std::size_t used = 0;
  std::size_t room = 0;
  bool is_whole = true;
};

// ------------------------------------------------------------ replacement --

// The replacement text, which is expanded for each match.
class Replacement {
 public:
  Replacement(const char* its_text, std::int32_t length)
      : text(its_text), end(its_text + length) {
    is_plain = std::none_of(text, end, [](char byte) {
      return byte == '`' || byte == '\\' || byte == '|';
    });
  }

  // Adds what stands for the present match.
  void expand(Builder& out) const {
    if (is_plain)
      out.append(text, static_cast<std::size_t>(end - text));
    else
      expand_in_general(out);
  }

 private:
  void expand_in_general(Builder& out) const {
    const std::size_t start = out.length();
    std::int32_t choice = zx_match.alternative[0];
    const bool has_choice = choice > 0;
    for (const char* at = text; at < end;) {
      const char byte = *at++;
      if (byte == '`' || byte == '\\') {
        at = expand_escape(out, at, byte);
      } else if (byte == '|' && has_choice) {
        if (--choice == 0) return;
        out.cut(start);
      } else {
        out.append(byte);
      }
    }
  }

  // What stands behind an escape; returns the place behind it.  An escape at
  // the very end stands for itself.
  const char* expand_escape(Builder& out, const char* at, char escape) const {
    if (at == end) {
      out.append(escape);
    } else if (end - at >= 3 && std::all_of(at, at + 3, zx_is_digit)) {
      out.append(static_cast<char>((at[0] - '0') * 64 + (at[1] - '0') * 8 +
                                   (at[2] - '0')));
      return at + 3;
    } else if (zx_is_digit(*at)) {
      append_group(out, *at++ - '0');
    } else {
      out.append(control_byte(*at++));
    }
    return at;
  }

  static void append_group(Builder& out, int n) {
    out.append(zx_match.start[n], zx_size(group_length(n)));
  }

  // Unlike in patterns, a and b are control bytes as well.
  static char control_byte(char letter) {
    if (letter == 'a') return '\a';
    return letter == 'b' ? '\b' : zx_control_byte(letter);
  }

  const char* text;
  const char* end;
  bool is_plain;
};

// Replaces in the held subject, whose first match has been found, and gives
// the caller's string the result.
class Replacing {
 public:
  Replacing(const zxRegex& its_regex, const Replacement& its_replacement,
            std::int32_t its_count)
      : regex(its_regex), replacement(its_replacement), left(its_count) {}

  std::int32_t run(zxStr& subject) {
    const zxStr& held = zxstrm::held_subject();
    start = held.begin();
    end = held.end();
    const char* first = zx_match.start[0];
    at = first;
    std::int32_t done = 0;
    do {
      copy_to(zx_match.start[0]);
      replacement.expand(out);
      ++done;
      at = zx_match.end[0];
    } while (finds_next());
    copy_to(end);
    return put(subject, static_cast<std::size_t>(first - start)) ? done : 0;
  }

 private:
  // The subject up to its first match, and the result behind that.
  bool put(zxStr& subject, std::size_t kept) {
    if (!out.is_usable() || !ZX_ASSERT(out.length() <= 0x7FFFFFFF - kept))
      return false;
    subject.build(start, zx_count(kept), out.begin(), zx_count(out.length()));
    return true;
  }

  // Copies what stands between the present place and the given one.
  void copy_to(const char* place) {
    out.append(at, static_cast<std::size_t>(place - at));
    at = place;
  }

  bool search() {
    if (--left == 0 || at == end) return false;
    return regexec_from(&regex, at, end, at == start ? '\0' : at[-1]);
  }

  // An empty match where the search began would be found for ever: one byte
  // is passed over.
  bool finds_next() {
    if (!search()) return false;
    if (zx_match.end[0] != at) return true;
    copy_to(at + 1);
    return search();
  }

  const zxRegex& regex;
  const Replacement& replacement;
  std::int32_t left;  // searches
  Builder out;
  const char* start = nullptr;
  const char* end = nullptr;
  const char* at = nullptr;  // what is ahead of it is in the result
};

std::int32_t replace_with(zxStr& subject, const zxRegex* regex,
                          const char* replacement, std::int32_t length,
                          std::int32_t count) {
  if (regex == nullptr || !zxstrm::search_held(*regex, subject)) return 0;
  return Replacing(*regex, Replacement(replacement, length), count)
      .run(subject);
}

constexpr std::int32_t k_all = 0x7FFFFFFF;

std::int32_t replace_text(zxStr& subject, const char* pattern,
                          const char* replacement, std::int32_t count) {
  if (!ZX_ASSERT(pattern != nullptr && replacement != nullptr)) return 0;
  return replace_with(subject, get_regex(pattern), replacement,
                      zx_count(std::strlen(replacement)), count);
}

std::int32_t replace_string(zxStr& subject, const zxStr& pattern,
                            const zxStr& replacement, std::int32_t count) {
  // Kept, since either may be the subject itself.
  const zxStr text = replacement;
  return replace_with(subject, zxstrm::regex_of(pattern), text.c_str(),
                      text.length(), count);
}

}  // namespace

std::int32_t replace_n(zxStr& subject, const char* pattern,
                       std::int32_t pattern_length, const char* replacement,
                       std::int32_t replacement_length, std::int32_t count) {
  if (!ZX_ASSERT(pattern != nullptr && pattern_length >= 0 &&
                 replacement != nullptr && replacement_length >= 0 &&
                 count >= 1))
    return 0;
  return replace_with(subject, get_regex(pattern, pattern_length), replacement,
                      replacement_length, count);
}

bool replace1(zxStr& subject, const char* pattern, const char* replacement) {
  return replace_text(subject, pattern, replacement, 1) > 0;
}
bool replace1(zxStr& subject, const char* pattern, std::int32_t pattern_length,
              const char* replacement, std::int32_t replacement_length) {
  return replace_n(subject, pattern, pattern_length, replacement,
                   replacement_length, 1) > 0;
}
bool replace1(zxStr& subject, const zxStr& pattern, const zxStr& replacement) {
  return replace_string(subject, pattern, replacement, 1) > 0;
}

bool replace_all(zxStr& subject, const char* pattern, const char* replacement) {
  return replace_text(subject, pattern, replacement, k_all) > 0;
}
bool replace_all(zxStr& subject, const char* pattern,
                 std::int32_t pattern_length, const char* replacement,
                 std::int32_t replacement_length) {
  return replace_n(subject, pattern, pattern_length, replacement,
                   replacement_length, k_all) > 0;
}
bool replace_all(zxStr& subject, const zxStr& pattern,
                 const zxStr& replacement) {
  return replace_string(subject, pattern, replacement, k_all) > 0;
}

// --------------------------------------------------------------- cutting --

namespace {

// Finds the separator in the held subject; an empty one at the very start
// does not count.
bool finds_separator(const zxRegex& regex, const zxStr& subject) {
  if (!zxstrm::search_held(regex, subject)) return false;
  const zxStr& held = zxstrm::held_subject();
  if (zx_match.end[0] != held.begin()) return true;
  return regexec_from(&regex, held.begin() + 1, held.end(), held[0]);
}

void cut_with(const zxRegex& regex, zxStr& subject, zxStr& piece) {
  if (!finds_separator(regex, subject)) {
    piece = subject;
    subject.clear();
    return;
  }
  const zxStr& held = zxstrm::held_subject();
  const char* start = zx_match.start[0];
  const char* end = zx_match.end[0];
  piece.build(held.begin(),
              zx_count(static_cast<std::size_t>(start - held.begin())));
  subject.build(end, zx_count(static_cast<std::size_t>(held.end() - end)));
}

bool has_text(const zxStr& subject, zxStr& piece) {
  if (subject.is_empty()) piece.clear();
  return !subject.is_empty();
}

// `get` gives the program once there is something to search.
template <class Get>
bool cut_first_by(zxStr& subject, zxStr& piece, Get get) {
  if (!has_text(subject, piece)) return false;
  const zxRegex* regex = get();
  if (regex == nullptr) return false;
  cut_with(*regex, subject, piece);
  return true;
}

template <class Get>
bool cut_next_by(zxStr& subject, zxStr& piece, Get get) {
  if (!has_text(subject, piece)) return false;
  const zxRegex* regex = get();
  if (regex == nullptr) return false;
  do {
    cut_with(*regex, subject, piece);
  } while (piece.is_empty() && has_text(subject, piece));
  return !piece.is_empty();
}

}  // namespace

bool cut_first(zxStr& subject, zxStr& piece, const char* pattern) {
  return cut_first_by(subject, piece, [=] { return get_regex(pattern); });
}
bool cut_first(zxStr& subject, zxStr& piece, const char* pattern,
               std::int32_t length) {
  return cut_first_by(subject, piece,
                      [=] { return get_regex(pattern, length); });
}
bool cut_first(zxStr& subject, zxStr& piece, const zxStr& pattern) {
  return cut_first_by(subject, piece,
                      [&] { return zxstrm::regex_of(pattern); });
}

bool cut_next(zxStr& subject, zxStr& piece, const char* pattern) {
  return cut_next_by(subject, piece, [=] { return get_regex(pattern); });
}
bool cut_next(zxStr& subject, zxStr& piece, const char* pattern,
              std::int32_t length) {
  return cut_next_by(subject, piece,
                     [=] { return get_regex(pattern, length); });
}
bool cut_next(zxStr& subject, zxStr& piece, const zxStr& pattern) {
  return cut_next_by(subject, piece, [&] { return zxstrm::regex_of(pattern); });
}
