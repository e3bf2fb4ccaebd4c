// input.h - what fuzz targets share: reading an input, texts that end where
// their memory ends, failures that return.
#ifndef FUZZ_INPUT_H
#define FUZZ_INPUT_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "fuzz/targets.h"
#include "zxatsys_impl.h"
#include "zxstr.h"

namespace fuzz {

// Takes an input apart from its start; behind its end there are zeros.
class Reader {
 public:
  explicit Reader(Bytes input) : bytes(input) {}

  std::uint8_t byte() {
    if (bytes.empty()) return 0;
    const std::uint8_t first = bytes.front();
    bytes = bytes.subspan(1);
    return first;
  }

  // An unsigned number of `size` bytes, the low one first.
  std::uint64_t number(int size) {
    std::uint64_t result = 0;
    for (int i = 0; i < size; ++i) result |= std::uint64_t{byte()} << (8 * i);
    return result;
  }

  // The next bytes, up to `most` of them.
  std::string_view text(std::size_t most) {
    const std::size_t size = std::min(most, bytes.size());
    const std::string_view result(reinterpret_cast<const char*>(bytes.data()),
                                  size);
    bytes = bytes.subspan(size);
    return result;
  }

 private:
  Bytes bytes;
};

// A copy that ends where its memory ends, so that no byte behind it can be
// read unnoticed.
class Text {
 public:
  explicit Text(std::string_view text)
      : size(text.size()), memory(new char[1 + size]) {
    std::copy(text.begin(), text.end(), memory.get() + 1);
  }
  const char* begin() const { return memory.get() + 1; }
  const char* end() const { return begin() + size; }
  std::string_view view() const { return {begin(), size}; }

 private:
  std::size_t size;
  std::unique_ptr<char[]> memory;
};

inline std::string std_str(const zxStr& text) {
  return std::string(text.view());
}

// While it lives, failures return to those who fail, as they do while another
// failure is being handled.
class FailuresReturn {
 public:
  FailuresReturn() { bail_guard = true; }
  ~FailuresReturn() { bail_guard = false; }
  FailuresReturn(const FailuresReturn&) = delete;
  FailuresReturn& operator=(const FailuresReturn&) = delete;
};

}  // namespace fuzz

#endif  // FUZZ_INPUT_H
