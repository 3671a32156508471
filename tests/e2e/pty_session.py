#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Runs a program on a pseudo-terminal and plays a script of keys against it.

    pty_session.py [--stdout FILE] [--screen FILE] [--timeout S] [STEP...] -- COMMAND [ARG...]

Each STEP is send:KEYS or expect:REGEX. Keys are sent to a line editor: a
send first waits, up to the timeout, until the editor has the terminal
(canonical mode is off), since keys that come before are echoed by the
terminal and again by the editor, and an end-of-file key may be lost. An
expectation waits, up to the timeout, for the regex to match the terminal's
output that arrived after the previous match. After the last step the
program must end within the timeout. Everything the terminal showed is
written to standard output. The exit status is the program's, or 99 (with
the reason on standard error) when an expectation or the end did not come
in time.

With --stdout the program's standard output goes to FILE instead of the
terminal, while its standard input and standard error stay on the terminal.

With --screen the text that the screen shows at the end is written to FILE:
what remains after carriage returns, line feeds, backspaces and clearing to
the end of the line (ESC [ K) have done their work; other escape sequences
are dropped, and trailing blanks and empty last lines are left out.
"""

import argparse
import fcntl
import os
import re
import select
import struct
import subprocess
import sys
import termios
import time


class Terminal:
    def __init__(self, master):
        self.master = master
        self.seen = b""
        self.mark = 0

    def pump(self, deadline):
        """Waits up to the deadline for output; False once the other side is closed."""
        remaining = max(0.0, deadline - time.monotonic())
        ready, _, _ = select.select([self.master], [], [], remaining)
        if not ready:
            return True
        try:
            chunk = os.read(self.master, 4096)
        except OSError:  # EIO: every slave descriptor is closed
            return False
        self.seen += chunk
        return bool(chunk)

    def editing(self, timeout):
        deadline = time.monotonic() + timeout
        # No event says so: look again whenever output comes, or every 10 ms.
        while termios.tcgetattr(self.master)[3] & termios.ICANON:
            if time.monotonic() >= deadline or not self.pump(min(deadline, time.monotonic() + 0.01)):
                return False
        return True

    def expect(self, pattern, timeout):
        regex = re.compile(pattern, re.DOTALL)
        deadline = time.monotonic() + timeout
        while True:
            found = regex.search(self.seen, self.mark)
            if found:
                self.mark = found.end()
                return True
            if time.monotonic() >= deadline or not self.pump(deadline):
                return bool(regex.search(self.seen, self.mark))


def play(terminal, steps, timeout):
    """Plays the steps and reads until the program lets go of the terminal; the reason when that fails."""
    for step in steps:
        kind, _, text = step.partition(":")
        # The bytes as given on the command line, whatever the locale.
        data = os.fsencode(text)
        if kind == "send":
            if not terminal.editing(timeout):
                return "no line editor took the terminal before %r" % data
            os.write(terminal.master, data)
        elif not terminal.expect(data, timeout):
            return "no match for %r after %r" % (data, terminal.seen[terminal.mark:])
    deadline = time.monotonic() + timeout
    while terminal.pump(deadline):
        if time.monotonic() >= deadline:
            return "the program did not end"
    return None


def final_screen(output):
    rows = [[]]
    col = 0
    # A control sequence, another escape sequence, or one character.
    for token in re.findall(r"\x1b\[[0-9;?]*[@-~]|\x1b.?|.", output.decode("utf-8", "replace"), re.DOTALL):
        line = rows[-1]
        if token == "\r":
            col = 0
        elif token == "\n":
            rows.append([])
        elif token == "\b":
            col = max(0, col - 1)
        elif token in ("\x1b[K", "\x1b[0K"):
            del line[col:]
        elif token >= " ":
            line.extend(" " * (col + 1 - len(line)))
            line[col] = token
            col += 1
    text = "\n".join("".join(line).rstrip() for line in rows).rstrip("\n")
    return text + "\n" if text else ""


def main():
    end = sys.argv.index("--")
    parser = argparse.ArgumentParser()
    parser.add_argument("--stdout")
    parser.add_argument("--screen")
    parser.add_argument("--timeout", type=float, default=30.0)
    parser.add_argument("steps", nargs="*")
    args = parser.parse_args(sys.argv[1:end])
    command = sys.argv[end + 1:]

    master, slave = os.openpty()
    # The size is set before the program starts, so that it reads it at once.
    fcntl.ioctl(master, termios.TIOCSWINSZ, struct.pack("HHHH", 24, 80, 0, 0))
    stdout = open(args.stdout, "wb") if args.stdout else slave
    child = subprocess.Popen(
        command, stdin=slave, stdout=stdout, stderr=slave, start_new_session=True,
        preexec_fn=lambda: fcntl.ioctl(0, termios.TIOCSCTTY, 0))
    os.close(slave)
    if args.stdout:
        stdout.close()

    terminal = Terminal(master)
    reason = play(terminal, args.steps, args.timeout)
    if not reason:
        try:
            child.wait(timeout=args.timeout)
        except subprocess.TimeoutExpired:
            reason = "the program did not end"
    sys.stdout.buffer.write(terminal.seen)
    sys.stdout.flush()
    if reason:
        child.kill()
        child.wait()
        print(reason, file=sys.stderr)
        return 99
    if args.screen:
        with open(args.screen, "w", encoding="utf-8") as screen:
            screen.write(final_screen(terminal.seen))
    return child.returncode


if __name__ == "__main__":
    sys.exit(main())
