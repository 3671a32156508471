// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "platform/xpc.h"

namespace {

TEST(XpcDict, KeepsInsertionOrderAndReplacesInPlace) {
  xpc::dict d;
  d.set("b", xpc::object::string("1"));
  d.set("a", xpc::object::int64(2));
  d.set("b", xpc::object::boolean(false));
  const std::vector<xpc::entry> expected = {{"b", xpc::object::boolean(false)}, {"a", xpc::object::int64(2)}};
  EXPECT_EQ(*d.obj().asEntries(), expected);
  EXPECT_EQ(d.get("a"), xpc::object::int64(2));
  EXPECT_TRUE(d.get("missing").isNull());
}

TEST(XpcDict, BuildingNeverChangesSharedObjects) {
  xpc::dict d;
  d.set("k", xpc::object::string("v"));
  xpc::object snapshot = d;
  d.set("k", xpc::object::string("w"));
  EXPECT_EQ(xpc::dyn_cast_or_default(snapshot.get("k"), ""), "v");
  EXPECT_EQ(xpc::dyn_cast_or_default(d.get("k"), ""), "w");
}

TEST(XpcObject, EqualityIsByValue) {
  auto a = xpc::object::dictionary({{"k", xpc::object::array({xpc::object::uint64(1)})}});
  auto b = xpc::object::dictionary({{"k", xpc::object::array({xpc::object::uint64(1)})}});
  auto c = xpc::object::dictionary({{"k", xpc::object::array({xpc::object::int64(1)})}});
  EXPECT_EQ(a, b);
  EXPECT_FALSE(a == c);
  EXPECT_FALSE(xpc::object() == xpc::object::string(""));
}

TEST(EqualNocase, FoldsAsciiLettersOnly) {
  EXPECT_TRUE(util::equal_nocase("TAR.GZ", "tar.gz"));
  EXPECT_TRUE(util::equal_nocase("", ""));
  EXPECT_FALSE(util::equal_nocase("tar", "tar.gz"));
  EXPECT_FALSE(util::equal_nocase("\xc3\x89", "\xc3\xa9"));  // É and é stay distinct
  EXPECT_FALSE(util::equal_nocase("[", "{"));
}

}  // namespace
