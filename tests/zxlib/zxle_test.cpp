// zxle_test.cpp - tests of zxlib/zxle.h: little-endian numbers in files.

#include "zxle.h"

#include <gtest/gtest.h>

#include <climits>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>

namespace {

using namespace std::string_view_literals;

template <class T>
std::string bytes_of(const T& value) {
  return {reinterpret_cast<const char*>(&value), sizeof value};
}

// Both ways: the number gives the bytes, and the bytes give the number.
template <class T>
void expect_bytes(T number, std::string_view bytes) {
  SCOPED_TRACE(number);
  const zxLe<T> made(number);
  EXPECT_EQ(bytes_of(made), bytes);
  EXPECT_EQ(static_cast<T>(made), number);
  zxLe<T> read(static_cast<T>(~number));
  std::memcpy(&read, bytes.data(), sizeof read);
  EXPECT_EQ(static_cast<T>(read), number);
}

TEST(zxle, numbers_lie_lowest_byte_first) {
  expect_bytes<std::uint16_t>(0x1234, "\x34\x12"sv);
  expect_bytes<std::uint16_t>(0xFF80, "\x80\xFF"sv);
  expect_bytes<std::int16_t>(-32768, "\x00\x80"sv);
  expect_bytes<std::int16_t>(-1, "\xFF\xFF"sv);
  expect_bytes<std::int16_t>(32141, "\x8D\x7D"sv);
  expect_bytes<std::uint32_t>(0x12345678, "\x78\x56\x34\x12"sv);
  expect_bytes<std::uint32_t>(0x80FF7F00, "\x00\x7F\xFF\x80"sv);
  expect_bytes<std::int32_t>(INT32_MIN, "\x00\x00\x00\x80"sv);
  expect_bytes<std::int32_t>(INT32_MAX, "\xFF\xFF\xFF\x7F"sv);
  expect_bytes<std::int32_t>(-2, "\xFE\xFF\xFF\xFF"sv);
  expect_bytes<std::int64_t>(-2, "\xFE\xFF\xFF\xFF\xFF\xFF\xFF\xFF"sv);
  expect_bytes<std::int64_t>(INT64_MIN, "\0\0\0\0\0\0\0\x80"sv);
  expect_bytes<std::uint64_t>(0x0123456789ABCDEF,
                              "\xEF\xCD\xAB\x89\x67\x45\x23\x01"sv);
}

TEST(zxle, every_16_bit_number_comes_back) {
  for (int i = -32768; i <= 32767; ++i) {
    const auto number = static_cast<std::int16_t>(i);
    const zxLe<std::int16_t> made(number);
    const std::string bytes = bytes_of(made);
    ASSERT_EQ(static_cast<std::int16_t>(made), number);
    ASSERT_EQ(static_cast<unsigned char>(bytes[0]), i & 0xFF);
    ASSERT_EQ(static_cast<unsigned char>(bytes[1]), i >> 8 & 0xFF);
  }
}

TEST(zxle, assignment_replaces_the_number) {
  zxLe<std::int32_t> number(-1);
  number = 0x01020304;
  EXPECT_EQ(bytes_of(number), "\x04\x03\x02\x01"sv);
  EXPECT_EQ(number + 1, 0x01020305);
}

// A structure of a file as it lies there, at odd places.
struct Record {
  char kind;
  zxLe<std::int32_t> offset;
  char name[3];
  zxLe<std::int16_t> count;
  zxLe<std::uint64_t> stamp;
};

TEST(zxle, a_structure_is_exactly_its_bytes) {
  static_assert(sizeof(Record) == 18 && alignof(Record) == 1);
  static_assert(std::is_trivially_copyable_v<Record>);
  static_assert(offsetof(Record, offset) == 1 && offsetof(Record, count) == 8);
  constexpr auto k_file =
      "?!\xFE\xFF\xFF\xFF"
      "abc\x10\x27\x01\0\0\0\0\0\0\x80"sv;
  static_assert(k_file.size() == 19);
  Record record;
  std::memcpy(&record, k_file.data() + 1, sizeof record);
  EXPECT_EQ(record.kind, '!');
  EXPECT_EQ(record.offset, -2);
  EXPECT_EQ(record.count, 10000);
  EXPECT_EQ(record.stamp, 0x8000000000000001U);
  EXPECT_EQ(bytes_of(record), k_file.substr(1));
}

TEST(zxle, numbers_are_known_at_compile_time) {
  static_assert(zxLe<std::int32_t>(-123456) == -123456);
  static_assert(zxLe<std::uint16_t>(65535) == 65535);
  static_assert(sizeof(zxLe<std::int64_t>) == 8);
  static_assert(alignof(zxLe<std::int64_t>) == 1);
}

}  // namespace
