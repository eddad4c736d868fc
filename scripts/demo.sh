#!/usr/bin/env bash
# The demo: migrates the sample legacy installation in examples/legacy.
#
# It builds the tools, copies the sample into a fresh Wine-style prefix, runs
# hfmigrate with no server running (so the tool starts the hotfolder.exe
# stand-in, waits seven seconds, migrates, and stops it again), then shows
# what the configuration store now holds, which legacy settings directories
# were retired, and what hfstore check says of every listed folder.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
cmake -S . -B build -DHF_SANITIZE=ON -DCMAKE_BUILD_TYPE=Debug >/dev/null
cmake --build build -j"$(nproc)" --target hfmigrate hotfolder_server hfstore >/dev/null

prefix=$(mktemp -d "${TMPDIR:-/tmp}/hfdemo.XXXXXX")
cp -r examples/legacy/drive_c examples/legacy/drive_d "$prefix/"
mkdir "$prefix/dosdevices"
ln -s ../drive_c "$prefix/dosdevices/c:"
ln -s ../drive_d "$prefix/dosdevices/d:"
export WINEPREFIX="$prefix"
export PATH="$PWD/build/bin:$PATH"

echo "Legacy installation: $prefix (C: is drive_c, D: is drive_d)"
echo "Running hfmigrate (it starts the server and waits 7 seconds)..."
status=0
hfmigrate || status=$?
echo "hfmigrate exited with status $status (always 255, that is -1, by design)."
echo
echo "Hot folders in the configuration store (enabled, name, folder, filter chain):"
hfstore list
echo
echo "Legacy settings directories retired to [_KYR_HotFolder_Old]:"
# Shown as the Windows paths they are: D:\Jobs\... for $prefix/drive_d/Jobs/...
windows() { local rest=${1#"$prefix/drive_d/"}; echo "  D:\\${rest//\//\\}"; }
for dir in "$prefix"/drive_d/Jobs/*/; do
  [ -d "$dir[_KYR_HotFolder_Old]" ] && windows "$dir[_KYR_HotFolder_Old]"
done
echo "Folders whose legacy settings stay in place (not migrated):"
for dir in "$prefix"/drive_d/Jobs/*/; do
  [ -d "$dir[_KYR_HotFolder_Old]" ] || windows "${dir%/}"
done
echo
echo "Every listed folder checked against the store and the disk (hfstore check):"
check=0
hfstore check || check=$?
echo "hfstore check exited with status $check (0: every folder with legacy settings migrated as listed)."
echo
echo "The full store as JSON: WINEPREFIX=$prefix build/bin/hfstore dump"
