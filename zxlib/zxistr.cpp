// zxistr.cpp - strings behind an interface.
// Tests: tests/zxlib/zxistr_test.cpp.
#include "zxistr.h"

#include <new>

namespace {

// What make_istr() makes.  In memory: the table of the interface, that of
// the type name, the count, the text.
class zxIStrImpl final : public IZxStr, public zxTypeName {
 public:
  explicit zxIStrImpl(const zxStr& initial) : text(initial) {}

  std::int32_t ZX_OPERATION QueryInterface(const zxGuid& id,
                                           void** result) override;
  std::uint32_t ZX_OPERATION AddRef() override;
  std::uint32_t ZX_OPERATION Release() override;

  std::int32_t ZX_OPERATION length() override { return text.length(); }
  const char* ZX_OPERATION data() override { return text.c_str(); }
  void ZX_OPERATION set_length(std::int32_t n) override { text.set_length(n); }
  void ZX_OPERATION clear() override { text.clear(); }
  void ZX_OPERATION append(const char* characters, std::int32_t n) override {
    text.append(characters, n);
  }

  const char* type_name() const override { return "zxIStrImpl"; }

 private:
  std::int32_t refs = 1;
  zxStr text;
};

std::int32_t zxIStrImpl::QueryInterface(const zxGuid& id, void** result) {
  if (!ZX_ASSERT(result != nullptr)) return k_no_place_for_interface;
  *result = nullptr;
  if (id != k_guid_istr && id != k_guid_unknown) return k_no_interface;
  *result = static_cast<IZxStr*>(this);
  AddRef();
  return k_interface_found;
}

std::uint32_t zxIStrImpl::AddRef() {
  zx_object_hooks.add_ref(type_name());
  return static_cast<std::uint32_t>(++refs);
}

std::uint32_t zxIStrImpl::Release() {
  if (!ZX_ASSERT_AT(refs > 0, "zxistr", 62)) return 0;
  zx_object_hooks.release(type_name());
  if (--refs > 0) return static_cast<std::uint32_t>(refs);
  this->~zxIStrImpl();
  zx_realloc(this, 0);
  return 0;
}

}  // namespace

IZxStr* make_istr(const zxStr& text) {
  return ::new (zx_realloc(nullptr, sizeof(zxIStrImpl))) zxIStrImpl(text);
}

// The other way round, an object held by nobody else would die on being
// stored once more.
IZxStrRef& IZxStrRef::operator=(IZxStr* object) {
  if (object != nullptr) object->AddRef();
  if (held != nullptr) held->Release();
  held = object;
  return *this;
}

const char* IZxStrRef::data() const {
  return ZX_ASSERT(held != nullptr) ? held->data() : "";
}

void IZxStrRef::set_length(std::int32_t length) const {
  if (ZX_ASSERT(held != nullptr)) held->set_length(length);
}

void IZxStrRef::clear() const {
  if (ZX_ASSERT(held != nullptr)) held->clear();
}

void IZxStrRef::append(const char* characters, std::int32_t length) const {
  if (ZX_ASSERT(held != nullptr)) held->append(characters, length);
}

zxStr to_str(const IZxStrRef& text) {
  IZxStr* const object = text.get();
  if (!ZX_ASSERT(object != nullptr)) return {};
  return {object->data(), object->length()};
}
