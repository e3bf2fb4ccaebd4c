// zxpkg_test.cpp - the package registry.
// Tests zxlib/zxpkg.h and zxpkg.cpp, and the library's own record in
// zxmainf.cpp.
#include "zxpkg.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "kit/failure.h"

namespace {

// A registry without packages until the end of the block.
class EmptyRegistry {
 public:
  EmptyRegistry() : before(packages) { packages = nullptr; }
  EmptyRegistry(const EmptyRegistry&) = delete;
  EmptyRegistry& operator=(const EmptyRegistry&) = delete;
  ~EmptyRegistry() { packages = before; }

 private:
  ZxPackage* before;
};

ZxPackage package(const char* name, const char* version,
                  const char* config = "cfg") {
  return {name, version, config, 0, nullptr};
}

std::string long_text() {
  const zxStr text = packages_long();
  return std::string(text.view());
}

using Addresses = std::vector<const ZxPackage*>;

Addresses registered() {
  Addresses all;
  for (const ZxPackage* p = packages; p != nullptr && all.size() < 100;
       p = p->next)
    all.push_back(p);
  return all;
}

TEST(zxpkg, the_library_registers_itself_alone) {
  EXPECT_EQ(long_text(), "zx 3.64b test w32  vc\n");
  ASSERT_NE(packages, nullptr);
  EXPECT_STREQ(packages->name, "zx");
  EXPECT_STREQ(packages->version, "3.64b");
  EXPECT_STREQ(packages->config, "test w32  vc");
  EXPECT_EQ(packages->reserved, 0);
}

TEST(zxpkg, an_empty_registry_has_an_empty_text) {
  const EmptyRegistry empty;
  EXPECT_EQ(long_text(), "");
}

TEST(zxpkg, packages_stand_in_the_order_of_their_registration) {
  const EmptyRegistry empty;
  ZxPackage b = package("b", "1", "one two");
  ZxPackage a = package("a", "2.0", "");
  ZxPackage c = package("", "", "x");
  register_package(&b);
  register_package(&a);
  register_package(&c);
  EXPECT_EQ(registered(), (Addresses{&b, &a, &c}));
  EXPECT_EQ(long_text(), "b 1 one two\na 2.0 \n  x\n");
}

TEST(zxpkg, registering_a_package_twice_adds_nothing) {
  const EmptyRegistry empty;
  ZxPackage a = package("a", "1");
  ZxPackage b = package("b", "1");
  register_package(&a);
  register_package(&a);
  EXPECT_EQ(registered(), (Addresses{&a}));
  register_package(&b);
  register_package(&b);
  EXPECT_EQ(registered(), (Addresses{&a, &b}));
}

TEST(zxpkg, another_record_of_the_same_name_and_version_adds_nothing) {
  const EmptyRegistry empty;
  ZxPackage first = package("a", "1", "one");
  ZxPackage second = package("a", "1", "two");
  ZxPackage last = package("z", "1");
  register_package(&first);
  register_package(&last);
  register_package(&second);
  EXPECT_EQ(registered(), (Addresses{&first, &last}));
  EXPECT_EQ(second.next, nullptr);
}

TEST(zxpkg, names_are_compared_as_texts_and_exactly) {
  const EmptyRegistry empty;
  const char same_name[] = {'a', '\0'};
  ZxPackage lower = package("a", "1");
  ZxPackage same = package(same_name, "1");
  ZxPackage upper = package("A", "2");
  ZxPackage longer = package("ab", "3");
  for (ZxPackage* p : {&lower, &same, &upper, &longer}) register_package(p);
  EXPECT_EQ(registered(), (Addresses{&lower, &upper, &longer}));
}

TEST(zxpkg, two_versions_of_one_library_fail_an_assertion) {
  const EmptyRegistry empty;
  ZxPackage one = package("a", "1");
  ZxPackage tail = package("b", "1");
  ZxPackage two = package("a", "1.0");
  register_package(&one);
  register_package(&tail);
  EXPECT_ASSERTION(register_package(&two), "zxpkg");
  EXPECT_EQ(registered(), (Addresses{&one, &tail}));
}

TEST(zxpkg, a_record_that_is_linked_already_fails_an_assertion) {
  const EmptyRegistry empty;
  ZxPackage head = package("a", "1");
  ZxPackage tail = package("b", "1");
  register_package(&head);
  register_package(&tail);
  EXPECT_ASSERTION(register_package(&head), "zxpkg");
  EXPECT_EQ(registered(), (Addresses{&head, &tail}));
}

TEST(zxpkg, behind_a_dropped_failure_the_list_is_unchanged) {
  const EmptyRegistry empty;
  ZxPackage head = package("a", "1");
  ZxPackage tail = package("b", "1");
  ZxPackage other_version = package("b", "2");
  ZxPackage linked = package("c", "1");
  linked.next = &head;
  register_package(&head);
  register_package(&tail);
  kit::with_failures_dropped([&] {
    register_package(&other_version);
    register_package(&linked);
    register_package(&head);
  });
  EXPECT_EQ(registered(), (Addresses{&head, &tail}));
  EXPECT_EQ(linked.next, &head);
  EXPECT_EQ(other_version.next, nullptr);
}

}  // namespace
