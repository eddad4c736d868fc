#!/usr/bin/env bash
# Builds the project with AddressSanitizer and UndefinedBehaviorSanitizer and
# runs the whole test suite, then cross-builds the tool for Windows, proves it
# under Wine against the Linux build and packages it. Any failing test,
# sanitizer report or difference fails it.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
cmake -S . -B build -DHF_SANITIZE=ON -DCMAKE_BUILD_TYPE=Debug >/dev/null
cmake --build build -j"$(nproc)"

export ASAN_OPTIONS=detect_leaks=1:abort_on_error=0
export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
ctest --test-dir build --output-on-failure -j"$(nproc)"
scripts/fuzz.sh
scripts/test_win32.sh
scripts/package_win64.sh >/dev/null
