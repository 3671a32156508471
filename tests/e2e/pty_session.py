#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Runs a program on a pseudo-terminal and plays a script of keys against it.

    pty_session.py [--stdout FILE] [--screen FILE] [--cols N] [--timeout S] STEPS -- COMMAND [ARG...]

STEPS is a JSON list of ["send", text] and ["expect", regex]. Keys are sent
to a line editor: a send first waits, up to the timeout, until the editor
has the terminal (canonical mode is off), since keys that come before are
echoed by the terminal and again by the editor, and an end-of-file key may
be lost. An expectation waits, up to the timeout, for the regex to match the
terminal's output that arrived after the previous match. After the last step the program must end
within the timeout. Everything the terminal showed is written to standard
output. The exit status is the program's, or 99 (with the reason on standard
error) when an expectation or the end did not come in time.

With --stdout the program's standard output goes to FILE instead of the
terminal, while its standard input and standard error stay on the terminal.

With --screen the text that the screen shows at the end is written to FILE:
what remains after carriage returns, line feeds, backspaces and clearing to
the end of the line (ESC [ K) have done their work; other escape sequences
are dropped, and trailing blanks and empty last lines are left out.
"""

import argparse
import fcntl
import json
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

    def drain(self, deadline):
        """Reads until the other side is closed; False when the deadline comes first."""
        while time.monotonic() < deadline:
            if not self.pump(deadline):
                return True
        return False

    def editing(self, timeout):
        deadline = time.monotonic() + timeout
        # No event says so: look again whenever output comes, or every 10 ms.
        while termios.tcgetattr(self.master)[3] & termios.ICANON:
            if time.monotonic() >= deadline or not self.pump(min(deadline, time.monotonic() + 0.01)):
                return False
        return True

    def expect(self, pattern, timeout):
        regex = re.compile(pattern.encode("utf-8"), re.DOTALL)
        deadline = time.monotonic() + timeout
        while True:
            found = regex.search(self.seen, self.mark)
            if found:
                self.mark = found.end()
                return True
            if time.monotonic() >= deadline or not self.pump(deadline):
                return bool(regex.search(self.seen, self.mark))


def final_screen(output):
    rows = [[]]
    row = col = 0
    text = output.decode("utf-8", "replace")
    i = 0
    while i < len(text):
        c = text[i]
        i += 1
        if c == "\r":
            col = 0
        elif c == "\n":
            row += 1
            rows.extend([] for _ in range(row + 1 - len(rows)))
        elif c == "\b":
            col = max(0, col - 1)
        elif c == "\x1b":
            match = re.compile(r"\[([0-9;?]*)([@-~])").match(text, i)
            if match:
                i = match.end()
                if match.group(2) == "K" and match.group(1) in ("", "0"):
                    del rows[row][col:]
            else:
                i += 1  # a two-character sequence
        elif c >= " ":
            line = rows[row]
            line.extend(" " * (col + 1 - len(line)))
            line[col] = c
            col += 1
    lines = ["".join(line).rstrip() for line in rows]
    while lines and not lines[-1]:
        lines.pop()
    return "".join(line + "\n" for line in lines)


def fail(terminal, reason):
    sys.stdout.buffer.write(terminal.seen)
    sys.stdout.flush()
    print(reason, file=sys.stderr)
    return 99


def main():
    parser = argparse.ArgumentParser()
    parser.add_argument("--stdout")
    parser.add_argument("--screen")
    parser.add_argument("--cols", type=int, default=80)
    parser.add_argument("--timeout", type=float, default=30.0)
    parser.add_argument("steps")
    parser.add_argument("command", nargs=argparse.REMAINDER)
    args = parser.parse_args()
    command = args.command[1:] if args.command[:1] == ["--"] else args.command
    steps = json.loads(args.steps)

    master, slave = os.openpty()
    # The size is set before the program starts, so that it reads it at once.
    fcntl.ioctl(master, termios.TIOCSWINSZ, struct.pack("HHHH", 24, args.cols, 0, 0))
    stdout = open(args.stdout, "wb") if args.stdout else slave
    child = subprocess.Popen(
        command, stdin=slave, stdout=stdout, stderr=slave, start_new_session=True,
        preexec_fn=lambda: fcntl.ioctl(0, termios.TIOCSCTTY, 0))
    os.close(slave)
    if args.stdout:
        stdout.close()

    terminal = Terminal(master)
    for kind, text in steps:
        if kind == "send":
            if not terminal.editing(args.timeout):
                child.kill()
                child.wait()
                return fail(terminal, "no line editor took the terminal before %r" % text)
            os.write(master, text.encode())
        elif not terminal.expect(text, args.timeout):
            child.kill()
            child.wait()
            return fail(terminal, "no match for %r after %r" % (text, terminal.seen[terminal.mark:]))

    deadline = time.monotonic() + args.timeout
    try:
        if not terminal.drain(deadline):
            raise subprocess.TimeoutExpired(command, args.timeout)
        child.wait(timeout=max(0.0, deadline - time.monotonic()))
    except subprocess.TimeoutExpired:
        child.kill()
        child.wait()
        return fail(terminal, "the program did not end")
    sys.stdout.buffer.write(terminal.seen)
    if args.screen:
        with open(args.screen, "w", encoding="utf-8") as screen:
            screen.write(final_screen(terminal.seen))
    return child.returncode


if __name__ == "__main__":
    sys.exit(main())
