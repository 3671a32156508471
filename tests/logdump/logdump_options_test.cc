// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "logdump/logdump_options.h"
#include "logdump/trace_names.h"

namespace {

TEST(LogdumpOptions, ParsesOptionsUntilTheReason) {
  struct Case {
    std::list<std::string> typed;
    CompressionMode compression;
    std::string reason;
    bool nonui;
    std::list<std::string> left;  // typed order
  };
  const Case cases[] = {
      {{}, TarGz, "[vorntool] User triggered", false, {}},
      {{"TAR.GZ", "NonUI", "crash"}, TarGz, "[vorntool] crash", true, {}},
      {{"nocompress", "tar"}, Tar, "[vorntool] User triggered", false, {}},
      {{"nocompress", "my", "reason"}, None, "[vorntool] my", false, {"reason"}},
      {{"my", "nocompress"}, TarGz, "[vorntool] my", false, {"nocompress"}},
      {{"Tar"}, Tar, "[vorntool] User triggered", false, {}},
      {{"tar.gzx"}, TarGz, "[vorntool] tar.gzx", false, {}},
      {{""}, TarGz, "[vorntool] ", false, {}},
  };
  for (const auto& c : cases) {
    std::list<std::string> args(c.typed.rbegin(), c.typed.rend());
    CompressionMode compression = TarGz;
    std::string reason = "stale";
    bool nonui = false;
    parseLogdumpOptions(args, compression, reason, nonui);
    EXPECT_EQ(compression, c.compression) << testing::PrintToString(c.typed);
    EXPECT_EQ(reason, c.reason) << testing::PrintToString(c.typed);
    EXPECT_EQ(nonui, c.nonui) << testing::PrintToString(c.typed);
    EXPECT_EQ(std::list<std::string>(args.rbegin(), args.rend()), c.left);
  }
}

TEST(TraceMode, NamedModesAndWholeIntegers) {
  struct Case {
    std::string text;
    bool valid;
    int value;
  };
  const Case cases[] = {
      {"false", true, 0}, {"OFF", true, 0},  {"No", true, 0},     {"true", true, 1},
      {"on", true, 1},    {"YES", true, 1},  {"full", true, 1},   {"LITE", true, 2},
      {"3", true, 3},     {" 3", true, 3},   {"+3", true, 3},     {"0x3", true, 3},
      {"-7", true, -7},   {"010", true, 8},  {"0X1f", true, 31},
      {"2147483647", true, 2147483647},      {"-2147483648", true, -2147483647 - 1},
      {"3 ", false, 0},   {"3x", false, 0},  {"", false, 0},      {"2147483648", false, 0},
      {"09", false, 0},   {"lites", false, 0}, {std::string("3\0", 2), false, 0},
  };
  for (const auto& c : cases) {
    bool valid = !c.valid;
    const int value = parseTraceMode(c.text, valid);
    EXPECT_EQ(valid, c.valid) << '"' << c.text << '"';
    if (c.valid) {
      EXPECT_EQ(value, c.value) << '"' << c.text << '"';
    }
  }
}

}  // namespace
