#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Times the oslog export against journalctl on the same generated journal and
# samples the export's memory at several journal sizes.
#
#   bench/oslog/compare.sh [BUILD_DIR]
#
# BUILD_DIR (default build-oslog-rel, configured RelWithDebInfo if missing)
# holds the oslog_export binary; fixtures are cached under
# BUILD_DIR/bench/oslog/fixtures and reused while they are less than a day old.
# Environment: COMPARE_SIZE (entries for the throughput runs, 1000000),
# MEMORY_SIZES (entries for the memory runs, "100000 1000000 3000000").
set -euo pipefail

here=$(cd "$(dirname "$0")" && pwd)
source_dir=$(cd "$here/../.." && pwd)
build=${1:-$source_dir/build-oslog-rel}
compare_size=${COMPARE_SIZE:-1000000}
memory_sizes=${MEMORY_SIZES:-"100000 1000000 3000000"}
fixtures=$build/bench/oslog/fixtures
history=$((10 * 24 * 3600))  # more than the fixture's 24 hours
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

if [[ ! -f $build/build.ninja ]]; then
  cmake -S "$source_dir" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DVORN_BUILD_TESTS=OFF >/dev/null
fi
cmake --build "$build" --target oslog_export -j2 >/dev/null
export_bin=$build/bench/oslog/oslog_export

# fixture SIZE -> prints the root, generating it when missing or stale.
fixture() {
  local size=$1 dir=$fixtures/$1
  if [[ ! -f $dir/summary.txt ]] || [[ -n $(find "$dir/summary.txt" -mmin +1380) ]]; then
    rm -rf "$dir"
    mkdir -p "$dir"
    echo "generating a $size-entry journal..." >&2
    local t0=$SECONDS
    python3 "$source_dir/tests/oslog/make_journal.py" --root "$dir/root" --entries "$size" \
      --summary "$dir/summary.txt.new" >&2
    mv "$dir/summary.txt.new" "$dir/summary.txt"
    echo "  done in $((SECONDS - t0)) s" >&2
  fi
  echo "$dir/root"
}

# measure OUT CMD... -> runs CMD with stdout to OUT; sets secs, peak_total_kb,
# and with SAMPLE=1 peak_anon_kb (sampled from /proc every 10 ms; the sampler
# takes CPU, so timed runs go without it).
measure() {
  local out=$1
  shift
  /usr/bin/time -v -o "$work/time.txt" "$@" >"$out" &
  local timer=$! child="" anon=0 kb
  while [[ ${SAMPLE:-0} == 1 ]] && kill -0 "$timer" 2>/dev/null; do
    [[ -z $child ]] && child=$(pgrep -P "$timer" | head -n1 || true)
    if [[ -n $child ]] && kb=$(awk '/^RssAnon:/ {print $2}' "/proc/$child/status" 2>/dev/null) && [[ -n $kb ]]; then
      ((kb > anon)) && anon=$kb
    fi
    sleep 0.01
  done
  wait "$timer"
  peak_anon_kb=$anon
  peak_total_kb=$(awk -F': ' '/Maximum resident set size/ {print $2}' "$work/time.txt")
  secs=$(awk -F': ' '/Elapsed \(wall clock\)/ {n = split($2, p, ":"); s = 0; for (i = 1; i <= n; i++) s = s * 60 + p[i]; print s}' "$work/time.txt")
}

rate() { awk -v n="$1" -v s="$2" 'BEGIN { printf "%.0f", (s > 0 ? n / s : 0) }'; }

root=$(fixture "$compare_size")
journal_dir=$root/var/log/journal
image_fragment=zelmarbaseband
# journalctl has no substring match on paths: hand it the paths the fragment names.
mapfile -t image_matches < <(journalctl --directory="$journal_dir" -F _EXE | grep -i -- "$image_fragment" | sed 's/^/_EXE=/')

echo
echo "Throughput on $compare_size entries (lines written per second, best of 3)."
echo "'cat s' is journalctl -o cat on the same selection: what sd-journal's own reading costs."
printf '%-16s %9s %10s %12s %10s %12s %7s %7s\n' selection lines "export s" "export l/s" "jctl s" "jctl l/s" ratio "cat s"
run_pair() {
  local name=$1 jctl_args=$2
  shift 2
  local best_e=999999 best_j=999999 best_c=999999 lines_e lines_j
  for _ in 1 2 3; do
    VORN_ROOT=$root measure "$work/export.out" "$export_bin" "$history" "$work/export.txt" "$@"
    awk -v a="$secs" -v b="$best_e" 'BEGIN { exit !(a < b) }' && best_e=$secs
    # shellcheck disable=SC2086
    measure "$work/jctl.txt" journalctl --directory="$journal_dir" -o short-iso --no-pager -q $jctl_args
    awk -v a="$secs" -v b="$best_j" 'BEGIN { exit !(a < b) }' && best_j=$secs
    # shellcheck disable=SC2086
    measure /dev/null journalctl --directory="$journal_dir" -o cat --no-pager -q $jctl_args
    awk -v a="$secs" -v b="$best_c" 'BEGIN { exit !(a < b) }' && best_c=$secs
  done
  lines_e=$(wc -l <"$work/export.txt")
  lines_j=$(wc -l <"$work/jctl.txt")
  [[ $lines_e == "$lines_j" ]] || echo "  note: $name: export wrote $lines_e lines, journalctl $lines_j" >&2
  printf '%-16s %9d %10.2f %12s %10.2f %12s %6.2fx %7.2f\n' "$name" "$lines_e" "$best_e" \
    "$(rate "$lines_e" "$best_e")" "$best_j" "$(rate "$lines_j" "$best_j")" \
    "$(awk -v e="$best_e" -v j="$best_j" 'BEGIN { print (e > 0 ? j / e : 0) }')" "$best_c"
}
run_pair all "" -p
run_pair "one process" "_COMM=Telhub" -p Telhub
run_pair "image fragment" "${image_matches[*]}" -i "$image_fragment"

echo
echo "Peak memory of the export, all entries (kB):"
printf '%-10s %10s %12s %12s\n' entries seconds "RssAnon" "total RSS"
for size in $memory_sizes; do
  root=$(fixture "$size")
  VORN_ROOT=$root SAMPLE=1 measure "$work/export.out" "$export_bin" "$history" "$work/export.txt" -p
  printf '%-10s %10.2f %12s %12s\n' "$size" "$secs" "$peak_anon_kb" "$peak_total_kb"
done
