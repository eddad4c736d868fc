#!/usr/bin/env bash
# The benchmark: hfmigrate against the floor.
#
# For each size (default 1,000 and 10,000 folders) it generates a legacy
# installation under ${TMPDIR:-/tmp} and, BENCH_RUNS times (default 5), runs
# hfmigrate over a fresh copy with the hot-folder server already running in
# it (so the seven-second start-up wait is not measured), then the floor
# over another fresh copy: the reads, moves and durable commits that any
# migration of the same folders must do, with the rows per folder taken from
# the store hfmigrate wrote. Other work on the machine only ever slows a
# run down, so the two alternate and the fastest run of each counts, with
# the largest peak memory seen in any run. It prints
# wall time, time per folder, peak memory and the ratio to the floor, then
# checks the targets. Each hfmigrate run holds the lock that the tests
# which start or stop the server stand-in hold, so that no other build's
# test stops the benchmark's server (or the benchmark theirs).
#
#   [BENCH_RUNS=N] scripts/bench.sh [COUNT...]
set -euo pipefail
cd "$(dirname "$0")/.."

sizes=("$@")
[ ${#sizes[@]} -eq 0 ] && sizes=(1000 10000)
seed=1
runs=${BENCH_RUNS:-5}
build=build-bench

scripts/setup.sh
cmake -S . -B "$build" -DCMAKE_BUILD_TYPE=Release -DHF_SANITIZE=OFF -DHF_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" -j2 --target hfmigrate hotfolder_server hfstore hfbench_generate \
  hfbench_floor hfbench_measure >/dev/null
bin="$PWD/$build/bin"

work=$(mktemp -d "${TMPDIR:-/tmp}/hfbench.XXXXXX")
server=""
cleanup() {
  if [ -n "$server" ]; then kill "$server" 2>/dev/null || true; fi
  rm -rf "$work"
}
trap cleanup EXIT

server_lock=/tmp/hfmigrate-hotfolder-tests.lock

store_of() { echo "$1/drive_c/ProgramData/KYR/Dirorodiv/HotFolders.db"; }

# Starts the server stand-in in prefix $1 and returns once it holds its
# mutex (a lock file under the prefix that it keeps open). The stand-in does
# not inherit the test lock: one left behind by an interrupted run would
# otherwise hold every test that starts a server.
start_server() {
  WINEPREFIX="$1" "$bin/hotfolder.exe" {lock}>&- &
  server=$!
  for _ in $(seq 100); do
    if ls -l "/proc/$server/fd" 2>/dev/null | grep -q "$1/.mutex/"; then return 0; fi
    sleep 0.05
  done
  echo "bench: the server did not start" >&2
  exit 1
}

stop_server() {
  kill "$server" 2>/dev/null || true
  wait "$server" 2>/dev/null || true
  server=""
}

# Runs hfmigrate over prefix $1; fails when the server was gone before the
# run ended (the start-up wait would then be in the time).
measure_tool() {
  local prefix=$1 out=$2 lock
  exec {lock}>>"$server_lock"
  chmod 0666 "$server_lock" 2>/dev/null || true
  flock "$lock"
  start_server "$prefix"
  sync
  WINEPREFIX="$prefix" "$bin/hfbench_measure" "$out" "$bin/hfmigrate"
  local status
  read -r _ _ status <"$out"
  if [ "$status" -ne 255 ]; then
    echo "bench: hfmigrate ended with status $status, not 255" >&2
    exit 1
  fi
  if ! kill -0 "$server" 2>/dev/null; then
    echo "bench: the server was stopped during the run; measure again" >&2
    exit 1
  fi
  stop_server
  exec {lock}>&-
}

# The fastest wall time of the runs in file $1 ("wall rss status" lines),
# with the largest peak memory seen.
fastest() {
  sort -n "$1" | awk 'NR == 1 { wall = $1 } $2 > rss { rss = $2 } END { print wall, rss }'
}

results="$work/results"
: >"$results"
for n in "${sizes[@]}"; do
  base="$work/base-$n"
  expected=$("$bin/hfbench_generate" "$base" "$n" "$seed")
  : >"$work/tool-$n.runs"
  : >"$work/floor-$n.runs"
  for run in $(seq "$runs"); do
    tool="$work/tool-$n"
    floor="$work/floor-$n"
    cp -a "$base" "$tool"
    cp -a "$base" "$floor"

    measure_tool "$tool" "$work/run.time"
    cat "$work/run.time" >>"$work/tool-$n.runs"
    if [ "$run" -eq 1 ]; then
      registered=$(WINEPREFIX="$tool" "$bin/hfstore" list | wc -l)
      if [ "$registered" -ne "$expected" ]; then
        echo "bench: $registered of $expected folders registered at $n" >&2
        exit 1
      fi
      "$bin/hfbench_floor" plan "$(store_of "$tool")" >"$work/plan-$n"
    fi

    sync
    "$bin/hfbench_measure" "$work/run.time" "$bin/hfbench_floor" run "$floor" "$work/plan-$n"
    read -r _ _ floor_status <"$work/run.time"
    if [ "$floor_status" -ne 0 ]; then
      echo "bench: the floor failed at $n" >&2
      exit 1
    fi
    cat "$work/run.time" >>"$work/floor-$n.runs"
    rm -rf "$tool" "$floor"
  done
  rm -rf "$base"
  echo "$n $(fastest "$work/tool-$n.runs") $(fastest "$work/floor-$n.runs")" >>"$results"
done

awk -v runs="$runs" '
  {
    n[NR] = $1; tw[NR] = $2; tr[NR] = $3; fw[NR] = $4; fr[NR] = $5
  }
  END {
    printf "Fastest of %d runs per size (peak memory: the largest).\n\n", runs
    print "| Folders | hfmigrate | per folder | peak RSS | floor | per folder | peak RSS | ratio to floor |"
    print "|--------:|----------:|-----------:|---------:|------:|-----------:|---------:|---------------:|"
    for (i = 1; i <= NR; i++) {
      printf "| %d | %.2f s | %.3f ms | %.1f MiB | %.2f s | %.3f ms | %.1f MiB | %.2f |\n",
             n[i], tw[i], 1000 * tw[i] / n[i], tr[i] / 1024,
             fw[i], 1000 * fw[i] / n[i], fr[i] / 1024, tw[i] / fw[i]
    }
    if (NR < 2) exit
    last = NR
    growth = (tw[last] / n[last]) / (tw[1] / n[1]) - 1
    memory = tr[last] / tr[1]
    ratio = tw[last] / fw[last]
    print ""
    printf "ratio to the floor at %d: %.2f (target at most 1.5)%s\n",
           n[last], ratio, ratio <= 1.5 ? "" : "  MISSED"
    printf "time per folder at %d against %d: %+.1f%% (target within 10%%)%s\n",
           n[last], n[1], 100 * growth, (growth <= 0.10 && growth >= -0.10) ? "" : "  MISSED"
    printf "peak memory at %d against %d: %.2f times (target at most 1.25)%s\n",
           n[last], n[1], memory, memory <= 1.25 ? "" : "  MISSED"
  }
' "$results"
