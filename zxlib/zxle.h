// zxle.h - little-endian numbers in files.
//
// Structures that lie in files byte for byte are built from these: each is
// exactly its bytes, needs no alignment and reads the same on every machine,
// so a structure of them has the file's layout without padding or packing.
#ifndef ZXLE_H
#define ZXLE_H

#include <bit>
#include <cstddef>
#include <type_traits>

// The integer T as sizeof(T) bytes, the lowest first.  It converts from and
// to T like the integer itself.  Default construction leaves the bytes alone.
template <class T>
class zxLe {
  static_assert(std::is_integral_v<T>);
  using Bits = std::make_unsigned_t<T>;

 public:
  zxLe() = default;
  constexpr zxLe(T value) { store(value); }
  constexpr zxLe& operator=(T value) {
    store(value);
    return *this;
  }

  constexpr operator T() const {
    return in_file_order(std::bit_cast<T>(*this));
  }

 private:
  constexpr void store(T value) {
    *this = std::bit_cast<zxLe>(in_file_order(value));
  }

  // The machine's order turned to the file's, and back.
  static constexpr T in_file_order(T value) {
    if constexpr (std::endian::native == std::endian::little) {
      return value;
    } else {
      const Bits from = static_cast<Bits>(value);
      Bits to = 0;
      for (std::size_t i = 0; i < sizeof(T); ++i)
        to = static_cast<Bits>(to << 8 | ((from >> 8 * i) & 0xFF));
      return static_cast<T>(to);
    }
  }

  unsigned char bytes[sizeof(T)];
};

static_assert(sizeof(zxLe<int>) == 4 && alignof(zxLe<int>) == 1);

#endif  // ZXLE_H
