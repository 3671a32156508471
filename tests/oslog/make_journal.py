#!/usr/bin/env python3
# SPDX-License-Identifier: MIT
"""make_journal.py --root ROOT --entries N --summary FILE: a journal fixture in ROOT/var/log/journal.

Entry i is of PROCESSES[i % 12], dated evenly over the last 24 hours; see entry() for its fields. FILE
gets "KEY COUNT" lines counting message entries: "messages", "invalid_utf8", "process:NAME"."""
import collections, os, struct, subprocess, sys, time

SPAN = 24 * 3600 * 1000000  # microseconds
PART = 250000  # entries per file: a bigger one rotates and repeats entries at the boundary
HEAD = b'__REALTIME_TIMESTAMP=%d\n__MONOTONIC_TIMESTAMP=%d\n_BOOT_ID=0f0e0d0c0b0a09080706050403020100\n_PID=%d\n'
PROCESSES = [  # (_COMM, _EXE, SYSLOG_IDENTIFIER, _PID)
    ('Telhub', '/usr/sbin/Telhub', 'Telhub', 312), ('telhub', '/usr/local/bin/telhub', None, 313),
    ('TelhubMobileHel', '/usr/libexec/TelhubMobileHelper', 'TelhubMobileHelper', 320),
    ('TelhubRootHelpe', '/usr/libexec/TelhubRootHelper', None, 321),
    ('TelhubRootHelpe', '/usr/libexec/TelhubRootHelperd', None, 322),
    ('ZelmarBasebandd', '/usr/libexec/Zélmar/ZelmarBasebandd', 'libZelmarIPC', 400),
    ('zélmartool', '/opt/ZÉLMAR/bin/zélmartool', None, 401), ('pwrkeepd', None, 'pwrkeepd', 77),
    ('systemd', '/usr/lib/systemd/systemd', 'systemd', 1), ('sshd', '/usr/sbin/sshd', 'sshd', 901),
    ('cron', '/usr/sbin/cron', 'CRON', 655), ('kworker/0:1', None, None, 14),
]


def field(name, value):
    if isinstance(value, bytes):  # the binary form, for bytes that are not UTF-8
        return name.encode() + b'\n' + struct.pack('<Q', len(value)) + value + b'\n'
    return ('%s=%s\n' % (name, value)).encode() if value is not None else b''


def entry(i, realtime_usec, counts):
    comm, exe, ident, pid = PROCESSES[i % len(PROCESSES)]
    parts = [HEAD % (realtime_usec, 1000000 + i, pid), field('_COMM', comm), field('_EXE', exe),
             field('SYSLOG_IDENTIFIER', ident), b'TID=%d\n' % (pid + 0x1f) if i % 3 == 0 else b'',
             b'LOG_SUBSYSTEM=org.vorn.fixture\nLOG_CATEGORY=cat%d\n' % (i % 5) if i % 4 == 0 else b'']
    if i % 17 == 5:
        parts.append(b'CODE_LINE=%d\n' % i)
    else:
        counts['messages'] += 1
        counts['process:' + (os.path.basename(exe) if exe else comm)] += 1
        counts['invalid_utf8'] += i % 23 == 7
        parts.append(field('MESSAGE', b'bad \xff\xfe bytes %d' % i if i % 23 == 7
                           else 'message %d from %s: état ok' % (i, comm)))
    return b''.join(parts) + b'\n'


opts = dict(zip(sys.argv[1::2], sys.argv[2::2]))
directory, entries = os.path.join(opts['--root'], 'var', 'log', 'journal'), int(opts['--entries'])
os.makedirs(directory, exist_ok=True)
start, counts = int(time.time() * 1e6) - 1000000 - SPAN, collections.Counter()
for first in range(0, entries, PART):
    proc = subprocess.Popen(['/lib/systemd/systemd-journal-remote', '-o',
                             os.path.join(directory, 'fixture-%03d.journal' % (first // PART)), '-'],
                            stdin=subprocess.PIPE, stdout=subprocess.DEVNULL, stderr=subprocess.PIPE)
    for i in range(first, min(first + PART, entries)):
        proc.stdin.write(entry(i, start + SPAN * i // max(entries - 1, 1), counts))
    err = proc.communicate()[1]
    if proc.returncode:
        sys.exit('systemd-journal-remote failed: ' + err.decode(errors='replace'))
with open(opts['--summary'], 'w', encoding='utf-8') as f:
    f.writelines('%s %d\n' % (key, counts[key]) for key in sorted(counts))
