#!/usr/bin/env bash
# Cross-builds the Windows platform layer, the hotfolder.exe stand-in and the
# platform tests with mingw-w64 into build-win32/, and runs the tests under
# Wine in a prefix of their own. Any failure, a missing tool included, fails it.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh g++-mingw-w64-x86-64 googletest wine wine64

cmake -S platform/win32 -B build-win32 -DCMAKE_BUILD_TYPE=Release \
  -DCMAKE_TOOLCHAIN_FILE="$PWD/cmake/mingw-w64-x86_64.cmake" >/dev/null
cmake --build build-win32 -j"$(nproc)"

# A fresh prefix, removed afterwards with every process Wine started in it.
scratch="$(mktemp -d)"
cleanup() {
  wineserver -k 2>/dev/null || true
  rm -rf "$scratch"
}
trap cleanup EXIT
export WINEPREFIX="$scratch/prefix" WINEARCH=win64 WINEDEBUG=-all
# Headless: no display, and no prompts to fetch the .NET and HTML runtimes.
unset DISPLAY WAYLAND_DISPLAY
export WINEDLLOVERRIDES="mscoree,mshtml="
if ! wine wineboot -i >"$scratch/wineboot.log" 2>&1; then
  cat "$scratch/wineboot.log" >&2
  echo "test_win32: wineboot could not set up the prefix" >&2
  exit 1
fi
wineserver -w

# The tests find the stand-in here, as a Windows path.
HF_BIN_DIR="$(winepath -w "$PWD/build-win32/bin" 2>/dev/null)"
export HF_BIN_DIR
timeout 300 wine build-win32/tests/platform_test.exe
