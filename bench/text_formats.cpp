// text_formats.cpp - text composed of arguments: our format language, the C
// library's and the streams'.  text_fmt.cpp has one more side.
#include <charconv>
#include <cstdio>
#include <sstream>

#include "text.h"
#include "zxsfmt.h"

namespace text {
namespace {

// ---- ours

const std::vector<zxStr>& our_names() {
  static const auto list = ours(names());
  return list;
}
const std::vector<zxStr>& our_other_names() {
  static const auto list = ours(other_names());
  return list;
}

zxStr our_text_int_text(std::size_t i) {
  ZX_HERE;
  return sfmt("# # #", our_names()[i], ints()[i], our_other_names()[i]);
}

zxStr our_one_text(std::size_t i) {
  ZX_HERE;
  return sfmt("#", our_names()[i]);
}

zxStr our_int_text_double(std::size_t i) {
  ZX_HERE;
  return sfmt("# # #", ints()[i], our_names()[i], doubles()[i]);
}

zxStr our_double(std::size_t i) {
  ZX_HERE;
  return sfmt("#", doubles()[i]);
}

// Into a string that is kept.
std::string_view our_double_kept(std::size_t i) {
  static zxStr kept;
  ZX_HERE;
  return sfmt_to(kept, "#", doubles()[i]).view();
}

zxStr our_fixed(std::size_t i) {
  ZX_HERE;
  return sfmt("%.2f", doubles()[i]);
}

zxStr our_picture(std::size_t i) {
  ZX_HERE;
  return sfmt("%.2[,]v", doubles()[i]);
}

// ---- snprintf, into a room that is always large enough

template <class... Args>
std::string printed(const char* format, Args... args) {
  char room[256];
  const int size = std::snprintf(room, sizeof room, format, args...);
  return std::string(room, static_cast<std::size_t>(size));
}

std::string c_text_int_text(std::size_t i) {
  return printed("%s %d %s", names()[i].c_str(), ints()[i],
                 other_names()[i].c_str());
}

std::string c_one_text(std::size_t i) {
  return printed("%s", names()[i].c_str());
}

std::string c_int_text_double(std::size_t i) {
  return printed("%d %s %.15g", ints()[i], names()[i].c_str(), doubles()[i]);
}

std::string c_double(std::size_t i) { return printed("%.15g", doubles()[i]); }

std::string c_fixed(std::size_t i) { return printed("%.2f", doubles()[i]); }

// ---- std::ostringstream, a new one for each text

template <class... Args>
std::string streamed(const Args&... args) {
  std::ostringstream stream;
  stream.precision(15);
  (stream << ... << args);
  return std::move(stream).str();
}

std::string stream_text_int_text(std::size_t i) {
  return streamed(names()[i], ' ', ints()[i], ' ', other_names()[i]);
}

std::string stream_one_text(std::size_t i) { return streamed(names()[i]); }

std::string stream_int_text_double(std::size_t i) {
  return streamed(ints()[i], ' ', names()[i], ' ', doubles()[i]);
}

std::string stream_double(std::size_t i) { return streamed(doubles()[i]); }

// ---- std::to_chars, and a string of that

template <class... How>
std::string converted(double value, How... how) {
  char room[64];
  const auto end = std::to_chars(room, std::end(room), value, how...).ptr;
  return std::string(room, end);
}

// Into a room that is kept.
std::string_view to_chars_double_kept(std::size_t i) {
  static char room[64];
  const char* const end = std::to_chars(room, room + sizeof room, doubles()[i],
                                        std::chars_format::general, 15)
                              .ptr;
  return {room, static_cast<std::size_t>(end - room)};
}

std::string to_chars_double(std::size_t i) {
  return converted(doubles()[i], std::chars_format::general, 15);
}

std::string to_chars_fixed(std::size_t i) {
  return converted(doubles()[i], std::chars_format::fixed, 2);
}

}  // namespace

void add_formats() {
  add<our_text_int_text>("text_int_text", "ours");
  add<c_text_int_text>("text_int_text", "snprintf");
  add<stream_text_int_text>("text_int_text", "stream");
  add<our_one_text>("one_text", "ours");
  add<c_one_text>("one_text", "snprintf");
  add<stream_one_text>("one_text", "stream");
  add<our_int_text_double>("int_text_double", "ours");
  add<c_int_text_double>("int_text_double", "snprintf");
  add<stream_int_text_double>("int_text_double", "stream");
  add<our_double>("double", "ours");
  add<to_chars_double>("double", "to_chars");
  add<c_double>("double", "snprintf");
  add<stream_double>("double", "stream");
  add<our_double_kept>("double_kept", "ours");
  add<to_chars_double_kept>("double_kept", "to_chars");
  add<our_fixed>("fixed", "ours");
  add<c_fixed>("fixed", "snprintf", same_but_for_a_tie);
  add<to_chars_fixed>("fixed", "to_chars", same_but_for_a_tie);
  add<our_picture>("picture", "ours");
}

}  // namespace text
