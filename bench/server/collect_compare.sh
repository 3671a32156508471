#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Times a tar.gz collection of vornd's collector against `tar -czf` of the
# same log tree, in one run, and reports vornd's peak memory: collecting the
# tree, and holding eight waiting requests behind a running collection.
#
#   bench/server/collect_compare.sh [BUILD_DIR]
#
# BUILD_DIR (default build/default) must hold, or is made to hold,
# vorn_collect_bench, vornd and vornd-testing. The tree (2,000 small log
# files and two large ones, about 193 MB) is generated once and cached under
# ${VORN_BENCH_CACHE:-/var/tmp/vorn-bench}. RUNS (default 3) timed runs of
# each; the best of each is compared.
#
# The kernel shares the CPU between sessions (autogroups), not threads: while
# other sessions keep the cores busy, a process gets about one session's
# share however many threads it runs, and the comparison shows only the CPU
# each side spends. PRIORITY=high runs the whole comparison in a session of
# its own with the highest autogroup priority (root only), so that both
# sides see the machine's cores as if it were otherwise idle.
set -euo pipefail

if [[ ${PRIORITY:-} == high && ${COLLECT_COMPARE_SESSION:-} != 1 ]]; then
  exec setsid --wait env COLLECT_COMPARE_SESSION=1 bash -c 'echo -20 >/proc/self/autogroup && exec "$0" "$@"' "$0" "$@"
fi

here=$(cd "$(dirname "$0")" && pwd)
source_dir=$(cd "$here/../.." && pwd)
build=$(cd "${1:-$source_dir/build/default}" && pwd)
cache=${VORN_BENCH_CACHE:-/var/tmp/vorn-bench}
runs=${RUNS:-3}
root=$cache/collect-root
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --build "$build" --target vorn_collect_bench vornd vornd-testing -j2 >/dev/null
driver=$build/bench/server/vorn_collect_bench

if [[ ! -f $root/.complete ]]; then
  echo "generating the log tree under $root (once)..." >&2
  rm -rf "$root"
  mkdir -p "$root/var/log/vorn"
  python3 - "$root/var/log/vorn" <<'PY'
import os, random, sys
base = sys.argv[1]
rng = random.Random(1)
words = ["attach", "detach", "rrc", "paging", "handover", "signal", "bearer", "modem", "sim", "ims"]
def lines(n):
    out = []
    for i in range(n):
        out.append("2026-01-%02d %02d:%02d:%02d.%06d telhub[%d]: %s %s id=%08x rsrp=-%d\n" % (
            1 + i % 28, i % 24, i % 60, (i * 7) % 60, rng.randrange(10**6), 1000 + i % 50,
            rng.choice(words), rng.choice(words), rng.getrandbits(32), rng.randrange(140)))
    return "".join(out)
for i in range(2000):
    folder = os.path.join(base, "session-%02d" % (i % 40))
    os.makedirs(folder, exist_ok=True)
    with open(os.path.join(folder, "log-%04d.txt" % i), "w") as f:
        f.write(lines(60 + i % 80))
chunk = lines(20000)
for name in ("telhub-full.log", "baseband-trace.log"):
    with open(os.path.join(base, name), "w") as f:
        for _ in range(59):
            f.write(chunk)
PY
  touch "$root/.complete"
fi
tree_mb=$(du -sm "$root/var/log/vorn" | cut -f1)
files=$(find "$root/var/log/vorn" -type f | wc -l)
echo "tree: $files files, $tree_mb MB, $(nproc) cores, session $(cat /proc/self/autogroup 2>/dev/null || echo "?")"

snapshots=$root/var/wireless/Library/Logs/CrashReporter/Baseband
best_vornd=""
best_tar=""
for ((i = 1; i <= runs; i++)); do
  rm -rf "$snapshots"
  out=$(/usr/bin/time -f "cpu %U %S" "$driver" "$root" 1 2>&1)
  secs=$(awk '/^seconds/ {print $2}' <<<"$out")
  cpu=$(awk '/^cpu/ {printf "%.2f", $2 + $3}' <<<"$out")
  hwm=$(awk '/^VmHWM/ {print $2}' <<<"$out")
  anon=$(awk '/^RssAnon/ {print $2}' <<<"$out")
  size=$(du -m "$snapshots"/log-bb-*.tar.gz | cut -f1)
  rm -f "$work/tar.tgz"
  tar_out=$(/usr/bin/time -f "%e %U %S" tar -czf "$work/tar.tgz" -C "$root/var/log" vorn 2>&1)
  tar_secs=$(awk '{printf "%.3f", $1}' <<<"$tar_out")
  tar_cpu=$(awk '{printf "%.2f", $2 + $3}' <<<"$tar_out")
  tar_size=$(du -m "$work/tar.tgz" | cut -f1)
  printf 'run %d: vornd %6.3f s (cpu %s s, %s MB, VmHWM %s kB, RssAnon %s kB)   tar -czf %6.3f s (cpu %s s, %s MB)   load %s\n' \
    "$i" "$secs" "$cpu" "$size" "$hwm" "$anon" "$tar_secs" "$tar_cpu" "$tar_size" "$(cut -d" " -f1 /proc/loadavg)"
  if [[ -z $best_vornd ]] || awk -v a="$secs" -v b="$best_vornd" 'BEGIN {exit !(a < b)}'; then best_vornd=$secs; fi
  if [[ -z $best_tar ]] || awk -v a="$tar_secs" -v b="$best_tar" 'BEGIN {exit !(a < b)}'; then best_tar=$tar_secs; fi
done
rm -rf "$snapshots"
awk -v v="$best_vornd" -v t="$best_tar" \
  'BEGIN {printf "best: vornd %.3f s, tar -czf %.3f s: vornd is %.2fx as fast\n", v, t, t / v}'

# The real daemon in the sandbox: one collection of the same tree (hard
# links into the sandbox's root), then eight requests waiting behind a held
# collection and a ninth told busy.
"$source_dir/scripts/vorn-sandbox" --build "$build" --no-helper -- bash -c '
  set -euo pipefail
  rm -rf "$VORN_ROOT/var/log/vorn"
  cp -al "'"$root"'/var/log/vorn" "$VORN_ROOT/var/log/vorn" 2>/dev/null || cp -a "'"$root"'/var/log/vorn" "$VORN_ROOT/var/log/vorn"
  call() {
    busctl --system --timeout=600 call org.vorn.Manager /org/vorn/Manager org.vorn.Manager1 PerformCommand \
      "ssa{sv}" bench TraceDumpState 3 TraceAction s CollectTelephonyLogs TraceDumpStatePerformCompression x 1 \
      TraceDumpStateReason s "$1"
  }
  t0=$(date +%s.%N); call bench >/dev/null; t1=$(date +%s.%N)
  awk -v a="$t0" -v b="$t1" "BEGIN {printf \"vornd over the bus: %.3f s\", b - a}"
  echo " ($(grep -E "^(VmHWM|RssAnon)" /proc/$VORN_SANDBOX_VORND_PID/status | tr -s " \t" " " | tr "\n" " "))"
'
"$source_dir/scripts/vorn-sandbox" --build "$build" --no-helper --vornd-arg --collect-delay-ms --vornd-arg 5000 -- bash -c '
  set -euo pipefail
  reason=$(head -c 4096 /dev/zero | tr "\0" r)
  call() {
    busctl --system --timeout=600 call org.vorn.Manager /org/vorn/Manager org.vorn.Manager1 PerformCommand \
      "ssa{sv}" bench TraceDumpState 2 TraceAction s CollectTelephonyLogs TraceDumpStateReason s "$reason"
  }
  before=$(awk "/^VmHWM/ {print \$2}" /proc/$VORN_SANDBOX_VORND_PID/status)
  for i in $(seq 9); do call >/dev/null & sleep 0.05; done
  sleep 0.5
  echo "tenth request: $(call | cut -c1-60)"
  echo "vornd with one collection held and eight waiting: VmHWM $before kB at start," \
    "$(grep -E "^(VmHWM|RssAnon)" /proc/$VORN_SANDBOX_VORND_PID/status | tr -s " \t" " " | tr "\n" " ")"
  wait
'
