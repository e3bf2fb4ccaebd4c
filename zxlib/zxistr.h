// zxistr.h - IZxStr, a string behind an interface, by which text crosses the
// boundary of a module file: neither side knows the other's string layout.
//
//   IZxStr* const made = make_istr("abc");  // one reference, the maker's
//   IZxStrRef text = made;                  // two
//   made->Release();                        // one, which ends with `text`
//   module->get_info(text.get());
//   zxStr result = to_str(text);
//
// The count is a plain integer: an object is used by one thread at a time.
#ifndef ZXISTR_H
#define ZXISTR_H

#include <cstdint>

#include "zxguid.h"
#include "zxstr.h"

// {EBF8BB6A-A7C8-4B05-9856-B32056D7262F}
inline constexpr zxGuid k_guid_istr = {
    0xEBF8BB6A,
    0xA7C8,
    0x4B05,
    {0x98, 0x56, 0xB3, 0x20, 0x56, 0xD7, 0x26, 0x2F}};

// The interface; see zxguid.h for what must never change.  Arguments are
// checked as zxStr checks them.
class IZxStr : public IZxUnknown {
 public:
  virtual std::int32_t ZX_OPERATION length() = 0;

  // The characters with a NUL behind them; valid until the text changes or
  // its object dies.
  virtual const char* ZX_OPERATION data() = 0;

  // Cuts, or widens with NUL characters.
  virtual void ZX_OPERATION set_length(std::int32_t length) = 0;
  virtual void ZX_OPERATION clear() = 0;
  virtual void ZX_OPERATION append(const char* characters,
                                   std::int32_t length) = 0;

 protected:
  ~IZxStr() = default;
};

// A new object with this text and a reference count of 1, which is the
// caller's to release.  It answers for k_guid_istr and k_guid_unknown; its
// type name is "zxIStrImpl".  A Release at a count of 0 or less fails the
// assertion zxistr:62 and returns 0.
IZxStr* make_istr(const zxStr& text);

// A holder of one reference, or of none.  A null pointer can be held; the
// operations on the text then fail an assertion and do nothing.
class IZxStrRef {
 public:
  IZxStrRef() = default;
  IZxStrRef(IZxStr* object) { *this = object; }
  IZxStrRef(const IZxStrRef& other) { *this = other.held; }
  ~IZxStrRef() { *this = nullptr; }

  // Adds a reference to the new object and releases the old one, also if
  // they are one and the same.
  IZxStrRef& operator=(IZxStr* object);
  IZxStrRef& operator=(const IZxStrRef& other) { return *this = other.held; }

  // The object, still held here; or null.
  IZxStr* get() const { return held; }

  const char* data() const;  // "" without an object
  void set_length(std::int32_t length) const;
  void clear() const;
  void append(const char* characters, std::int32_t length) const;

 private:
  IZxStr* held = nullptr;
};

static_assert(sizeof(IZxStrRef) == sizeof(IZxStr*));

// The text as a string of the caller's own; empty without an object, behind
// a dropped assertion.
zxStr to_str(const IZxStrRef& text);

#endif  // ZXISTR_H
