// zxpkg.h - the registry that tells which libraries are in a program.
#ifndef ZXPKG_H
#define ZXPKG_H

#include <cstdint>

#include "zxstr.h"

// The record that each library has one static instance of.
struct ZxPackage {
  const char* name;
  const char* version;
  const char* config;  // the build configuration
  std::int32_t reserved;
  ZxPackage* next;
};

// The first package, or null; the others follow by `next`.
extern ZxPackage* packages;

// Adds a package at the end of the list unless one of its name is there.
// Another version of the same library, or a record that is linked already,
// fails an assertion, and the list stays as it is.
void register_package(ZxPackage* package);

// "name version config" and a line feed for each package.
zxStr packages_long();

#endif  // ZXPKG_H
