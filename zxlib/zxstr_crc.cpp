// zxstr_crc.cpp - the checksums of 16 and of 32 bits.
// Tests: tests/zxlib/zxstr_test.cpp.
//
// Both take eight bytes in one step: by tables that give what a byte does to
// the sum when a number of others follow it, all of them can be looked up at
// once instead of each waiting for the one before it.
#include <array>
#include <cstring>

#include "zxle.h"
#include "zxstr.h"

namespace {

constexpr std::size_t k_slice = 8;  // bytes of one step

std::uint64_t load_low_first(const unsigned char* bytes) {
  zxLe<std::uint64_t> value;
  std::memcpy(&value, bytes, sizeof value);
  return value;
}

std::uint64_t load_high_first(const unsigned char* bytes) {
  return __builtin_bswap64(load_low_first(bytes));
}

}  // namespace

// ---- 16 bits

namespace {

constexpr std::uint16_t k_crc16_start = 0xFFFF;
constexpr std::size_t k_tables = 2 * k_slice;

// Table k gives what a byte does to the sum when k more bytes follow it.
using Crc16Tables = std::array<std::array<std::uint16_t, 256>, k_tables>;

constexpr Crc16Tables make_crc16_tables() {
  Crc16Tables tables{};
  for (unsigned i = 0; i < 256; ++i) {
    unsigned crc = i << 8;
    for (int bit = 0; bit < 8; ++bit)
      crc = (crc & 0x8000U) ? (crc << 1) ^ 0x1021U : crc << 1;
    tables[0][i] = static_cast<std::uint16_t>(crc);
  }
  for (std::size_t k = 1; k < k_tables; ++k)
    for (std::size_t i = 0; i < 256; ++i) {
      const unsigned crc = tables[k - 1][i];
      tables[k][i] =
          static_cast<std::uint16_t>((crc << 8) ^ tables[0][crc >> 8]);
    }
  return tables;
}

constexpr Crc16Tables k_crc16_tables = make_crc16_tables();

std::uint16_t add_byte(std::uint16_t crc, unsigned char byte) {
  return static_cast<std::uint16_t>((crc << 8) ^
                                    k_crc16_tables[0][(crc >> 8) ^ byte]);
}

// What eight bytes, the first the highest, do to the sum when `behind` more
// follow them.  Zero bytes do nothing.
template <std::size_t behind>
unsigned sum_of_slice(std::uint64_t bytes) {
  const auto part = [bytes](std::size_t k) -> unsigned {
    return k_crc16_tables[behind + k][bytes >> (8 * k) & 0xFF];
  };
  return part(0) ^ part(1) ^ part(2) ^ part(3) ^ part(4) ^ part(5) ^ part(6) ^
         part(7);
}

// The sum of 8 to 16 bytes, which are taken as 16 with zeros in front; the
// sum so far goes into the first two that are not.  There is no branch on the
// size, which nobody could predict.
std::uint16_t add_last_bytes(std::uint16_t crc, const unsigned char* bytes,
                             std::size_t size) {
  const std::size_t half_gap = 4 * (2 * k_slice - size);  // in bits, halved
  std::uint64_t high = load_high_first(bytes) >> half_gap >> half_gap;
  std::uint64_t low = load_high_first(bytes + size - k_slice);
  const std::uint64_t first = std::uint64_t{crc} << 48;
  high ^= first >> half_gap >> half_gap;
  if (size < k_slice + 2) low ^= first << (8 * (size - k_slice));
  return static_cast<std::uint16_t>(sum_of_slice<k_slice>(high) ^
                                    sum_of_slice<0>(low));
}

}  // namespace

std::uint16_t crc16_add(std::uint16_t crc, const void* bytes,
                        std::size_t size) {
  const auto* byte = static_cast<const unsigned char*>(bytes);
  for (; size > 2 * k_slice; size -= k_slice, byte += k_slice)
    crc = static_cast<std::uint16_t>(
        sum_of_slice<0>(load_high_first(byte) ^ std::uint64_t{crc} << 48));
  if (size >= k_slice) return add_last_bytes(crc, byte, size);
  for (; size != 0; --size, ++byte) crc = add_byte(crc, *byte);
  return crc;
}

std::uint16_t crc16(const void* bytes, std::size_t size) {
  return crc16_add(k_crc16_start, bytes, size);
}

// ---- 32 bits

namespace {

constexpr std::uint32_t k_crc32_start = 0xFFFFFFFF;

// Table k gives what a byte does to the sum when k more bytes follow it.
using Crc32Tables = std::array<std::array<std::uint32_t, 256>, k_slice>;

constexpr Crc32Tables make_crc32_tables() {
  Crc32Tables tables{};
  for (std::uint32_t i = 0; i < 256; ++i) {
    std::uint32_t crc = i;
    for (int bit = 0; bit < 8; ++bit)
      crc = (crc & 1U) ? (crc >> 1) ^ 0xEDB88320U : crc >> 1;
    tables[0][i] = crc;
  }
  for (std::size_t k = 1; k < k_slice; ++k)
    for (std::size_t i = 0; i < 256; ++i) {
      const std::uint32_t crc = tables[k - 1][i];
      tables[k][i] = (crc >> 8) ^ tables[0][crc & 0xFF];
    }
  return tables;
}

constexpr Crc32Tables k_crc32_tables = make_crc32_tables();

// The sum of eight bytes, the last the highest, which hold the sum so far in
// the first four.
std::uint32_t crc32_of_slice(std::uint64_t bytes) {
  const auto part = [bytes](std::size_t k) {
    return k_crc32_tables[k_slice - 1 - k][bytes >> (8 * k) & 0xFF];
  };
  return part(0) ^ part(1) ^ part(2) ^ part(3) ^ part(4) ^ part(5) ^ part(6) ^
         part(7);
}

}  // namespace

std::uint32_t crc32_byte(std::uint32_t crc, std::uint8_t byte) {
  return (crc >> 8) ^ k_crc32_tables[0][(crc ^ byte) & 0xFF];
}

std::uint32_t crc32_add(std::uint32_t crc, const void* bytes,
                        std::size_t size) {
  const auto* byte = static_cast<const unsigned char*>(bytes);
  for (; size >= k_slice; size -= k_slice, byte += k_slice)
    crc = crc32_of_slice(load_low_first(byte) ^ crc);
  for (; size != 0; --size, ++byte) crc = crc32_byte(crc, *byte);
  return crc;
}

std::uint32_t crc32(const void* bytes, std::size_t size) {
  return crc32_add(k_crc32_start, bytes, size);
}
