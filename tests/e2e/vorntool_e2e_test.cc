// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <regex>

#include "sandbox_run.h"

namespace {

using VorntoolCollections = InTheSandbox;
using VorntoolOslog = InTheSandbox;
using VorntoolServerDown = InTheSandbox;
using VorntoolServerTrust = InTheSandbox;

const std::string kSnapshot = "/var/wireless/Library/Logs/CrashReporter/Baseband/";
const std::string kScratch = "/var/wireless/Library/Logs/ZelmarBasebandManager/DIAG.scratch";
const std::string kServerDown = "Server is not running. Please try after server starts.\n";
const std::string kTs = R"(\d{4}-\d\d-\d\d-\d{6}(-\d+)?)";

bool matches(const std::string& text, const std::string& pattern) {
  return std::regex_match(text, std::regex(pattern));
}

// Regexes for what the tool prints.
const std::string kPromptRe = "\\(/vorntool\\)>> ";
const std::string kTelRe = "Telephony log collection: Success";
const std::string kBbRe = "Baseband log collection: Success \\(Vorn running\\)";
const std::string kTarGzRe = "\\.tar\\.gz";

/// A collection's heading, then the path of what it collected.
std::string collectedRe(const std::string& heading, const std::string& suffix) {
  return heading + "\nPath = " + kSnapshot + "log-bb-" + kTs + suffix + "\n";
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
  const std::string listed = "exists\n[^\n]*manifest\\.txt[^\n]*\n";
  EXPECT_TRUE(matches(r.out, "status 0\n" + collectedRe(kTelRe, kTarGzRe) + listed +
                                 "status 0\n" + collectedRe("Telephony log collection with Coredump: Success", "-coredump") +
                                 "exists\n" +
                                 "status 0\n" + collectedRe(kBbRe, kTarGzRe) + listed +
                                 "status 0\n" + collectedRe(kBbRe, "-bb-trace") + "exists\n" +
                                 "status 0\n" + collectedRe(kTelRe, "\\.tar") + listed))
      << r.out;
}

/// A script that runs an interactive vorntool in the background, fed one line
/// at a time by `say LINE`; `await N` waits until N prompts are out, that is
/// until the line before has run, and `problem TEXT` adds TEXT to the error
/// output, which the tests compare whole. After `body` the input ends; the
/// result holds the session's standard output, error and exit status (the
/// sandbox's own complaints, such as a killed daemon's, stay out of it).
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
    cat session.out; printf '%s' ")sh" + separator + R"sh("; cat session.err problems 2>/dev/null; exit "$status"
  )sh");
  const auto errAt = r.out.find(separator);
  if (errAt == std::string::npos) {
    ADD_FAILURE() << "the session script did not finish: " << r.out << r.err;
    return {};
  }
  return {r.status, r.out.substr(0, errAt), r.out.substr(errAt + separator.size())};
}

TEST_F(VorntoolServerDown, AServerThatStartsLaterIsSeenAtTheNextPrompt) {
  auto r = interactiveSession({"--no-vornd"}, R"sh(
    await 1; say "logdump tel"; await 2
    vornd --root "$VORN_ROOT" >/dev/null 2>&1 3>&- &  # not holding the session's input open
    started() { busctl --system call org.vorn.Manager /org/vorn/Manager org.vorn.Manager1 Hello s t 2>/dev/null | grep -q Started; }
    for i in $(seq 200); do started && break; sleep 0.05; done
    started || problem "vornd did not start"
    say "logdump tel nocompress")sh");
  EXPECT_EQ(r.status, 1);  // end of input ends an interactive session with failure
  EXPECT_EQ(r.err, kServerDown);
  EXPECT_TRUE(matches(r.out, kPromptRe + kPromptRe + collectedRe(kTelRe, "-\\*") + kPromptRe)) << r.out;
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
  EXPECT_TRUE(matches(r.out, kPromptRe + collectedRe(kTelRe, kTarGzRe) + kPromptRe + collectedRe(kBbRe, kTarGzRe) +
                                 kPromptRe + collectedRe(kTelRe, kTarGzRe) + kPromptRe))
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
  EXPECT_TRUE(matches(r.out, kPromptRe + collectedRe(kTelRe, kTarGzRe) + kPromptRe +
                                 "Baseband log collection: Success \\(Vorn not running\\)\nPath = " + kScratch + "\n" +
                                 kPromptRe + kPromptRe))
      << r.out;
  EXPECT_EQ(r.status, 1);
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

/// One run of the tool in a sandbox and everything it must print and return.
struct ToolRun {
  const char* name;
  std::vector<std::string> options;  // the sandbox's
  std::string script;
  int status;
  std::string out;
  std::string err = "";
};

/// Sandbox options that pass `args` to vornd.
std::vector<std::string> vornd(const std::vector<std::string>& args) {
  std::vector<std::string> options;
  for (const auto& a : args) options.insert(options.end(), {"--vornd-arg", a});
  return options;
}

const std::string kDenied = "vorntool: the server refused access; run as root or as a member of group \"vorn\"\n";
/// The sandbox's folder is root's alone until opened; nobody is outside group vorn.
const std::string kAsNobody = "chmod 755 \"$VORN_ROOT/..\"; exec setpriv --reuid=65534 --regid=65534 --clear-groups ";
const std::string kFull = "vorntool: write error: No space left on device\n";
const std::string kClosed = "vorntool: write error: Bad file descriptor\n";
const std::string kNotSupported = "'vorntool' is not supported on this product.\n";
const std::string kOldSnapshot = kSnapshot + "log-bb-2026-01-02-030405-bb-trace";
const std::string kMakeOldSnapshot = "mkdir -p \"$VORN_ROOT" + kOldSnapshot + "\"; ";
const std::string kMakeConfAFifo = "conf=\"$VORN_ROOT/etc/vorn/device.conf\"; rm \"$conf\"; mkfifo \"$conf\"; ";
const std::string kTelFailed = "Telephony log collection: Failed\n";
const std::string kBbFailed = "Baseband log collection: Failed\n";
const std::string kBbServerDown = "Baseband log collection: Success (Vorn not running)\nPath = ";
/// vorntool with the client library's call timeout shortened for the test.
const std::string kQuickTool = "VORN_CALL_TIMEOUT_MS=1500 vorntool ";

// Each case: the sandbox's options and the script, then the status and what
// must come out on standard output and standard error.
const ToolRun kRuns[] = {
    {"ServerDownRefusesTel", {"--no-vornd"}, "vorntool logdump tel crash", 1, "", kServerDown},
    {"ServerDownInternalBbFindsTheSnapshot", {"--no-vornd", "--device", "build=internal"},
     kMakeOldSnapshot + "vorntool logdump bb tar.gz",
     0, kBbServerDown + kOldSnapshot + "\n"},
    {"ServerDownCustomerBbGetsTheScratchFolder", {"--no-vornd", "--device", "build=customer"},
     kMakeOldSnapshot + "vorntool logdump bb tar.gz",
     0, kBbServerDown + kScratch + "\n"},
    {"ServerDownBbWithoutSnapshotOrHelper", {"--no-vornd", "--no-helper"}, "vorntool logdump bb",
     0, kBbServerDown + kScratch + "\n"},

    {"AccessDeniedByTheBus", {}, kAsNobody + "vorntool logdump tel", 1, "", kServerDown + kDenied},
    // No server to be denied: the refusal alone.
    {"AccessWithNoServer", {"--no-vornd"}, kAsNobody + "vorntool logdump tel", 1, "", kServerDown},
    // Not a refusal: bb fails as on any failed enabled check.
    {"AccessDeniedToBb", {}, kAsNobody + "vorntool logdump bb", 1, kBbFailed},

    {"StartupNoRadio", {"--device", "radio=0"}, "vorntool quit", 255, kNotSupported},
    {"StartupNoTelhub", {"--no-telhub"}, "vorntool quit",
     255, "Telhub process is not running. Please run/load Telhub (or modemd) and try again.\n"},
    {"StartupNoTelhubNeededOnProduct86", {"--no-telhub", "--device", "product=86"}, "vorntool quit", 0, ""},

    {"TelUnanswered", vornd({"--no-reply", "TraceDumpState"}), kQuickTool + "logdump tel", 0, kTelFailed},
    {"CoreServerGone", vornd({"--exit-on", "TraceDumpState"}), kQuickTool + "logdump core",
     0, "Telephony log collection with Coredump: Failed\n"},
    {"BbEnabledCheckUnanswered", vornd({"--no-reply", "GetTraceProperty"}), kQuickTool + "logdump bb", 1, kBbFailed},
    {"BbEnabledCheckFails", vornd({"--fail", "GetTraceProperty=0xE0200001"}), kQuickTool + "logdump bb", 1, kBbFailed},
    {"BbCollectionFails", vornd({"--fail", "TraceDumpState=0xE0200003"}), kQuickTool + "logdump bb x", 0, kBbFailed},
    {"TelCollectionFails", vornd({"--fail", "TraceDumpState=0xE0200002"}), kQuickTool + "logdump tel", 0, kTelFailed},

    // Output that cannot be written is reported and fails the run.
    {"OutputToAFullDisk", {}, "vorntool logdump tel >/dev/full", 1, "", kFull},
    {"OutputClosed", {}, "vorntool logdump tel >&-", 1, "", kClosed},
    {"FailingCommandToAFullDisk", {}, "vorntool bogus >/dev/full", 1, "", kFull},
    {"VersionToAFullDisk", {}, "vorntool --version >/dev/full", 1, "", kFull},
    // A refusal at start-up keeps its status.
    {"RefusalToAFullDisk", {"--device", "radio=0"}, "vorntool logdump tel >/dev/full", 255, "", kFull},
    // Nothing to lose: an export prints nothing when it succeeds.
    {"SilentExportWithOutputClosed", {}, "vorntool logdump oslog 60 \"$VORN_ROOT/../x.txt\" >&-", 0, ""},

    // A FIFO that nobody opens from the other end must not hold the tool up.
    {"ExportIntoAFifoFailsAtOnce", {}, "cd \"$VORN_ROOT/..\"; mkfifo x.fifo; timeout 20 vorntool logdump oslog 60 x.fifo",
     1, ""},
    {"DeviceConfMissing", {}, "rm \"$VORN_ROOT/etc/vorn/device.conf\"; vorntool quit", 255, kNotSupported},
    {"DeviceConfAFifoReadsAsMissing", {}, kMakeConfAFifo + "timeout 20 vorntool quit", 255, kNotSupported},
};

void PrintTo(const ToolRun& run, std::ostream* os) { *os << run.name; }

class VorntoolRuns : public InTheSandbox, public testing::WithParamInterface<ToolRun> {};

TEST_P(VorntoolRuns, PrintAndReturnExactly) {
  const ToolRun& run = GetParam();
  auto r = runInSandbox(run.options, run.script);
  EXPECT_EQ(r.status, run.status);
  EXPECT_EQ(r.out, run.out);
  EXPECT_EQ(r.err, run.err);
}

// Numbered in gtest; ctest names each case after its PrintTo.
INSTANTIATE_TEST_SUITE_P(Sandbox, VorntoolRuns, testing::ValuesIn(kRuns));

}  // namespace
