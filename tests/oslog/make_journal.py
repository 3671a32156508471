#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""Builds a journal fixture under ROOT/var/log/journal for the log-store tests
and benchmarks.

Entries are written in the journal export format and fed to
systemd-journal-remote, one output file per part, because a single file that
grows past ~128 MiB rotates and repeats entries at the boundary.

Entry i belongs to PROCESSES[i % len(PROCESSES)]; dates rise evenly from
now - HOURS to now - 1 s. Every 17th entry (i % 17 == 5) has no MESSAGE,
every 23rd message (i % 23 == 7) carries invalid UTF-8, entries with
i % 3 == 0 carry a TID and entries with i % 4 == 0 LOG_SUBSYSTEM and
LOG_CATEGORY. --summary writes the expected counts of message entries as
tab-separated lines: "total", "messages", "invalid_utf8", "process <name>",
"exe <path>".
"""
import argparse
import os
import struct
import subprocess
import sys
import time

JOURNAL_REMOTE = '/lib/systemd/systemd-journal-remote'

# (_COMM, _EXE or None, SYSLOG_IDENTIFIER or None, _PID)
PROCESSES = [
    ('Telhub', '/usr/sbin/Telhub', 'Telhub', 312),
    ('telhub', '/usr/local/bin/telhub', None, 313),
    ('TelhubMobileHel', '/usr/libexec/TelhubMobileHelper', 'TelhubMobileHelper', 320),
    ('TelhubRootHelpe', '/usr/libexec/TelhubRootHelper', None, 321),
    ('TelhubRootHelpe', '/usr/libexec/TelhubRootHelperd', None, 322),
    ('ZelmarBasebandd', '/usr/libexec/Zélmar/ZelmarBasebandd', 'libZelmarIPC', 400),
    ('zélmartool', '/opt/ZÉLMAR/bin/zélmartool', None, 401),
    ('pwrkeepd', None, 'pwrkeepd', 77),
    ('systemd', '/usr/lib/systemd/systemd', 'systemd', 1),
    ('sshd', '/usr/sbin/sshd', 'sshd', 901),
    ('cron', '/usr/sbin/cron', 'CRON', 655),
    ('kworker/0:1', None, None, 14),
]

BOOT_ID = '0f0e0d0c0b0a09080706050403020100'


def event_process(comm, exe):
    return os.path.basename(exe) if exe else comm


def text_field(name, value):
    return name.encode() + b'=' + value.encode() + b'\n'


def binary_field(name, data):
    return name.encode() + b'\n' + struct.pack('<Q', len(data)) + data + b'\n'


def entry(i, realtime_usec):
    comm, exe, ident, pid = PROCESSES[i % len(PROCESSES)]
    parts = [b'__REALTIME_TIMESTAMP=%d\n__MONOTONIC_TIMESTAMP=%d\n_BOOT_ID=%s\n'
             % (realtime_usec, 1000000 + i, BOOT_ID.encode())]
    parts.append(b'_PID=%d\n' % pid)
    parts.append(text_field('_COMM', comm))
    if exe:
        parts.append(text_field('_EXE', exe))
    if ident:
        parts.append(text_field('SYSLOG_IDENTIFIER', ident))
    if i % 3 == 0:
        parts.append(b'TID=%d\n' % (pid + 0x1f))
    if i % 4 == 0:
        parts.append(b'LOG_SUBSYSTEM=org.vorn.fixture\nLOG_CATEGORY=cat%d\n' % (i % 5))
    has_message = i % 17 != 5
    if has_message:
        if i % 23 == 7:
            parts.append(binary_field('MESSAGE', b'bad \xff\xfe bytes %d' % i))
        else:
            parts.append(text_field('MESSAGE', 'message %d from %s: état ok' % (i, comm)))
    else:
        parts.append(b'CODE_LINE=%d\n' % i)
    parts.append(b'\n')
    return b''.join(parts), has_message and i % 23 == 7, has_message, event_process(comm, exe), exe


def write_part(path, first, count, total, start_usec, span_usec, counts):
    proc = subprocess.Popen([JOURNAL_REMOTE, '-o', path, '-'], stdin=subprocess.PIPE,
                            stdout=subprocess.DEVNULL, stderr=subprocess.PIPE)
    chunk = []
    for i in range(first, first + count):
        realtime = start_usec + (span_usec * i) // max(total - 1, 1)
        data, invalid_utf8, has_message, process, exe = entry(i, realtime)
        chunk.append(data)
        if invalid_utf8:
            counts['invalid_utf8'] = counts.get('invalid_utf8', 0) + 1
        if has_message:
            counts['messages'] = counts.get('messages', 0) + 1
            key = 'process\t' + process
            counts[key] = counts.get(key, 0) + 1
            if exe:
                key = 'exe\t' + exe
                counts[key] = counts.get(key, 0) + 1
        if len(chunk) >= 4096:
            proc.stdin.write(b''.join(chunk))
            chunk = []
    proc.stdin.write(b''.join(chunk))
    proc.stdin.close()
    err = proc.stderr.read()
    if proc.wait() != 0:
        sys.exit('systemd-journal-remote failed: %s' % err.decode(errors='replace'))


def main():
    ap = argparse.ArgumentParser(description=__doc__.splitlines()[0])
    ap.add_argument('--root', required=True)
    ap.add_argument('--entries', type=int, required=True)
    ap.add_argument('--hours', type=float, default=24.0)
    ap.add_argument('--part-size', type=int, default=250000)
    ap.add_argument('--summary')
    args = ap.parse_args()

    directory = os.path.join(args.root, 'var', 'log', 'journal')
    os.makedirs(directory, exist_ok=True)
    span_usec = int(args.hours * 3600e6)
    end_usec = int(time.time() * 1e6) - 1000000
    start_usec = end_usec - span_usec
    counts = {'total': args.entries}
    for n, first in enumerate(range(0, args.entries, args.part_size)):
        count = min(args.part_size, args.entries - first)
        path = os.path.join(directory, 'fixture-%03d.journal' % n)
        if os.path.exists(path):
            os.unlink(path)
        write_part(path, first, count, args.entries, start_usec, span_usec, counts)
    if args.summary:
        with open(args.summary, 'w', encoding='utf-8') as f:
            for key in sorted(counts):
                f.write('%s\t%d\n' % (key, counts[key]))


if __name__ == '__main__':
    main()
