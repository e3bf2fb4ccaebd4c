// zxqva.h - zxQVA<T>, the library's growable array; it serves as array, as
// stack (at its end) and as queue (taking from the front moves the start
// and shifts nothing).
//
// Differences from std::vector:
//   - elements are moved by copying their bytes, so T must be zx_relocatable;
//   - small arrays grow by 32 elements, those of 128 and more by a sixteenth;
//   - the checks are part of every build, and each operation first checks
//     the array's invariant;
//   - ref(i) behind the end grows the array up to i.
//
// Sorting: begin() and end() are plain pointers, which the standard's
// algorithms take.
//
// References and pointers to elements last until the array grows, slides or
// loses the element.  An argument of append() may be an element of the same
// array.  After a failure that was dropped an operation leaves the array
// unchanged and returns a neutral value.
//
//   zxQVA<zxStr> names;
//   names.append("first");
//   while (names.length() > 0) use(names.pop_first());
#ifndef ZXQVA_H
#define ZXQVA_H

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>
#include <utility>

#include "zxatsys.h"
#include "zxmisc.h"

// The value that stands for an element that is not there; never written to.
// It is made at the first use and never destroyed: constructors and
// destructors of static objects may come here.
template <class T>
const T& zx_empty_value() {
  alignas(T) static unsigned char room[sizeof(T)];
  static const T* const value = ::new (static_cast<void*>(room)) T();
  return *value;
}

// A place that may be written to when the right one is out of reach; each
// call makes it default again.  It is never destroyed either.
template <class T>
T& zx_scratch_value() {
  alignas(T) static unsigned char room[sizeof(T)];
  static T* const value = ::new (static_cast<void*>(room)) T();
  *value = T();
  return *value;
}

template <class T>
class zxQVA {
  static_assert(zx_relocatable<T>, "elements are moved by their bytes");

 public:
  zxQVA() = default;
  ~zxQVA() { clear(); }
  zxQVA(const zxQVA&) = delete;
  zxQVA& operator=(const zxQVA&) = delete;

  // ---- reading
  std::int32_t length() const { return count; }
  std::int32_t block_capacity() const { return capacity; }
  std::int32_t block_offset() const { return offset; }

  T* begin() & { return first; }
  T* end() & { return first + count; }
  const T* begin() const& { return first; }
  const T* end() const& { return first + count; }
  const T* begin() const&& = delete;
  const T* end() const&& = delete;

  // Element i; outside 0 to length() - 1 an assertion fails.
  T& get(std::int32_t i) { return is_live(i) ? first[i] : scratch(); }
  const T& get(std::int32_t i) const {
    return is_live(i) ? first[i] : zx_empty_value<T>();
  }

  // Element i, or the shared empty value when there is none.
  const T& get_or(std::int32_t i) const {
    return check() && zx_wide(i) < count ? first[i] : zx_empty_value<T>();
  }

  // Element i for writing; the array grows to hold it.  A negative index
  // fails an assertion.
  T& ref(std::int32_t i) {
    if (!check() || !ZX_ASSERT(i >= 0)) return scratch();
    grow_to(i);
    return i < count ? first[i] : scratch();
  }

  // Element i counted from the end, 0 being the last; and the last one.
  T& from_top(std::int32_t i) {
    return ZX_ASSERT(i >= 0 && i < count) ? first[count - 1 - i] : scratch();
  }
  T& last() { return from_top(0); }

  // ---- the end: an empty array fails an assertion in drop and pop
  void append(const T& value) {
    // Kept aside, since the element that is stored could be a count as well.
    const std::int32_t n = count;
    if (!has_room_behind(n)) [[unlikely]]
      return append_growing(value);
    ::new (static_cast<void*>(first + zx_wide(n))) T(value);
    count = n + 1;
  }

  void drop_last() {
    if (!has_elements()) return;
    first[--count].~T();
  }

  T pop_last() {
    if (!has_elements()) return T();
    T value(std::move(first[count - 1]));
    first[--count].~T();
    return value;
  }

  // ---- the front
  void drop_first() {
    if (has_elements()) leave_first();
  }

  T pop_first() {
    if (!has_elements()) return T();
    T value(std::move(*first));
    leave_first();
    return value;
  }

  // Makes n default elements ahead of the others, which become the first ones.
  // Room is made for about as many again, so that repeated calls cost no more
  // than the elements that they make.
  void grow_front(std::int32_t n) {
    if (!check() || !ZX_ASSERT(n >= 0)) return;
    if (n > offset && !make_room_in_front(n)) return;
    for (; n > 0; --n) {
      ::new (static_cast<void*>(first - 1)) T();
      --first;
      --offset;
      ++count;
    }
  }

  // ---- sizing
  // Destroys the elements behind the first n, or grows to n.
  void set_length(std::int32_t n) {
    if (!check() || !ZX_ASSERT(n >= 0)) return;
    while (count > n) first[--count].~T();
    if (n > count) grow_to(n - 1);
  }

  // Destroys all elements and gives the block back.
  void clear() {
    set_length(0);
    reserve(0, 0);
  }

  // Makes the block hold n elements behind `new_offset` skipped ones, and no
  // more; nothing happens if n is below length().  Beyond the limit of 32
  // bits of bytes: message 2205.
  void reserve(std::int32_t n, std::int32_t new_offset) {
    if (!check() || !ZX_ASSERT(n >= 0 && new_offset >= 0)) return;
    if (n < count) return;
    const std::int64_t total = std::int64_t{n} + new_offset;
    if (total == 0) {
      free_block();
    } else if (total > capacity) {
      if (total >= k_limit) return bail_code(2205);
      resize_block(static_cast<std::int32_t>(total));
      slide_to(new_offset);
    } else {
      slide_to(new_offset);
      if (total < capacity) resize_block(static_cast<std::int32_t>(total));
    }
  }

  // Makes element i exist: new elements are default-constructed.
  void grow_to(std::int32_t i) {
    if (!check() || !ZX_ASSERT(i >= 0)) return;
    if (i < count) return;
    if (std::int64_t{i} + offset >= capacity && !make_room_for(i)) return;
    for (; count <= i; ++count) ::new (static_cast<void*>(first + count)) T();
  }

  // Moves the elements so that `new_offset` places stand ahead of them.
  void slide_to(std::int32_t new_offset) {
    if (!check() || !ZX_ASSERT(new_offset >= 0 &&
                               std::int64_t{new_offset} + count <= capacity))
      return;
    if (new_offset == offset) return;
    T* target = base + new_offset;
    move_bytes(target, first, count);
    first = target;
    offset = new_offset;
  }

 private:
  // The smallest number of elements whose size does not fit 32 bits, and
  // never more than a count can be.
  static constexpr std::int64_t k_byte_limit = 0xFFFFFFFF / sizeof(T);
  static constexpr std::int64_t k_count_limit = std::int64_t{INT32_MAX} + 1;
  static constexpr std::int64_t k_limit =
      k_byte_limit > k_count_limit ? k_count_limit : k_byte_limit;

  // From this index on growth is by a sixteenth.
  static constexpr std::int32_t k_large = 128;
  static constexpr std::int32_t k_small_step = 32;

  static T& scratch() { return zx_scratch_value<T>(); }

  // The invariant.  A negative number counts as one beyond every capacity.
  bool is_sound() const {
    if (zx_wide(offset) + zx_wide(count) > capacity) [[unlikely]]
      return false;
    return __builtin_expect(first == base + zx_wide(offset), true) ||
           capacity == 0;
  }
  bool check() const { return ZX_ASSERT(is_sound()); }

  // The invariant of an array of n elements, and room for one more.
  bool has_room_behind(std::int32_t n) const {
    if (zx_wide(offset) + zx_wide(n) >= capacity) [[unlikely]]
      return false;
    return __builtin_expect(first == base + zx_wide(offset), true);
  }

  void leave_first() {
    first->~T();
    --count;
    ++offset;
    ++first;
  }

  bool is_live(std::int32_t i) const {
    return check() && ZX_ASSERT(zx_wide(i) < count);
  }

  bool has_elements() const { return check() && ZX_ASSERT(count > 0); }

  // The value is copied first: the block may move under it.
  [[gnu::noinline]] void append_growing(T value) {
    if (!check()) return;
    const std::int32_t i = count;
    grow_to(i);
    if (i < count) first[i] = std::move(value);
  }

  // Room for element i, by growth or by taking back the room in front.
  bool make_room_for(std::int32_t i) {
    if (i < capacity) {
      slide_to(0);
      return true;
    }
    const std::int64_t wanted =
        std::int64_t{i} + (i < k_large ? k_small_step : i / 16);
    reserve(wanted > INT32_MAX ? INT32_MAX : static_cast<std::int32_t>(wanted),
            0);
    return i < capacity;
  }

  // Room for n elements ahead of the first one.
  bool make_room_in_front(std::int32_t n) {
    const std::int64_t wanted = std::int64_t{n} + count;
    const std::int64_t total = wanted + count;
    if (total >= k_limit) {
      bail_code(2205);
      return false;
    }
    if (total > capacity) resize_block(static_cast<std::int32_t>(total));
    slide_to(static_cast<std::int32_t>(wanted));
    return true;
  }

  static void move_bytes(T* to, const T* from, std::int32_t n) {
    if (n > 0)
      std::memmove(static_cast<void*>(to), static_cast<const void*>(from),
                   zx_size(n) * sizeof(T));
  }

  void resize_block(std::int32_t n) {
    base = static_cast<T*>(zx_realloc(base, zx_size(n) * sizeof(T)));
    first = base + offset;
    capacity = n;
  }

  void free_block() {
    if (base != nullptr) zx_realloc(base, 0);
    base = first = nullptr;
    capacity = count = offset = 0;
  }

  std::int32_t capacity = 0;  // elements that the block holds
  std::int32_t count = 0;     // live elements
  std::int32_t offset = 0;    // elements skipped at the block's start
  T* base = nullptr;          // the block; null if capacity is 0
  T* first = nullptr;         // base + offset
};

#endif  // ZXQVA_H
