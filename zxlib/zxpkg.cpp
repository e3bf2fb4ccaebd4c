// zxpkg.cpp - the package registry.
// Tests: tests/zxlib/zxpkg_test.cpp.
#include "zxpkg.h"

#include <cstring>

constinit ZxPackage* packages = nullptr;

void register_package(ZxPackage* package) {
  if (!ZX_ASSERT(package->next == nullptr)) return;
  ZxPackage** place = &packages;
  for (; *place != nullptr; place = &(*place)->next) {
    const ZxPackage& other = **place;
    if (std::strcmp(other.name, package->name) != 0) continue;
    ZX_ASSERT(std::strcmp(other.version, package->version) == 0);
    return;
  }
  *place = package;
}

zxStr packages_long() {
  zxStr text;
  for (const ZxPackage* p = packages; p != nullptr; p = p->next)
    text.append(p->name)
        .append(' ')
        .append(p->version)
        .append(' ')
        .append(p->config)
        .append('\n');
  return text;
}
