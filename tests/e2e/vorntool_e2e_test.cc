// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <regex>

#include "sandbox_run.h"

namespace {

const std::string kSnapshot = "/var/wireless/Library/Logs/CrashReporter/Baseband/";
const std::string kScratch = "/var/wireless/Library/Logs/ZelmarBasebandManager/DIAG.scratch";
const std::string kServerDown = "Server is not running. Please try after server starts.\n";
const std::string kTs = R"(\d{4}-\d\d-\d\d-\d{6}(-\d+)?)";

bool matches(const std::string& text, const std::string& pattern) {
  return std::regex_match(text, std::regex(pattern));
}

TEST(VorntoolCollections, PrintPathsThatExistUnderTheRoot) {
  // Every printed path is listed by `ls` under the root, archives by `tar -t`.
  auto r = runInSandbox({}, R"sh(
    set -u
    for args in "tel" "core nocompress crash" "bb" "bb nocompress" "tel tar nonui x"; do
      out=$(vorntool logdump $args); echo "status $?"; printf '%s\n' "$out"
      path=$(printf '%s\n' "$out" | sed -n 's/^Path = //p')
      ls -d "$VORN_ROOT"$path >/dev/null && echo "exists"
      case "$path" in
        *.tar.gz) tar -tzf "$VORN_ROOT$path" | sort | tr '\n' ' '; echo ;;
        *.tar) tar -tf "$VORN_ROOT$path" | sort | tr '\n' ' '; echo ;;
      esac
    done)sh");
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
  const std::string& dir = kSnapshot;
  EXPECT_TRUE(matches(r.out,
                      "status 0\nTelephony log collection: Success\nPath = " + dir + "log-bb-" + kTs +
                          "\\.tar\\.gz\nexists\n[^\n]*manifest\\.txt[^\n]*\n"
                          "status 0\nTelephony log collection with Coredump: Success\nPath = " + dir +
                          "log-bb-" + kTs + "-coredump\nexists\n"
                          "status 0\nBaseband log collection: Success \\(Vorn running\\)\nPath = " + dir +
                          "log-bb-" + kTs + "\\.tar\\.gz\nexists\n[^\n]*manifest\\.txt[^\n]*\n"
                          "status 0\nBaseband log collection: Success \\(Vorn running\\)\nPath = " + dir +
                          "log-bb-" + kTs + "-bb-trace\nexists\n"
                          "status 0\nTelephony log collection: Success\nPath = " + dir + "log-bb-" + kTs +
                          "\\.tar\nexists\n[^\n]*manifest\\.txt[^\n]*\n"))
      << r.out;
}

TEST(VorntoolServerDown, RefusesServerCommandsButLocatesBasebandLogs) {
  auto r = runInSandbox({"--no-vornd"}, "vorntool logdump tel crash");
  EXPECT_EQ(r.status, 1);
  EXPECT_EQ(r.out, "");
  EXPECT_EQ(r.err, kServerDown);

  for (const char* build : {"build=internal", "build=customer"}) {
    r = runInSandbox({"--no-vornd", "--device", build}, R"sh(
      mkdir -p "$VORN_ROOT/var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-2026-01-02-030405-bb-trace"
      vorntool logdump bb tar.gz)sh");
    EXPECT_EQ(r.status, 0) << build;
    const std::string path = std::string(build) == "build=internal"
                                 ? kSnapshot + "log-bb-2026-01-02-030405-bb-trace"
                                 : kScratch;
    EXPECT_EQ(r.out, "Baseband log collection: Success (Vorn not running)\nPath = " + path + "\n") << build;
    EXPECT_EQ(r.err, "");
  }

  // No snapshot and no helper: the scratch folder.
  r = runInSandbox({"--no-vornd", "--no-helper"}, "vorntool logdump bb");
  EXPECT_EQ(r.out, "Baseband log collection: Success (Vorn not running)\nPath = " + kScratch + "\n");
}

TEST(VorntoolServerDown, AServerThatStartsLaterIsSeenAtTheNextPrompt) {
  auto r = runInSandbox({"--vornd-arg", "--start-delay-ms", "--vornd-arg", "1500"}, R"sh(
    started() { busctl --system call org.vorn.Manager /org/vorn/Manager org.vorn.Manager1 Hello s t 2>/dev/null | grep -q Started; }
    {
      echo "logdump tel"
      for i in $(seq 200); do started && break; sleep 0.05; done
      echo "logdump tel nocompress"
    } | vorntool)sh");
  EXPECT_EQ(r.status, 1);  // end of input ends an interactive session with failure
  EXPECT_EQ(r.err, kServerDown);
  EXPECT_TRUE(matches(r.out, "\\(/vorntool\\)>> \\(/vorntool\\)>> Telephony log collection: Success\nPath = " +
                                 kSnapshot + "log-bb-" + kTs + "-\\*\n\\(/vorntool\\)>> "))
      << r.out;
}

TEST(VorntoolStartup, ChecksEndWithStatus255) {
  struct Case {
    std::vector<std::string> options;
    std::string out;
    int status;
  };
  const std::vector<Case> cases = {
      {{"--device", "radio=0"}, "'vorntool' is not supported on this product.\n", 255},
      {{"--no-telhub"}, "Telhub process is not running. Please run/load Telhub (or modemd) and try again.\n", 255},
      {{"--no-telhub", "--device", "product=86"}, "", 0},
  };
  for (const auto& c : cases) {
    auto r = runInSandbox(c.options, "vorntool quit");
    EXPECT_EQ(r.status, c.status) << c.options.back();
    EXPECT_EQ(r.out, c.out) << c.options.back();
    EXPECT_EQ(r.err, "");
  }
}

TEST(VorntoolFailures, EveryRequestEndsWithALineAndTheRightStatus) {
  struct Case {
    std::vector<std::string> vorndArgs;
    std::string command;
    std::string out;
    int status;
  };
  const std::vector<Case> cases = {
      {{"--no-reply", "TraceDumpState"}, "logdump tel", "Telephony log collection: Failed\n", 0},
      {{"--exit-on", "TraceDumpState"}, "logdump core", "Telephony log collection with Coredump: Failed\n", 0},
      {{"--no-reply", "GetTraceProperty"}, "logdump bb", "Baseband log collection: Failed\n", 1},
      {{"--fail", "GetTraceProperty=0xE0200001"}, "logdump bb", "Baseband log collection: Failed\n", 1},
      {{"--fail", "TraceDumpState=0xE0200003"}, "logdump bb x", "Baseband log collection: Failed\n", 0},
      {{"--fail", "TraceDumpState=0xE0200002"}, "logdump tel", "Telephony log collection: Failed\n", 0},
  };
  for (const auto& c : cases) {
    std::vector<std::string> options;
    for (const auto& a : c.vorndArgs) options.insert(options.end(), {"--vornd-arg", a});
    // The client library's call timeout, shortened for the test.
    auto r = runInSandbox(options, "VORN_CALL_TIMEOUT_MS=1500 vorntool " + c.command);
    EXPECT_EQ(r.status, c.status) << c.command << " " << c.vorndArgs.front();
    EXPECT_EQ(r.out, c.out) << c.command << " " << c.vorndArgs.front();
    EXPECT_EQ(r.err, "") << c.command;
  }
}

TEST(VorntoolOslog, ExportsTheSelectionToAFile) {
  auto r = runInSandbox({}, R"sh(
    f="$VORN_ROOT/../all.txt"; p="$VORN_ROOT/../telhub.txt"
    vorntool logdump oslog 3600 "$f"; echo "all $? $(wc -l <"$f")"
    vorntool logdump oslog 3600 "$p" -p Telhub; echo "telhub $? $(grep -vc ' Telhub(' "$p") $(wc -l <"$p")"
    vorntool logdump oslog 3600 /nonexistent/dir/x.txt; echo "missing $?"
    vorntool logdump oslog 600; echo "short $?")sh");
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_TRUE(matches(r.out, "all 0 [1-9][0-9]*\ntelhub 0 0 [1-9][0-9]*\nmissing 1\nos log collection: Failed\nshort 1\n"))
      << r.out;
}

}  // namespace
