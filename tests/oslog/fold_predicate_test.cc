// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "platform/logstore/predicate.h"
#include "platform/logstore/unicode_fold.h"
#include "tests/oslog/fake_log_store.h"

namespace {

using logstore::containsFolded;
using logstore::foldForMatch;

struct ContainsCase {
  const char* haystack;
  const char* needle;
  bool expected;
};

class FoldedContains : public testing::TestWithParam<ContainsCase> {};

TEST_P(FoldedContains, IgnoresCaseAndDiacritics) {
  const auto& c = GetParam();
  EXPECT_EQ(containsFolded(c.haystack, foldForMatch(c.needle)), c.expected)
      << c.haystack << " / " << c.needle;
}

INSTANTIATE_TEST_SUITE_P(
    Samples, FoldedContains,
    testing::Values(ContainsCase{"/usr/libexec/Zélmar/ZelmarBasebandd", "ZelmarBaseband", true},
                    ContainsCase{"/usr/libexec/Zélmar/ZelmarBasebandd", "zelmar/zelmar", true},
                    ContainsCase{"/opt/ZÉLMAR/bin/tool", "zelmar", true},
                    ContainsCase{"/opt/zelmar", "ZÉLMAR", true},
                    ContainsCase{"/opt/Ze\u0301lmar", "zélmar", true},  // decomposed against precomposed
                    ContainsCase{"/usr/lib/ΆΘΉΝΑ/ÿ", "αθηνα/y", true},
                    ContainsCase{"/srv/Йошкар-Ола", "иошкар", true},
                    ContainsCase{"/srv/Straße", "STRASSE", true},
                    ContainsCase{"/srv/ﬁle", "FILE", true},
                    ContainsCase{"/srv/Ørsted", "orsted", false},  // a letter of its own, not o with a mark
                    ContainsCase{"/usr/sbin/Telhub", "telhubx", false},
                    ContainsCase{"/usr/sbin/Telhub", "", false},
                    ContainsCase{"/bad/\xff/Zelmar", "zelmar", true}));

TEST(FoldForMatch, MapsMarksAwayAndInvalidBytesToReplacement) {
  EXPECT_EQ(foldForMatch("ÀÉÎÕÜ Ç"), "aeiou c");
  EXPECT_EQ(foldForMatch("A\xcc\x81"), "a");
  EXPECT_EQ(foldForMatch("x\xffy"), "x\uFFFDy");
  EXPECT_EQ(foldForMatch("한국"), "한국");  // syllables stay whole
}

logstore::Event eventOf(const char* process, const char* exe) {
  logstore::Event e = oslog_test::messageEvent(0, "", "m");
  if (process) e.process.assign(process); else e.process.clear();
  if (exe) e.senderImagePath.assign(exe);
  return e;
}

struct PredicateCase {
  std::vector<std::string> processes;
  std::vector<std::string> images;
  const char* process;
  const char* exe;
  bool expected;
};

class PredicateMatch : public testing::TestWithParam<PredicateCase> {};

TEST_P(PredicateMatch, OrOfExactProcessesAndImageFragments) {
  const auto& c = GetParam();
  logstore::Predicate predicate(c.processes, c.images);
  EXPECT_EQ(predicate.matches(eventOf(c.process, c.exe)), c.expected)
      << (c.process ? c.process : "(no process)") << " " << (c.exe ? c.exe : "(no exe)");
}

INSTANTIATE_TEST_SUITE_P(
    Table, PredicateMatch,
    testing::Values(PredicateCase{{}, {}, "anything", nullptr, true},
                    PredicateCase{{}, {}, nullptr, nullptr, true},
                    PredicateCase{{"Telhub"}, {}, "Telhub", "/usr/sbin/Telhub", true},
                    PredicateCase{{"Telhub"}, {}, "telhub", "/usr/sbin/telhub", false},
                    PredicateCase{{"Telhub"}, {}, "TelhubRootHelper", nullptr, false},
                    PredicateCase{{"Telhub"}, {}, nullptr, "/usr/sbin/Telhub", false},
                    PredicateCase{{"Telhub", "pwrkeepd"}, {}, "pwrkeepd", nullptr, true},
                    PredicateCase{{}, {"ZelmarBaseband"}, "x", "/usr/libexec/zelmarbasebandd", true},
                    PredicateCase{{}, {"ZelmarBaseband"}, "ZelmarBasebandd", nullptr, false},
                    PredicateCase{{"Telhub"}, {"Zelmar"}, "other", "/opt/ZÉLMAR/x", true},
                    PredicateCase{{"Telhub"}, {"Zelmar"}, "other", "/opt/other", false}));

}  // namespace
