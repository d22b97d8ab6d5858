#!/usr/bin/env bash
# End-to-end GPX export of a 1,000,000-point trip by `navmisc export` against gpsbabel reading
# and writing the same track as GPX (gpx in, gpx out), with the release build:
#
#   cmake --preset release && cmake --build --preset release && bench/export_vs_gpsbabel.sh [RUNS]
#
# Uses hyperfine when it is installed, else times RUNS runs (default 3) of each and prints the
# fastest and the median. Scratch files go to a folder under $TMPDIR (else /tmp), removed after.
set -euo pipefail

here=$(cd "$(dirname "$0")/.." && pwd)
navmisc="$here/build/release/tools/navmisc"
bench="$here/build/release/bench/gpx_export_bench"
runs=${1:-3}
for tool in "$navmisc" "$bench"; do
  [[ -x $tool ]] || { echo "missing $tool: build the release preset first" >&2; exit 1; }
done
command -v gpsbabel >/dev/null || { echo "gpsbabel is not installed (scripts/setup.sh installs it)" >&2; exit 1; }

work=$(mktemp -d "${TMPDIR:-/tmp}/navmisc-vs-gpsbabel-XXXXXX")
trap 'rm -rf "$work"' EXIT
unset NAVMISC_DATA_ROOT  # the runs choose their own data root

trip=$("$bench" --write-trip="$work/root")
export_cmd="'$navmisc' --data-root '$work/root' export $trip --format gpx -o '$work/same.gpx'"
babel_cmd="gpsbabel -i gpx -f '$work/same.gpx' -o gpx -F '$work/out.gpx'"
eval "$export_cmd" >/dev/null
points=$(grep -c '<trkpt ' "$work/same.gpx")
echo "trip $trip: $points track points, $(stat -c %s "$work/same.gpx") bytes of GPX"

if command -v hyperfine >/dev/null; then
  hyperfine --warmup 1 --runs "$runs" -n "navmisc export (trip -> gpx)" "$export_cmd" \
    -n "gpsbabel (gpx -> gpx)" "$babel_cmd"
  exit 0
fi

# Seconds taken by each of $runs runs of a command, one a line, sorted.
timings() {
  for ((i = 0; i < runs; i++)); do
    local start end
    start=$(date +%s.%N)
    eval "$1" >/dev/null
    end=$(date +%s.%N)
    awk -v a="$start" -v b="$end" 'BEGIN { printf "%.3f\n", b - a }'
  done | sort -n
}
report() {
  local label=$1; shift
  local times=("$@")
  printf '%-30s fastest %6.3f s   median %6.3f s   (%d runs)\n' "$label" "${times[0]}" \
    "${times[$(( ${#times[@]} / 2 ))]}" "${#times[@]}"
}
mapfile -t ours < <(timings "$export_cmd")
mapfile -t theirs < <(timings "$babel_cmd")
report "navmisc export (trip -> gpx)" "${ours[@]}"
report "gpsbabel (gpx -> gpx)" "${theirs[@]}"
awk -v a="${theirs[$(( runs / 2 ))]}" -v b="${ours[$(( runs / 2 ))]}" \
  'BEGIN { printf "gpsbabel / navmisc (median): %.1fx\n", a / b }'
