#!/usr/bin/env bash
# End-to-end GPX export of a 1,000,000-point trip by `navmisc export` against gpsbabel reading
# and writing the same track as GPX (gpx in, gpx out), with the release build:
#
#   cmake --preset release && cmake --build --preset release && bench/export_vs_gpsbabel.sh [RUNS]
#
# Runs each command RUNS times (default 3), alternating them so that both see the same load,
# and reports the median wall time and peak memory (GNU time's maximum resident set size) of
# each, and the two ratios: how many times faster navmisc is (target: at least 20) and its peak
# memory as a share of gpsbabel's (target: at most 0.6). Scratch files go to a folder under
# $TMPDIR (else /tmp), removed afterwards.
set -euo pipefail

here=$(cd "$(dirname "$0")/.." && pwd)
navmisc="$here/build/release/tools/navmisc"
bench="$here/build/release/bench/gpx_export_bench"
runs=${1:-3}
for tool in "$navmisc" "$bench"; do
  [[ -x $tool ]] || { echo "missing $tool: build the release preset first" >&2; exit 1; }
done
command -v gpsbabel >/dev/null || { echo "gpsbabel is not installed (scripts/setup.sh installs it)" >&2; exit 1; }
gnutime=/usr/bin/time
[[ -x $gnutime ]] || { echo "GNU time ($gnutime) is needed for the peak memory (apt-get install time)" >&2; exit 1; }

work=$(mktemp -d "${TMPDIR:-/tmp}/navmisc-vs-gpsbabel-XXXXXX")
trap 'rm -rf "$work"' EXIT
unset NAVMISC_DATA_ROOT  # the runs choose their own data root

trip=$("$bench" --write-trip="$work/root")
ours=("$navmisc" --data-root "$work/root" export "$trip" --format gpx -o "$work/same.gpx")
theirs=(gpsbabel -i gpx -f "$work/same.gpx" -o gpx -F "$work/out.gpx")
"${ours[@]}" >/dev/null
points=$(grep -c '<trkpt ' "$work/same.gpx")
echo "trip $trip: $points track points, $(stat -c %s "$work/same.gpx") bytes of GPX"

# One run: "seconds kibibytes".
measure() { "$gnutime" -f '%e %M' -o "$work/time" "$@" >/dev/null && cat "$work/time"; }
: >"$work/ours"
: >"$work/theirs"
for ((i = 0; i < runs; i++)); do
  measure "${ours[@]}" >>"$work/ours"
  measure "${theirs[@]}" >>"$work/theirs"
done
# The median of column $2 of file $1.
median() { sort -n -k"$2" "$1" | awk -v c="$2" '{ v[NR] = $c } END { print v[int((NR + 1) / 2)] }'; }
our_s=$(median "$work/ours" 1)
our_k=$(median "$work/ours" 2)
their_s=$(median "$work/theirs" 1)
their_k=$(median "$work/theirs" 2)
printf '%-30s median %7.3f s   peak %8d KiB   (%d runs)\n' "navmisc export (trip -> gpx)" "$our_s" "$our_k" "$runs"
printf '%-30s median %7.3f s   peak %8d KiB   (%d runs)\n' "gpsbabel (gpx -> gpx)" "$their_s" "$their_k" "$runs"
awk -v a="$their_s" -v b="$our_s" -v m="$our_k" -v n="$their_k" 'BEGIN {
  speed = a / (b > 0 ? b : 0.001); memory = m / n
  printf "navmisc is %.1fx as fast as gpsbabel (target: at least 20x): %s\n", speed, (speed >= 20 ? "met" : "NOT met")
  printf "navmisc peak memory is %.2fx gpsbabel'"'"'s (target: at most 0.6x): %s\n", memory, (memory <= 0.6 ? "met" : "NOT met")
}'
