// hebrew.cpp - the fuzz target of Hebrew reordering.
//
// An input is a text of any bytes.  It is converted in all directions, and
// each result must be that of the model of the tests, which is slow and
// obvious.  Lines that fail give a text as well, for which the model has
// nothing to say.
#include <memory>
#include <string>
#include <string_view>

#include "fuzz/input.h"
#include "fuzz/targets.h"
#include "tests/zxlib/hebrew_model.h"
#include "zxp2l.h"

namespace fuzz {
namespace {

constexpr std::size_t k_longest_text = 400;

void compare(const zxStr& result, const hebrew_model::Maybe& expected,
             const char* what) {
  require(!expected || std_str(result) == *expected, what);
}

void reorder(const zxStr& text, bool rtl) {
  const std::string source = std_str(text);
  compare(logical_from_phys(text, rtl),
          hebrew_model::logical_from_phys(source, rtl), "logical text differs");
  compare(phys_from_logical(text, rtl),
          hebrew_model::phys_from_logical(source, rtl),
          "physical text differs");
  compare(logical_from_phys_lines(text, rtl),
          hebrew_model::logical_from_phys_lines(source, rtl),
          "logical lines differ");
  compare(phys_from_logical_lines(text, rtl),
          hebrew_model::phys_from_logical_lines(source, rtl),
          "physical lines differ");
}

void change_code_page(const zxStr& text) {
  const std::string source = std_str(text);
  zxStr changed = text;
  dos_to_ansi(changed);
  require(std_str(changed) == hebrew_model::to_1255(source), "1255 differs");
  changed = text;
  ansi_to_dos(changed);
  require(std_str(changed) == hebrew_model::to_862(source), "862 differs");
  compare(ansi_to_utf8(text), hebrew_model::ansi_to_utf8(source),
          "UTF-8 differs");
  compare(ansi_to_utf16(text), hebrew_model::ansi_to_utf16(source),
          "UTF-16 of 1255 differs");
  compare(dos_to_utf16(text), hebrew_model::dos_to_utf16(source),
          "UTF-16 of 862 differs");
}

std::string without(std::string text, std::string_view bytes) {
  std::erase_if(text,
                [=](char byte) { return bytes.find(byte) != bytes.npos; });
  return text;
}

// The road of exports, in room of exactly the size that it may take, gives
// what the two conversions give, failing lines included.
void export_cells(const zxStr& text) {
  constexpr std::string_view k_dropped = "\",5";
  static constexpr zxLogicalExport k_cells(k_dropped);
  const Text source(text.view());
  const std::size_t size = zxLogicalExport::room_for(source.view().size());
  const std::unique_ptr<char[]> room(new char[size]);
  const std::string_view result = k_cells.convert(room.get(), source.view());
  require(room.get() <= result.data() &&
              result.data() + result.size() <= room.get() + size,
          "the export is not in its room");
  const zxStr by_steps = ansi_to_utf8(logical_from_phys_lines(text, true));
  require(result == without(std_str(by_steps), k_dropped),
          "the export differs");
}

}  // namespace

void hebrew(Bytes input) {
  const FailuresReturn failures_return;
  const zxStr text(Reader(input).text(k_longest_text));
  const zxStr copy(text.view());
  for (const bool rtl : {true, false}) reorder(text, rtl);
  change_code_page(text);
  export_cells(text);
  require(text.view() == copy.view(), "the source has changed");
}

}  // namespace fuzz
