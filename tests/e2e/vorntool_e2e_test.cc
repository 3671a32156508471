// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <regex>
#include <sstream>

#include "sandbox_run.h"

namespace {

using VorntoolAccess = InTheSandbox;
using VorntoolCollections = InTheSandbox;
using VorntoolFailures = InTheSandbox;
using VorntoolFifos = InTheSandbox;
using VorntoolLostOutput = InTheSandbox;
using VorntoolOslog = InTheSandbox;
using VorntoolServerDown = InTheSandbox;
using VorntoolServerTrust = InTheSandbox;
using VorntoolStartup = InTheSandbox;

const std::string kSnapshot = "/var/wireless/Library/Logs/CrashReporter/Baseband/";
const std::string kScratch = "/var/wireless/Library/Logs/ZelmarBasebandManager/DIAG.scratch";
const std::string kServerDown = "Server is not running. Please try after server starts.\n";
const std::string kTs = R"(\d{4}-\d\d-\d\d-\d{6}(-\d+)?)";

bool matches(const std::string& text, const std::string& pattern) {
  return std::regex_match(text, std::regex(pattern));
}

TEST_F(VorntoolCollections, PrintPathsThatExistUnderTheRoot) {
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

TEST_F(VorntoolServerDown, RefusesServerCommandsButLocatesBasebandLogs) {
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

TEST_F(VorntoolServerDown, AServerThatStartsLaterIsSeenAtTheNextPrompt) {
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

/// A script that runs an interactive vorntool in the background, fed one line
/// at a time by `say LINE`; `await N` waits until N prompts are out, that is
/// until the line before has run, and `problem TEXT` fails the test. After
/// `body` the input ends; the result holds the session's standard output,
/// error and exit status (the sandbox's own complaints, such as a killed
/// daemon's, stay out of it).
SandboxResult interactiveSession(const std::vector<std::string>& sandboxOptions, const std::string& body) {
  const std::string separator = "\n--- next ---\n";
  auto r = runInSandbox(sandboxOptions, R"sh(
    set -u
    cd "$VORN_ROOT/.."
    mkfifo session.in
    vorntool <session.in >session.out 2>session.err &
    tool=$!
    exec 3>session.in
    say() { printf '%s\n' "$1" >&3; }
    problem() { printf '%s\n' "$1" >>problems; }
    await() {
      for i in $(seq 600); do
        [ "$(grep -o '(/vorntool)>> ' session.out | wc -l)" -ge "$1" ] && return
        sleep 0.05
      done
      problem "no prompt $1"
    }
  )sh" + body + R"sh(
    exec 3>&-
    wait "$tool"; status=$?
    next() { printf '%s' ")sh" + separator + R"sh("; }
    cat session.out; next; cat session.err; next; cat problems 2>/dev/null; exit "$status"
  )sh");
  const auto errAt = r.out.find(separator);
  const auto problemsAt = r.out.find(separator, errAt == std::string::npos ? 0 : errAt + 1);
  if (problemsAt == std::string::npos) {
    ADD_FAILURE() << "the session script did not finish: " << r.out << r.err;
    return {};
  }
  EXPECT_EQ(r.out.substr(problemsAt + separator.size()), "");
  return {r.status, r.out.substr(0, errAt), r.out.substr(errAt + separator.size(), problemsAt - errAt - separator.size())};
}

TEST_F(VorntoolServerTrust, IgnoresServerEventsFromOtherSenders) {
  auto r = interactiveSession({}, R"sh(
    await 1; say "logdump tel"; await 2
    name=$(busctl --system list --unique --no-legend | awk -v pid="$tool" '$2 == pid { print $1 }')
    chmod 755 .  # lets the spoofer, who may be anybody, reach the bus
    setpriv --reuid=65534 --regid=65534 --clear-groups )sh" VORN_SPOOF_EVENT R"sh( "$name" Stopping || problem "the spoofer failed"
    # bb asks the server on the tool's connection: its answers arrive after
    # the spoofed signals, so they have been read when tel comes.
    say "logdump bb"
    say "logdump tel")sh");
  EXPECT_EQ(r.err, "");
  EXPECT_TRUE(matches(r.out, "\\(/vorntool\\)>> Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-" + kTs +
                                 "\\.tar\\.gz\n\\(/vorntool\\)>> Baseband log collection: Success \\(Vorn running\\)\nPath = " +
                                 kSnapshot + "log-bb-" + kTs +
                                 "\\.tar\\.gz\n\\(/vorntool\\)>> Telephony log collection: Success\nPath = " + kSnapshot +
                                 "log-bb-" + kTs + "\\.tar\\.gz\n\\(/vorntool\\)>> "))
      << r.out;
  EXPECT_EQ(r.status, 1);  // the end of input ends an interactive session with failure
}

TEST_F(VorntoolServerTrust, ASilentlyKilledServerIsSeenAsDown) {
  auto r = interactiveSession({"--device", "build=customer"}, R"sh(
    await 1; say "logdump tel"; await 2
    kill -KILL "$VORN_SANDBOX_VORND_PID"
    for i in $(seq 200); do busctl --system status org.vorn.Manager >/dev/null 2>&1 || break; sleep 0.05; done
    busctl --system status org.vorn.Manager >/dev/null 2>&1 && problem "vornd still owns its name"
    # bb's questions are answered after the bus has told the tool that the
    # server's name lost its owner.
    say "logdump bb"
    say "logdump tel")sh");
  EXPECT_EQ(r.err, kServerDown);
  EXPECT_TRUE(matches(r.out, "\\(/vorntool\\)>> Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-" + kTs +
                                 "\\.tar\\.gz\n\\(/vorntool\\)>> Baseband log collection: Success \\(Vorn not running\\)\n"
                                 "Path = " + kScratch + "\n\\(/vorntool\\)>> \\(/vorntool\\)>> "))
      << r.out;
  EXPECT_EQ(r.status, 1);
}

TEST_F(VorntoolAccess, ARefusalSaysWhenTheBusDeniedAccess) {
  const std::string denied = "vorntool: the server refused access; run as root or as a member of group \"vorn\"\n";
  struct Case {
    std::vector<std::string> options;
    std::string command;
    std::string out;
    std::string err;
  };
  const std::vector<Case> cases = {
      {{}, "logdump tel", "", kServerDown + denied},
      // No server to be denied: the refusal alone.
      {{"--no-vornd"}, "logdump tel", "", kServerDown},
      // Not a refusal: bb fails as on any failed enabled check.
      {{}, "logdump bb", "Baseband log collection: Failed\n", ""},
  };
  for (const auto& c : cases) {
    // nobody, outside group vorn; the sandbox's folder is root's alone until opened.
    auto r = runInSandbox(c.options, R"sh(
      chmod 755 "$VORN_ROOT/.."
      exec setpriv --reuid=65534 --regid=65534 --clear-groups vorntool )sh" + c.command);
    EXPECT_EQ(r.status, 1) << c.command;
    EXPECT_EQ(r.out, c.out) << c.command;
    EXPECT_EQ(r.err, c.err) << c.command;
  }
}

TEST_F(VorntoolStartup, ChecksEndWithStatus255) {
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

TEST_F(VorntoolFailures, EveryRequestEndsWithALineAndTheRightStatus) {
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

TEST_F(VorntoolOslog, ExportsTheSelectionToAFile) {
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

/// Runs `command` (a shell command line) once, bounded, and prints "NAME STATUS [ERR]".
std::string boundedRun(const std::string& name, const std::string& command) {
  return "err=$(timeout 20 " + command + "); echo \"" + name + " $? [$err]\"\n";
}

TEST_F(VorntoolLostOutput, AFailedWriteIsReportedAndFailsTheRun) {
  struct Case {
    const char* name;
    std::string command;  // stderr into $(...), then stdout redirected
    std::string expected;
  };
  const std::string full = "write error: No space left on device";
  const std::string closed = "write error: Bad file descriptor";
  const std::vector<Case> cases = {
      {"full", "vorntool logdump tel 2>&1 >/dev/full", "1 [vorntool: " + full + "]"},
      {"closed", "vorntool logdump tel 2>&1 >&-", "1 [vorntool: " + closed + "]"},
      {"failing-full", "vorntool bogus 2>&1 >/dev/full", "1 [vorntool: " + full + "]"},
      {"version-full", "vorntool --version 2>&1 >/dev/full", "1 [vorntool: " + full + "]"},
      // Nothing to lose: an export prints nothing when it succeeds.
      {"silent-closed", "vorntool logdump oslog 60 \"$VORN_ROOT/../x.txt\" 2>&1 >&-", "0 []"},
      // Written in full, as before.
      {"written", "vorntool logdump bb nocompress 2>&1 >\"$VORN_ROOT/../bb.txt\" && wc -l <\"$VORN_ROOT/../bb.txt\"", "0 [2]"},
  };
  std::string script, expected;
  for (const auto& c : cases) {
    script += boundedRun(c.name, c.command);
    expected += std::string(c.name) + " " + c.expected + "\n";
  }
  // A refusal at start-up keeps its status.
  script += "echo radio=0 >\"$VORN_ROOT/etc/vorn/device.conf\"\n" +
            boundedRun("refused-full", "vorntool logdump tel 2>&1 >/dev/full");
  expected += "refused-full 255 [vorntool: " + full + "]\n";
  auto r = runInSandbox({}, script);
  EXPECT_EQ(r.out, expected) << r.err;
}

// A FIFO that nobody opens from the other end must not hold the tool up: an
// export into one fails at once, and a device.conf that is one reads as
// missing.
TEST_F(VorntoolFifos, NeitherAnExportNorStartUpWaitsForAReader) {
  auto r = runInSandbox({}, "cd \"$VORN_ROOT/..\"; mkfifo export.fifo\n" +
                                boundedRun("export", "vorntool logdump oslog 60 export.fifo 2>&1") +
                                "conf=\"$VORN_ROOT/etc/vorn/device.conf\"; rm \"$conf\"\n" +
                                boundedRun("missing-conf", "vorntool quit 2>&1") + "mkfifo \"$conf\"\n" +
                                boundedRun("fifo-conf", "vorntool quit 2>&1"));
  std::istringstream lines(r.out);
  std::string exportLine, missingConf, fifoConf;
  std::getline(lines, exportLine), std::getline(lines, missingConf), std::getline(lines, fifoConf);
  EXPECT_EQ(exportLine, "export 1 []");
  ASSERT_TRUE(missingConf.starts_with("missing-conf ")) << r.out << r.err;
  EXPECT_EQ(fifoConf, "fifo-conf " + missingConf.substr(13));
}

}  // namespace
