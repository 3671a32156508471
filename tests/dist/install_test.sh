#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# install_test.sh STEP BUILD_DIR STAGE PREFIX VERSION: one step of checking
# what `cmake --install` puts in a staging folder (stage, files, system,
# manuals, sandbox; each step function says what it checks). Exits 0 when
# every check passed, 77 when the step cannot run here (the reason is
# printed), 1 otherwise.
set -uo pipefail

readonly step="$1" build="$2" stage="$3" prefix="$4" version="$5"
readonly repo="$(cd "$(dirname "${BASH_SOURCE[0]}")/../.." && pwd)"
readonly tree="$stage$prefix"
failures=0

# check DESCRIPTION COMMAND...: passes when the command succeeds.
check() {
  local what="$1"
  shift
  "$@" && { echo "ok - $what"; return; }
  echo "not ok - $what"
  failures=$((failures + 1))
  return 1
}
# has FILE LINE...: passes when FILE holds every LINE whole.
has() {
  local file="$1" line
  shift
  for line; do
    grep -qx -- "$line" "$file" || { echo "# $file lacks: $line"; return 1; }
  done
}
# same DESCRIPTION EXPECTED ACTUAL: passes when the texts are equal, and
# shows how they differ when not.
same() {
  check "$1" test "$3" = "$2" || diff <(printf '%s\n' "$2") <(printf '%s\n' "$3") | sed 's/^/#   /'
}
skip() {
  echo "skip - $*"
  exit 77
}
finish() { exit $((failures > 0)); }

step_stage() {
  rm -rf "$stage"
  check "cmake --install into $stage" env DESTDIR="$stage" cmake --install "$build"
}

step_files() {
  local expected actual
  # Path, mode; programs 0755, everything else 0644.
  expected="$(sort <<EOF
bin/vorntool 755
lib/systemd/system/vorn-helper.service 644
lib/systemd/system/vornd.service 644
lib/sysusers.d/vorn.conf 644
lib/tmpfiles.d/vorn.conf 644
libexec/vorn/vorn-helper 755
libexec/vorn/vornd 755
share/bash-completion/completions/vorntool 644
share/dbus-1/system-services/org.vorn.Helper.service 644
share/dbus-1/system.d/org.vorn.Helper.conf 644
share/dbus-1/system.d/org.vorn.Manager.conf 644
share/doc/vorn-server/changelog.Debian.gz 644
share/doc/vorn-server/copyright 644
share/doc/vorntool/changelog.Debian.gz 644
share/doc/vorntool/copyright 644
share/doc/vorntool/examples/device.conf 644
share/man/man1/vorntool.1.gz 644
share/man/man5/vorn-device.conf.5.gz 644
share/man/man8/vorn-helper.8.gz 644
share/man/man8/vornd.8.gz 644
share/zsh/vendor-completions/_vorntool 644
EOF
)"
  same "the installed files and their modes" "$(sed "s|^|${prefix#/}/|" <<<"$expected")" \
    "$(cd "$stage" && find . -mindepth 1 ! -type d -printf '%P %m\n' | sort)"
  actual="$(cd "$stage" && find . -mindepth 1 -type d ! -perm 755 -printf '%P %m\n')"
  check "every folder is 0755${actual:+ (not: $actual)}" test -z "$actual"

  local units="$tree/lib/systemd/system" libexec="$prefix/libexec/vorn"
  check "vornd.service runs the installed vornd, waits for org.vorn.Manager and starts with the system" \
    has "$units/vornd.service" "ExecStart=$libexec/vornd" "BusName=org.vorn.Manager" "WantedBy=multi-user.target"
  check "vorn-helper.service runs the installed helper" \
    has "$units/vorn-helper.service" "ExecStart=$libexec/vorn-helper"
  check "vorn-helper.service is only started on demand" \
    bash -c '! grep -q "^\[Install\]" "$1"' _ "$units/vorn-helper.service"
  check "the bus starts the installed helper as org.vorn.Helper through vorn-helper.service" \
    has "$tree/share/dbus-1/system-services/org.vorn.Helper.service" "Name=org.vorn.Helper" \
    "SystemdService=vorn-helper.service" "Exec=$libexec/vorn-helper"
  check "no activation file for vornd, whose absence the tool reports" \
    test ! -e "$tree/share/dbus-1/system-services/org.vorn.Manager.service"

  local out status
  out="$(env -u VORN_ROOT "$tree/bin/vorntool" --version)"
  status=$?
  check "vorntool --version says vorntool $version, before any start-up check ($status, \"$out\")" \
    test "$status:$out" = "0:vorntool $version"

  check "vorntool does not need libarchive" \
    bash -c 'libraries="$(ldd "$1")" && ! grep -q libarchive <<<"$libraries"' _ "$tree/bin/vorntool"
  check "vornd needs libarchive and libsystemd" \
    bash -c 'libraries="$(ldd "$1")" && grep -q libarchive <<<"$libraries" && grep -q libsystemd <<<"$libraries"' \
    _ "$tree/libexec/vorn/vornd"
  finish
}

step_system() {
  command -v systemd-analyze >/dev/null || skip "systemd-analyze is not installed"
  systemd-analyze security --offline=true "$tree/lib/systemd/system/vornd.service" >/dev/null 2>&1 ||
    skip "systemd-analyze cannot run here: $(systemd-analyze security --offline=true /dev/null 2>&1 | head -n 1)"
  local scratch unit out score
  scratch="$(mktemp -d)"
  trap 'rm -rf "$scratch"' EXIT

  # verify wants the programs at the paths the units name: a copy of each
  # unit names them in the staging folder instead.
  mkdir "$scratch/units"
  for unit in vornd vorn-helper; do
    sed "s|^ExecStart=$prefix/|ExecStart=$tree/|" "$tree/lib/systemd/system/$unit.service" \
      >"$scratch/units/$unit.service"
    out="$(MANPATH="$tree/share/man" systemd-analyze verify "$scratch/units/$unit.service" 2>&1)"
    check "systemd-analyze verify $unit.service${out:+: $out}" test -z "$out"

    out="$(systemd-analyze security --offline=true "$tree/lib/systemd/system/$unit.service" 2>&1)"
    score="$(sed -n 's/^.*Overall exposure level for [^:]*: \([0-9.]*\) .*$/\1/p' <<<"$out")"
    check "$unit.service exposure ${score:-unknown} is at most 2.0" \
      awk -v s="$score" 'BEGIN { exit !(s != "" && s <= 2.0) }'
  done

  # A fresh root: the group appears, and the folders with their owners.
  mkdir -p "$scratch/root/etc"
  check "systemd-sysusers accepts vorn.conf" \
    systemd-sysusers --root="$scratch/root" "$tree/lib/sysusers.d/vorn.conf" 2>/dev/null
  check "sysusers.d makes the system group vorn" \
    awk -F: '$1 == "vorn" && $3 < 1000 { found = 1 } END { exit !found }' "$scratch/root/etc/group"
  check "systemd-tmpfiles accepts vorn.conf" \
    systemd-tmpfiles --root="$scratch/root" --create "$tree/lib/tmpfiles.d/vorn.conf"
  local gid
  gid="$(awk -F: '$1 == "vorn" { print $3 }' "$scratch/root/etc/group")"
  out="$(stat -c '%a %u %g' "$scratch/root/var/wireless/Library/Logs/CrashReporter/Baseband" 2>&1)"
  check "the snapshot folder is 2750 root:vorn ($out)" test "$out" = "2750 0 $gid"
  out="$(stat -c '%a %u %g' "$scratch/root/var/lib/vorn" 2>&1)"
  check "/var/lib/vorn is 0755 root:root ($out)" test "$out" = "755 0 0"
  finish
}

step_manuals() {
  command -v man >/dev/null || skip "man is not installed"
  local page out
  for page in man1/vorntool.1 man5/vorn-device.conf.5 man8/vornd.8 man8/vorn-helper.8; do
    out="$(MANWIDTH=80 man --warnings -E UTF-8 -l "$tree/share/man/$page.gz" 2>&1 >/dev/null)"
    check "$page renders without warnings${out:+: $out}" test -z "$out"
  done
  finish
}

step_sandbox() {
  local out
  [[ $EUID -eq 0 ]] || skip "the sandbox makes PID and mount namespaces, which needs root"
  # Paths are device paths; the snapshot is made before vornd stops, and
  # only the helper can name it then.
  out="$(timeout -k 5 120 "$repo/scripts/vorn-sandbox" --prefix "$tree" -- bash -c '
    snapshots="$VORN_ROOT/var/wireless/Library/Logs/CrashReporter/Baseband"
    owner() {
      busctl --system call org.freedesktop.DBus /org/freedesktop/DBus org.freedesktop.DBus \
        GetConnectionUnixProcessID s "$1" 2>/dev/null | cut -d" " -f2
    }
    echo "tool: $(command -v vorntool)"
    echo "vornd: $(readlink "/proc/$VORN_SANDBOX_VORND_PID/exe")"
    echo "helper started by the sandbox: [$VORN_SANDBOX_HELPER_PID], running: [$(owner org.vorn.Helper)]"
    vorntool logdump tel nocompress; echo "status $?"
    ls "$snapshots" | grep -c -- "-tel\$"
    vorntool logdump oslog 3600 "$VORN_ROOT/../export.txt" -p Telhub; echo "status $?"
    echo "$(grep -c "from Telhub\$" "$VORN_ROOT/../export.txt") of $(wc -l <"$VORN_ROOT/../export.txt") lines"
    mkdir "$snapshots/log-bb-2026-01-02-030405-bb-trace"
    kill "$VORN_SANDBOX_VORND_PID"
    while kill -0 "$VORN_SANDBOX_VORND_PID" 2>/dev/null; do sleep 0.05; done
    vorntool logdump bb; echo "status $?"
    echo "helper: $(readlink "/proc/$(owner org.vorn.Helper)/exe")"
  ' 2>&1 | sed -E 's/log-bb-[0-9]{4}-[0-9]{2}-[0-9]{2}-[0-9]{6}(-[0-9]+)?-\*$/log-bb-TS-*/')"
  local snapshot=/var/wireless/Library/Logs/CrashReporter/Baseband/
  local expected="tool: $tree/bin/vorntool
vornd: $tree/libexec/vorn/vornd
helper started by the sandbox: [], running: []
Telephony log collection: Success
Path = ${snapshot}log-bb-TS-*
status 0
1
status 0
8 of 8 lines
Baseband log collection: Success (Vorn not running)
Path = ${snapshot}log-bb-2026-01-02-030405-bb-trace
status 0
helper: $tree/libexec/vorn/vorn-helper"
  same "a collection, an export and the bus-started helper from the installed tree" "$expected" "$out"
  finish
}

case "$step" in
  stage) step_stage; finish ;;
  files | system | manuals | sandbox) "step_$step" ;;
  *) echo "install_test.sh: unknown step $step" >&2; exit 2 ;;
esac
