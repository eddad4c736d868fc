#!/usr/bin/env bash
# Builds the libFuzzer targets of fuzz/ with clang and runs each for a
# bounded time over a copy of its seed corpus. A crash, leak, timeout,
# out-of-memory or sanitizer report fails it; the input that caused it is
# kept in build-fuzz/artifacts/.
#
#   HF_FUZZ_SECONDS   time per target (default 30)
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
build=build-fuzz
seconds=${HF_FUZZ_SECONDS:-30}
targets=(list_file folder_config system_reg host_path)

# Optimised: the number of inputs tried in the time given is what finds faults.
cmake -S . -B "$build" -DCMAKE_C_COMPILER=clang-14 -DCMAKE_CXX_COMPILER=clang++-14 \
  -DCMAKE_BUILD_TYPE=RelWithDebInfo -DHF_FUZZ=ON -DHF_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" -j"$(nproc)" --target fuzzers

# The targets build their temporary prefixes here: in memory where the
# host has it, and removed afterwards whatever happens.
shm=/dev/shm
[ -d "$shm" ] && [ -w "$shm" ] || shm=$(realpath "$build")
export TMPDIR
TMPDIR=$(mktemp -d "$shm/hffuzz.XXXXXX")
trap 'rm -rf "$TMPDIR"' EXIT

export ASAN_OPTIONS=detect_leaks=1:abort_on_error=0
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
mkdir -p "$build/artifacts" "$build/logs"
failed=()
for target in "${targets[@]}"; do
  corpus="$build/corpus/$target"
  rm -rf "$corpus"
  mkdir -p "$corpus"
  cp fuzz/corpus/"$target"/* "$corpus"/
  options=(-max_total_time="$seconds" -rss_limit_mb=2048 -timeout=10 -print_final_stats=1
           -artifact_prefix="$build/artifacts/$target-")
  [ -f "fuzz/$target.dict" ] && options+=(-dict="fuzz/$target.dict")
  log="$build/logs/$target.log"
  status=0
  "$build/bin/${target}_fuzzer" "${options[@]}" "$corpus" >"$log" 2>&1 || status=$?
  runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log")
  speed=$(sed -n 's/^stat::average_exec_per_sec: *//p' "$log")
  if [ "$status" -eq 0 ]; then
    echo "fuzz: $target: ${runs:-?} runs, ${speed:-?}/s, no findings"
  else
    echo "fuzz: $target: FAILED (exit $status), see $log"
    grep -E '^(==[0-9]+==ERROR|SUMMARY|.*property broken|.*runtime error)' "$log" | head -5 || true
    failed+=("$target")
  fi
done
[ ${#failed[@]} -eq 0 ] || { echo "fuzz: findings in ${failed[*]}"; exit 1; }
