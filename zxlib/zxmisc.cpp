// zxmisc.cpp - source positions and the allocator slot.
// Tests: tests/zxlib/zxmisc_test.cpp.
#include "zxmisc.h"

#include <cstdlib>
#include <cstring>

#include "zxatsys.h"
#include "zxplat.h"
#include "zxtext.h"

constinit zxPos zx_pos;

namespace {

// The longest name that a position shows, and the room for its text: that
// name, a colon, eleven characters of a number and a NUL.
constexpr std::size_t k_max_shown = 20;
constexpr std::size_t k_pos_room = 48;
char pos_text[k_pos_room];

bool ends_in_cpp(const char* name, std::size_t length) {
  const char* end = name + length;
  return length >= 4 && end[-4] == '.' && zx_lower(end[-3]) == 'c' &&
         zx_lower(end[-2]) == 'p' && zx_lower(end[-1]) == 'p';
}

// Writes the name, shortened, at the start of pos_text; returns its length.
std::size_t write_shown_name(const char* name) {
  std::size_t length = std::strlen(name);
  const bool cut = length > k_max_shown;
  if (cut && ends_in_cpp(name, length)) length -= 4;
  const std::size_t shown = length < k_max_shown ? length : k_max_shown;
  std::memcpy(pos_text, name + length - shown, shown);
  if (cut) pos_text[0] = '~';
  return shown;
}

// No caller can go on without the block, not even while another failure is
// being handled.
[[gnu::cold]] void fail_for_memory() {
  zxplat::set_last_error(zxplat::k_err_no_memory);
  bail_code(2000);
  zxplat::process.exit_at_once(k_exit_failure);
}

[[gnu::cold]] void fail_for_early_use() {
  zxplat::process.message_box("Using static string/array in a ZXL.",
                              "fatal init error", zxplat::k_error_box);
  zxplat::process.exit(k_exit_early_allocation);
}

}  // namespace

constinit bool zx_is_started = false;
constinit zxReallocFunction zx_realloc = zx_heap_realloc;

void* zx_heap_realloc(void* block, std::size_t size) {
  if (!zx_is_started && (traits & k_trait_executable) == 0) [[unlikely]]
    fail_for_early_use();
  if (size == 0) {
    std::free(block);
    return nullptr;
  }
  void* result = block ? std::realloc(block, size) : std::malloc(size);
  if (result == nullptr) [[unlikely]]
    fail_for_memory();
  return result;
}

void* zx_realloc_after_cleanup(void* block, std::size_t) {
  if (block == nullptr) return nullptr;
  zxplat::process.message_box(
      "Using static string/array in a ZXL - realloc called after cleanup",
      "fatal cleanup error", zxplat::k_error_box);
  zxplat::process.debug_break();
  return nullptr;
}

const char* pos_string(zxPos& position) {
  if (position.file == nullptr) position.file = "?";
  zxText text(pos_text, write_shown_name(position.file));
  text.add(":");
  text.add_int(position.line);
  return pos_text;
}
