// zxsfmt_impl.h - private to zxsfmt*.cpp: the parts of a directive, and the
// texts of numbers.
#ifndef ZXSFMT_IMPL_H
#define ZXSFMT_IMPL_H

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>

#include "zxsfmt.h"

namespace zxsfmt_detail {

// ----------------------------------------------------- numbers as digits --
//
// zxsfmt_number.cpp: exact texts of doubles.  Numbers are finite and not
// negative; exact ties go away from zero; exponents have three digits at
// least.  Each writes to `out` and returns the end of the text.

// A whole number; it takes up to 20 bytes.
char* write_whole(char* out, std::uint64_t number);

// "%.*f".  It takes up to fixed_room() bytes.
char* write_fixed(char* out, double number, std::int32_t precision);
std::size_t fixed_room(double number, std::int32_t precision);

// "%.*e", with a point behind the digit whatever the precision if `point`.
// It takes up to precision + 10 bytes; the precision is k_most_digits - 1 at
// most.
char* write_exponent(char* out, double number, std::int32_t precision,
                     bool point);

// "%.*g": up to `precision` significant digits, as "%f" from 0.0001 up to
// where the digits end, else as "%e"; no trailing zeros unless `zeros`.  It
// takes up to precision + 12 bytes; the precision is from 1 to k_most_digits.
char* write_general(char* out, double number, std::int32_t precision,
                    bool zeros);

// No double has more significant digits.
inline constexpr std::int32_t k_most_digits = 770;

// ------------------------------------------------------------- the result --

// True for a place in a string's own memory, the NUL at its end included.
inline bool lies_in(const char* block, std::size_t size, const void* place) {
  return size > 0 && reinterpret_cast<std::uintptr_t>(place) -
                             reinterpret_cast<std::uintptr_t>(block) <=
                         size;
}

// The string under composition, written to behind its end.  The string is as
// it should be between any two calls; whoever changes it in another way has
// to call reload().
class Output {
 public:
  explicit Output(zxStr& result)
      : string(result),
        first_block(result.c_str()),
        first_size(zx_size(result.capacity())) {
    if (first_size > 0) reload();
  }

  // True for a place in the memory that the result had at first, which is
  // written over or given back while it is composed.
  bool stood_on(const void* place) const {
    return lies_in(first_block, first_size, place);
  }

  const zxStr& text() const { return string; }
  std::int32_t length() const { return string.length(); }

  // The place behind the end with room for n bytes, of which those up to the
  // end that is given to take_to() become text.  Null if n was refused.
  char* room(std::int64_t n) { return n <= limit - end ? end : grow(n); }
  void take_to(char* new_end) {
    string.extend(static_cast<std::int32_t>(new_end - end));
    end = new_end;
  }

  void add(char byte) {
    if (char* const to = room(1)) {
      *to = byte;
      take_to(to + 1);
    }
  }
  void add(std::string_view text) {
    if (char* const to = room(static_cast<std::int64_t>(text.size()))) {
      zx_copy(to, text.data(), text.size());
      take_to(to + text.size());
    }
  }
  void add(const char* text) { add(std::string_view(text)); }
  // The text may be the result itself.
  void add(const zxStr& text) {
    if (&text != &string) return add(text.view());
    string.append(text);
    reload();
  }

  // Nothing if n is not above 0.  Lengths beyond 31 bits fail an assertion.
  void add_times(char byte, std::int64_t n);

  void cut(std::int32_t n) {
    string.set_length(n);
    reload();
  }
  void replace(const char* text) {
    string = text;
    reload();
  }
  void reload() {
    end = string.tail(0);
    limit = end == nullptr ? end : end + (string.capacity() - string.length());
  }

 private:
  char* grow(std::int64_t n);

  zxStr& string;
  const char* first_block;
  std::size_t first_size;
  // No room at first.
  char* end = zx_empty_rep.data;
  const char* limit = zx_empty_rep.data;
};

// ------------------------------------------------------------ directives --

// A "%" directive as it was read: all of it but for the bracket and the "l",
// with numbers in the place of "*".
class Directive {
 public:
  void add(char byte) {
    if (length < k_most) spec[length] = byte;
    ++length;
  }
  bool is_too_long() const { return length + (has_long ? 1 : 0) > k_most; }

  // False if it is too long.
  bool set_bracket(std::string_view text) {
    has_bracket = true;
    if (text.size() > k_most_bracket) return false;
    text.copy(bracket, text.size());
    bracket[text.size()] = '\0';
    return true;
  }

  char letter() const { return spec[length - 1]; }
  // What stands between the "%" and the letter.
  std::string_view middle() const { return {spec + 1, length - 2}; }

  static constexpr std::size_t k_most_bracket = 19;
  bool has_long = false;
  bool has_bracket = false;
  char bracket[k_most_bracket + 1];

 private:
  static constexpr std::size_t k_most = 31;

  char spec[k_most];
  std::size_t length = 0;
};

// Carries out a directive with its argument; false if they do not fit.
bool append_directive(Output& out, const Directive& directive,
                      const zxFmtArg& arg);

// The number of a "%v" directive in a picture; false for an argument without
// a number.
bool append_picture(Output& out, const Directive& directive,
                    const zxFmtArg& arg);

// Carries out the escape that stands behind a "$" and steps over it; false if
// there is none.  Groups of the match that begins at `lost_match`, if that is
// not null, are gone.
bool append_escape(Output& out, const char*& at, zxFmtEnv& env,
                   const char* lost_match);

// ----------------------------------------------------------------- pieces --

template <class T>
const T& pointee(const zxFmtArg& arg) {
  return *static_cast<const T*>(arg.pointer);
}

// The bytes from one place up to another.
inline std::size_t zx_distance(const char* from, const char* to) {
  return static_cast<std::size_t>(to - from);
}

void append_whole(Output& out, std::int64_t number);

// The default form of a double.
void append_number(Output& out, double number);

// Hexadecimal digits, as many as an address can have.
void append_address(Output& out, const void* address);

// Texts with another between them.
zxStr joined(const zxQVA<zxStr>& texts, const char* between);

// The moment of a zxTime, of a time_t or of the start of a zxDate.
std::optional<std::int64_t> moment_of(const zxFmtArg& arg);

// Reads decimal digits, a number beyond 31 bits counting as the highest.
std::int32_t read_digits(std::string_view& text);

// The width and the precision of a directive, each -1 if not given.
struct Measures {
  std::int32_t width = -1;
  std::int32_t precision = -1;
};

// Reads digits, and behind a "." the precision; a "." alone means 0.
Measures read_measures(std::string_view& text);

}  // namespace zxsfmt_detail

#endif  // ZXSFMT_IMPL_H
