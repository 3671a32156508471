// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include "sandbox_run.h"

namespace {

using VorntoolColour = InTheSandbox;
using VorntoolProgress = InTheSandbox;
using VorntoolTerminal = InTheSandbox;

/// One step of a terminal session: keys to send, or a regex that the screen
/// must show next (within the driver's deadline).
std::string send(const std::string& keys) { return "send:" + keys; }
std::string expect(const std::string& regex) { return "expect:" + regex; }
using Steps = std::vector<std::string>;

const std::string kUp = "\x1b[A";
const std::string kKillLine = "\x15";  // Ctrl-U
const std::string kPrompt = R"(\(/vorntool\)>> )";
/// The end of a help, then the next prompt.
const std::string kHelpThenPrompt = "quit\r\n\r\n" + kPrompt;

/// A shell command that plays `steps` against `command` (vorntool and its
/// arguments) on a pseudo-terminal: a known terminal type, colour not
/// switched off, no user's editrc, and the history under ./state unless
/// `env` says otherwise.
std::string onTerminal(const Steps& steps, const std::string& env = "", const std::string& driverOptions = "",
                       const std::string& command = "vorntool") {
  std::string line = "env -u NO_COLOR -u EDITRC TERM=xterm HOME=\"$PWD\" XDG_STATE_HOME=\"$PWD/state\" " + env +
                     " python3 " + quoted(VORN_SOURCE_DIR "/tests/e2e/pty_session.py") + " " + driverOptions;
  for (const auto& step : steps) line += " " + quoted(step);
  return line + " -- " + command;
}

/// Runs `script` in a sandbox, in the folder above the platform root, where
/// the sessions keep their history and leave their files.
SandboxResult runBesideTheRoot(const std::vector<std::string>& sandboxOptions, const std::string& script) {
  return runInSandbox(sandboxOptions, "cd \"$VORN_ROOT/..\"\n" + script);
}

TEST_F(VorntoolTerminal, TabCompletesFromTheCommandTree) {
  auto r = runBesideTheRoot({}, onTerminal({
      expect(kPrompt),
      send("log\t"), expect("dump "),
      // A second Tab has nothing to add: it lists what may follow.
      send("\t"), expect("\r\nbb +cd +core +help +oslog +tel\r\n"), expect(kPrompt + "logdump "),
      send("\r"), expect("Options for command '\x1b\\[32mlogdump\x1b\\[39m'"), expect(kHelpThenPrompt),
      send("logdump tel \t"), expect("\r\nnocompress +nonui +tar +tar\\.gz\r\n"),
      expect(kPrompt + "logdump tel "),
      send(kKillLine + "cd l\t"), expect("ogdump "), send("\r"), expect(R"(\(/vorntool/logdump\)>> )"),
      send("quit\r"),
  }) + " >/dev/null; echo \"status $?\"");
  EXPECT_EQ(r.out, "status 0\n") << r.err;
}

TEST_F(VorntoolTerminal, UpArrowRecallsLinesAlsoAfterARestart) {
  const std::string rootHelpThenPrompt = "vorntool\x1b\\[39m'.*" + kHelpThenPrompt;
  const std::string first = onTerminal({
      expect(kPrompt), send("help\r"), expect(rootHelpThenPrompt),
      send(kUp), expect("help"), send("\r"), expect(rootHelpThenPrompt),
      send("quit\r"),
  });
  const std::string second = onTerminal({
      expect(kPrompt), send(kUp), expect("quit"), send(kUp), expect("help"),
      send("\r"), expect(rootHelpThenPrompt),
      send("quit\r"),
  });
  auto r = runBesideTheRoot({}, first + " >/dev/null; echo \"first $?\"\n"
                            "stat -c '%a %n' state/vorntool state/vorntool/history\n"
                            "tail -n +2 state/vorntool/history\n" +
                            second + " >/dev/null; echo \"second $?\"");
  EXPECT_EQ(r.out, "first 0\n700 state/vorntool\n600 state/vorntool/history\nhelp\nquit\nsecond 0\n") << r.err;
}

TEST_F(VorntoolTerminal, AnEmptyHistfileKeepsNoHistoryAndAPathIsUsedAsGiven) {
  // Ctrl-D at an empty prompt is the end of input: status 1, as from a pipe.
  const Steps steps{expect(kPrompt), send("help\r"), expect(kHelpThenPrompt), send("\x04")};
  auto r = runBesideTheRoot({}, onTerminal(steps, "VORNTOOL_HISTFILE=") + " >/dev/null; echo \"off $?\"\n"
                            "[ -e state ] && echo 'state written' || echo 'no state'\n" +
                            onTerminal(steps, "VORNTOOL_HISTFILE=custom") + " >/dev/null; echo \"custom $?\"\n"
                            "cat custom; ls | grep -c custom");
  EXPECT_EQ(r.out, "off 1\nno state\ncustom 1\n_HiStOrY_V2_\nhelp\n1\n") << r.err;
}

TEST_F(VorntoolTerminal, WithOutputPipedThePromptStaysOnTheTerminal) {
  const Steps steps{expect(kPrompt), send("help\r"), expect(kPrompt), send("quit\r")};
  auto r = runBesideTheRoot({}, onTerminal(steps, "", "--stdout out") + " >screen; echo \"status $?\"\n"
                            "cat out; grep -c 'Options for command' screen");
  EXPECT_EQ(r.out, "status 0\n"
                   "\nOptions for command '\x1b[32mvorntool\x1b[39m':\n\n"
                   "\t         logdump  -  [bb|core|oslog|tel]\n\n"
                   "\t              cd  -  <sub-command>\n\t            help\n\t            back\n\t            quit\n\n"
                   "0\n")
      << r.err;
}

TEST_F(VorntoolColour, NoColorAndDumbTerminalsGetTheSameTextWithoutEscapes) {
  auto r = runInSandbox({}, R"sh(
    plain() { sed 's/\x1b\[3[129]m//g'; }
    coloured=$(env -u NO_COLOR TERM=xterm vorntool help | od -c)
    [ "$coloured" = "$(env -u NO_COLOR TERM=xterm vorntool help | plain | od -c)" ] && echo "help has no colour"
    env -u NO_COLOR TERM=xterm vorntool help | grep -c $'\x1b'
    NO_COLOR= TERM=xterm vorntool help | grep -c $'\x1b'
    [ "$(NO_COLOR=1 vorntool help)" = "$(env -u NO_COLOR TERM=xterm vorntool help | plain)" ] && echo "NO_COLOR: plain help"
    [ "$(env -u NO_COLOR TERM=dumb vorntool bogus)" = "$(env -u NO_COLOR TERM=xterm vorntool bogus | plain)" ] && echo "dumb: plain report"
    NO_COLOR=1 vorntool bogus | grep -c $'\x1b'
    true)sh");
  EXPECT_EQ(r.out, "1\n1\nNO_COLOR: plain help\ndumb: plain report\n0\n") << r.err;
}

/// The server answers every request only after a while.
const std::vector<std::string> kSlowServer = {"--vornd-arg", "--reply-delay-ms", "--vornd-arg", "600"};
const std::string kWaiting = "waiting for the server\u2026 [0-9]+ s";
/// The line shown until the result comes, and cleared just before it.
std::string clearedBefore(const std::string& result) { return "[0-9] s\r\x1b\\[K" + result; }
/// The final screen, with the collection's timestamp made constant.
const std::string kShowScreen = "sed 's/log-bb-[-0-9]*/log-bb-TS/' screen\n";
const std::string kBasebandResult =
    "Baseband log collection: Success (Vorn running)\n"
    "Path = /var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-TS.tar.gz\n";

TEST_F(VorntoolProgress, ASlowAnswerShowsTheWaitAndTheScreenEndsWithTheResultOnly) {
  const Steps steps{expect(kWaiting), expect(clearedBefore("Baseband log collection"))};
  auto r = runBesideTheRoot(kSlowServer, onTerminal(steps, "", "--screen screen", "vorntool logdump bb x") +
                                             " >raw; echo \"status $?\"\n" + kShowScreen +
                                             "[ $(grep -o 'waiting for the server' raw | wc -l) -gt 1 ] && echo redrawn");
  EXPECT_EQ(r.out, "status 0\n" + kBasebandResult + "redrawn\n") << r.err;
}

TEST_F(VorntoolProgress, TheTelephonyWaitIsGoneBeforeItsCompletionPrints) {
  // The server's state arrives as late as every answer: "bb", which runs
  // without it, gives it time to come before "tel" needs it.
  auto r = runBesideTheRoot(kSlowServer, onTerminal({
      expect(kPrompt), send("logdump bb x\r"), expect(kWaiting), expect(kPrompt),
      send("logdump tel x\r"), expect(kWaiting), expect(clearedBefore("Telephony log collection: Success")),
      expect(kPrompt), send("quit\r"),
  }, "", "--screen screen") + " >/dev/null; echo \"status $?\"\n" + kShowScreen);
  EXPECT_EQ(r.out, "status 0\n(/vorntool)>> logdump bb x\n" + kBasebandResult +
                       "(/vorntool)>> logdump tel x\n"
                       "Telephony log collection: Success\n"
                       "Path = /var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-TS.tar.gz\n"
                       "(/vorntool)>> quit\n")
      << r.err;
}

TEST_F(VorntoolProgress, NothingIsDrawnIntoAFileOnADumbTerminalOrOverAPlainPrompt) {
  // What the terminal got, control characters made visible.
  const std::string shown = " | cat -v | sed 's/log-bb-[-0-9]*/log-bb-TS/'\n";
  auto r = runBesideTheRoot(kSlowServer,
                            "vorntool logdump bb x >out 2>err; echo \"piped $? $(wc -l <out) $(wc -c <err)\"\n" +
                                onTerminal({}, "", "", "sh -c 'exec vorntool logdump bb x 2>err'") + shown +
                                "echo \"stderr to a file $(wc -c <err)\"\n" +
                                onTerminal({}, "TERM=dumb", "", "vorntool logdump bb x") + shown +
                                onTerminal({}, "", "", "sh -c 'echo logdump bb x | vorntool'") + shown);
  const std::string onScreen = "Baseband log collection: Success (Vorn running)^M\n"
                               "Path = /var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-TS.tar.gz^M\n";
  EXPECT_EQ(r.out, "piped 0 2 0\n" + onScreen + "stderr to a file 0\n" + onScreen + "(/vorntool)>> " +
                       onScreen + "(/vorntool)>> ")
      << r.err;
}

}  // namespace
