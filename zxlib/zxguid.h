// zxguid.h - what objects that cross the boundary of a module file agree on:
// identifiers, the root of the interfaces, how their operations are called,
// type names, and the reports of living objects.
//
// An interface is a class of pure operations.  Its object begins with a
// pointer to a table of their addresses in the order of declaration, and
// that order, the operations' types and the identifier never change: either
// side of the boundary may have been built elsewhere.  For the same reason
// an interface has no virtual destructor, which would take places in the
// table, and an object ends by Release() alone.
//
// Process-wide state: zx_object_hooks.
#ifndef ZXGUID_H
#define ZXGUID_H

#include <cstddef>
#include <cstdint>

// How an operation of an interface is called: on 32-bit Intel machines the
// callee clears the arguments, elsewhere there is one way alone.
#if defined(__i386__)
#define ZX_OPERATION __attribute__((stdcall))
#else
#define ZX_OPERATION
#endif

// ------------------------------------------------------------ identifiers --

// An identifier, as it lies in memory on either side:
//
//     0        4       6       8
//   +--------+-------+-------+---------------------------+
//   | data1  | data2 | data3 | data4, eight single bytes |
//   +--------+-------+-------+---------------------------+
//
// In text, {00112233-4455-6677-8899-AABBCCDDEEFF} is {0x00112233, 0x4455,
// 0x6677, {0x88, 0x99, 0xAA, ...}}.  The numbers are little-endian.
struct zxGuid {
  std::uint32_t data1;
  std::uint16_t data2;
  std::uint16_t data3;
  std::uint8_t data4[8];

  friend constexpr bool operator==(const zxGuid&, const zxGuid&) = default;
};
static_assert(sizeof(zxGuid) == 16);
static_assert(offsetof(zxGuid, data2) == 4);
static_assert(offsetof(zxGuid, data3) == 6);
static_assert(offsetof(zxGuid, data4) == 8);

// Of the root of the interfaces: {00000000-0000-0000-C000-000000000046}.
inline constexpr zxGuid k_guid_unknown = {
    0, 0, 0, {0xC0, 0, 0, 0, 0, 0, 0, 0x46}};

// ------------------------------------------------------------- interfaces --

// What QueryInterface returns.
inline constexpr std::int32_t k_interface_found = 0;
inline constexpr std::int32_t k_no_interface =
    static_cast<std::int32_t>(0x80004002U);
inline constexpr std::int32_t k_no_place_for_interface =
    static_cast<std::int32_t>(0x80004003U);

// The root of the interfaces.  An object counts the pointers to it that are
// held, and deletes itself when the last one is released.
class IZxUnknown {
 public:
  // Stores the interface of that identifier with a reference added, or null
  // (k_no_interface).  A null `result` fails an assertion of the object's
  // module and gives k_no_place_for_interface.
  virtual std::int32_t ZX_OPERATION QueryInterface(const zxGuid& id,
                                                   void** result) = 0;

  // Each returns the new count.
  virtual std::uint32_t ZX_OPERATION AddRef() = 0;
  virtual std::uint32_t ZX_OPERATION Release() = 0;

 protected:
  ~IZxUnknown() = default;
};

// ---------------------------------------------------------- living objects --

// The base that gives an object's class a name at run time.
class zxTypeName {
 public:
  // Lives for ever.
  virtual const char* type_name() const = 0;

 protected:
  ~zxTypeName() = default;
};

// Who hears of each AddRef and Release, by the name of the object's class;
// nobody by default.  The first reference, with which an object is made, is
// no AddRef.
struct ZxObjectHooks {
  void (*add_ref)(const char* class_name);
  void (*release)(const char* class_name);
};
inline constinit ZxObjectHooks zx_object_hooks = {[](const char*) {},
                                                  [](const char*) {}};

#endif  // ZXGUID_H
