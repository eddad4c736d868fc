#!/usr/bin/env bash
# Proves the Windows build under Wine, in one real prefix made for this run:
#   - the platform contract tests (platform_test.exe), and the filter tree's
#     text against the XML library's, with UTF-16 text (filter_xml_test.exe);
#   - the demo installation and a generated one of 300 folders, each
#     migrated by hfmigrate.exe under Wine and by the Linux hfmigrate, each in
#     its own copy of the prefix with the server stand-in at the same Windows
#     path: the two `hfstore dump` outputs and the two drive D trees must be
#     byte-identical;
#   - start-up: with no server running, hotfolder.exe is launched from the
#     tool's directory, awaited and stopped; with one running, it is neither
#     awaited nor stopped; the exit status is -1 either way. A second run
#     started while the first waits leaves at once and changes nothing. The demo runs
#     with no server, from the server's directory, the only place a stand-in
#     is: the store records the running server's directory (the PDF filter's
#     error path), so a stand-in not launched from there shows as a
#     difference from the Linux run.
#   - a list path that does not decode in the ANSI code page (Japanese,
#     from the locale) keeps its place, and hfstore check names it.
# Any difference or failure, a missing tool included, fails it.
#
# The Linux executables come from build/ (HF_LINUX_BIN names another place).
set -euo pipefail
cd "$(dirname "$0")/.."
root=$PWD

scripts/build_win64.sh
win_bin=$root/build-win64/bin
linux_bin=${HF_LINUX_BIN:-}
if [ -z "$linux_bin" ]; then
  [ -f build/CMakeCache.txt ] ||
    cmake -S . -B build -DHF_SANITIZE=ON -DCMAKE_BUILD_TYPE=Debug >/dev/null
  cmake --build build -j"$(nproc)" --target hfmigrate hfstore hotfolder_server hfbench_generate
  linux_bin=$root/build/bin
fi

scratch="$(mktemp -d)"
prefixes=()
cleanup() {
  local p
  for p in "${prefixes[@]}"; do WINEPREFIX=$p wineserver -k 2>/dev/null || true; done
  rm -rf "$scratch"
}
trap cleanup EXIT
fail() {
  echo "test_win32: $*" >&2
  exit 1
}

export WINEARCH=win64 WINEDEBUG=-all
# Headless: no display, and no prompts to fetch the .NET and HTML runtimes.
unset DISPLAY WAYLAND_DISPLAY
export WINEDLLOVERRIDES="mscoree,mshtml="
# The legacy list's paths are Windows-1252, the ANSI code page of a
# western-European Windows; Wine takes its code page from the locale.
export LC_ALL=C.UTF-8

# --- The prefix ----------------------------------------------------------------
base=$scratch/base
prefixes+=("$base")
if ! WINEPREFIX=$base wine wineboot -i >"$scratch/wineboot.log" 2>&1; then
  cat "$scratch/wineboot.log" >&2
  fail "wineboot could not set up the prefix"
fi
WINEPREFIX=$base wineserver -w
# Copies of it, taken before anything runs in it.
copy_prefix() {
  cp -a "$base" "$1"
  prefixes+=("$1")
}

# Where the server is installed, as a Windows path and below a prefix.
server_dir='C:\Program Files\KYR\Dirorodiv'
server_host_dir='drive_c/Program Files/KYR/Dirorodiv'
tool_dir='C:\hfmigrate'
tool_host_dir='drive_c/hfmigrate'

# Puts installation $2 (drive_c and drive_d of a Wine-style prefix) into
# prefix $1, with D: mapped to its drive_d.
install() {
  cp -a "$2/drive_c/." "$1/drive_c/"
  cp -a "$2/drive_d" "$1/drive_d"
  ln -sfn ../drive_d "$1/dosdevices/d:"
}

# The stand-in and the tools, for Windows (w) or for Linux (l), into a
# directory of prefix $2.
place() {
  local host=$1 dir=$2
  shift 2
  mkdir -p "$dir"
  local name
  for name in "$@"; do
    if [ "$host" = w ]; then cp "$win_bin/$name.exe" "$dir/"; else cp "$linux_bin/$name" "$dir/"; fi
  done
}

# Runs program $2 (a Windows path under Wine, a host path on Linux) in prefix
# $1 with the further arguments; "milliseconds status" go to $scratch/run.
timed_run() {
  local prefix=$1 start status=0
  shift
  start=$(date +%s%N)
  WINEPREFIX=$prefix timeout 600 "$@" || status=$?
  echo "$((($(date +%s%N) - start) / 1000000)) $status" >"$scratch/run"
}

# Fails unless the last run ended with -1 (255) and took at least (ge), or
# less than (lt), the given seconds.
check_run() {
  local what=$1 cmp=$2 limit=$(($3 * 1000)) ms status
  read -r ms status <"$scratch/run"
  [ "$status" -eq 255 ] || fail "$what: exit status $status, not 255 (-1)"
  if [ "$cmp" = ge ]; then
    [ "$ms" -ge "$limit" ] || fail "$what: took $ms ms; the start-up wait is missing"
  else
    [ "$ms" -lt "$limit" ] || fail "$what: took $ms ms; it waited for a running server"
  fi
  echo "test_win32: $what: status 255 after $ms ms"
}

# Whether a server holds its mutex in Wine prefix $1. The stand-in's probe
# only looks, so a server starting at the same moment is not turned away.
wine_server_running() {
  local status=0
  WINEPREFIX=$1 timeout 120 wine "$server_dir\\hotfolder.exe" --probe >/dev/null 2>&1 || status=$?
  [ "$status" -eq 0 ] && return 0
  [ "$status" -eq 3 ] && return 1
  fail "the stand-in probe ended with status $status"
}

# Returns once a server runs in Wine prefix $1.
await_wine_server() {
  local _
  for _ in $(seq 60); do
    sleep 0.5
    wine_server_running "$1" && return 0
  done
  fail "the stand-in did not start under Wine"
}

# Starts the stand-in from the server directory, and returns once it runs.
start_wine_server() {
  (WINEPREFIX=$1 wine "$server_dir\\hotfolder.exe" >/dev/null 2>&1 &)
  await_wine_server "$1"
}

start_linux_server() {
  WINEPREFIX=$1 "$1/$server_host_dir/hotfolder.exe" &
  local _
  for _ in $(seq 100); do
    if ls -l "/proc/$!/fd" 2>/dev/null | grep -q "$1/.mutex/"; then return 0; fi
    sleep 0.05
  done
  fail "the stand-in did not start on Linux"
}

# The drive D tree: every entry with its type, then every file's digest.
drive_d_tree() {
  (
    cd "$1/drive_d"
    find . -printf '%y %p\n' | LC_ALL=C sort
    find . -type f -print0 | LC_ALL=C sort -z | xargs -0 -r sha256sum
  )
}

same() {
  if ! cmp -s "$2" "$3"; then
    diff -u "$2" "$3" | head -40 >&2 || true
    fail "$1: the Windows and the Linux build differ"
  fi
}

# The Linux run of compare(), in a process namespace of its own (own_pids):
# the tool finds and stops "the first process named hotfolder.exe", so it
# must see only the stand-in of this run, not one of another test on the host.
linux_side() {
  local name=$1 l=$2 host_dir=$3 server=$4
  if [ "$server" = absent ]; then
    PATH="$l/$server_host_dir:$PATH" timed_run "$l" "$l/$host_dir/hfmigrate"
    check_run "$name on Linux, no server running" ge 7
  else
    start_linux_server "$l"
    timed_run "$l" "$l/$host_dir/hfmigrate"
    check_run "$name on Linux, server running" lt 600
  fi
  WINEPREFIX=$l "$linux_bin/hfstore" dump >"$scratch/$name-linux.dump"
}
own_pids() {
  local user=()
  [ "$(id -u)" -eq 0 ] || user=(--user --map-root-user)
  export -f "$1" timed_run check_run start_linux_server fail
  export scratch server_host_dir linux_bin
  unshare "${user[@]}" --pid --fork --mount-proc bash -euo pipefail -c '"$@"' own_pids "$@"
}

# Migrates installation $2 (named $1) under Wine and on Linux, with the server
# running ($3 = running) or left to the tool to start ($3 = absent), and
# compares the stores and the drive D trees. Wine is done and gone before the
# Linux run, whose tool stops the first process named hotfolder.exe it finds.
compare() {
  local name=$1 install_dir=$2 server=$3
  local w=$scratch/$name-wine l=$scratch/$name-linux dir host_dir
  copy_prefix "$w"
  copy_prefix "$l"
  install "$w" "$install_dir"
  install "$l" "$install_dir"
  place w "$w/$server_host_dir" hotfolder
  place l "$l/$server_host_dir" hotfolder.exe
  if [ "$server" = absent ]; then
    # From the server's directory, as the tool is run on a real machine.
    dir=$server_dir host_dir=$server_host_dir
  else
    dir=$tool_dir host_dir=$tool_host_dir
  fi
  place w "$w/$host_dir" hfmigrate hfstore
  place l "$l/$host_dir" hfmigrate

  if [ "$server" = absent ]; then
    # While the first run waits for the server it started, a second one
    # leaves at once and changes nothing.
    drive_d_tree "$w" >"$scratch/$name-before.tree"
    timed_run "$w" wine "$dir\\hfmigrate.exe" &
    local first=$!
    await_wine_server "$w"
    (scratch=$scratch/second && mkdir "$scratch" && timed_run "$w" wine "$dir\\hfmigrate.exe" &&
      check_run "$name under Wine, a second run meanwhile" lt 5)
    drive_d_tree "$w" | cmp -s - "$scratch/$name-before.tree" ||
      fail "$name under Wine: a second run changed drive D while the first one ran"
    wait "$first"
    check_run "$name under Wine, no server running" ge 7
    ! wine_server_running "$w" || fail "$name under Wine: the started server was not stopped"
  else
    start_wine_server "$w"
    timed_run "$w" wine "$dir\\hfmigrate.exe"
    check_run "$name under Wine, server running" lt 600
    wine_server_running "$w" || fail "$name under Wine: the running server was stopped"
  fi
  WINEPREFIX=$w wine "$dir\\hfstore.exe" dump >"$scratch/$name-wine.dump"
  WINEPREFIX=$w wineserver -k 2>/dev/null || true
  WINEPREFIX=$w wineserver -w

  own_pids linux_side "$name" "$l" "$host_dir" "$server"

  [ -s "$scratch/$name-linux.dump" ] || fail "$name: the Linux store is empty"
  same "$name: hfstore dump" "$scratch/$name-wine.dump" "$scratch/$name-linux.dump"
  drive_d_tree "$w" >"$scratch/$name-wine.tree"
  drive_d_tree "$l" >"$scratch/$name-linux.tree"
  same "$name: drive D" "$scratch/$name-wine.tree" "$scratch/$name-linux.tree"
  echo "test_win32: $name: hfstore dump ($(wc -l <"$scratch/$name-linux.dump") lines)" \
    "and drive D trees identical"
  rm -rf "$w" "$l"
}

# --- Platform contract ---------------------------------------------------------
platform_contract() {
  local p=$scratch/platform
  copy_prefix "$p"
  # Links the record's files must not follow, made on the host: Wine makes
  # none of its own.
  local links=$p/drive_c/hf-links
  mkdir -p "$links/dir"
  printf outside >"$links/target"
  ln -s dir "$links/dirlink"
  ln -s nowhere "$links/stale.new"
  ln -s target "$links/run"
  HF_LINK_DIR='C:\hf-links' \
  HF_BIN_DIR="$(WINEPREFIX=$p winepath -w "$win_bin" 2>/dev/null)" WINEPREFIX=$p \
    timeout 300 wine build-win64/tests/platform_test.exe
  WINEPREFIX=$p timeout 300 wine build-win64/tests/filter_xml_test.exe
}

# --- Start-up with a server running, over an empty installation -----------------
startup_running() {
  local p=$scratch/startup
  copy_prefix "$p"
  place w "$p/$server_host_dir" hotfolder
  # A stand-in beside the tool too: launching it would show as a wait.
  place w "$p/$tool_host_dir" hfmigrate hotfolder
  start_wine_server "$p"
  timed_run "$p" wine "$tool_dir\\hfmigrate.exe" --help 'D:\Jobs'
  check_run "start-up under Wine, server running" lt 6
  wine_server_running "$p" || fail "start-up under Wine: the running server was stopped"
}

# hfstore prints the same bytes on both hosts, its usage included.
inspector_usage() {
  local p=$scratch/usage
  copy_prefix "$p"
  WINEPREFIX=$p wine "$win_bin/hfstore.exe" --help >"$scratch/usage-wine"
  "$linux_bin/hfstore" --help >"$scratch/usage-linux"
  same "hfstore --help" "$scratch/usage-wine" "$scratch/usage-linux"
  WINEPREFIX=$p wineserver -k 2>/dev/null || true
}

# A list path that does not decode in the machine's ANSI code page (here
# Japanese, 932, which Wine takes from the locale: a lead byte before a space
# is no character) keeps its place: the run migrates the other folder, and
# hfstore check names it by its bytes and exits 1.
undecodable_path() {
  local p=$scratch/codepage status=0 list
  copy_prefix "$p"
  mkdir -p "$p/drive_d/Jobs/Plain/[_KYR_HotFolder_]"
  echo '<HotFolder/>' >"$p/drive_d/Jobs/Plain/[_KYR_HotFolder_]/folder.cfg"
  ln -sfn ../drive_d "$p/dosdevices/d:"
  list="$p/drive_c/ProgramData/KYR/ZerOvurova/KYR ZerOvurova Preferences"
  mkdir -p "$list"
  perl -e 'print "KYR ZerOvurova Database\0\x01", "\0" x 15;
           print "\0\0\x02\0", pack("a260", $_) for "D:\\Jobs\\Bad\x81 x", "D:\\Jobs\\Plain";' \
    >"$list/KYR ZerOvurova DB"
  place w "$p/$server_host_dir" hotfolder
  place w "$p/$tool_host_dir" hfmigrate hfstore
  # Through env: the host need not have the locale, Wine only reads its name.
  local japanese=(env LC_ALL=ja_JP.UTF-8 wine)
  start_wine_server "$p"
  timed_run "$p" "${japanese[@]}" "$tool_dir\\hfmigrate.exe"
  check_run "an undecodable list path under Wine" lt 600
  WINEPREFIX=$p "${japanese[@]}" "$tool_dir\\hfstore.exe" check >"$scratch/codepage.check" ||
    status=$?
  [ "$status" -eq 1 ] || fail "an undecodable list path: hfstore check ended with $status, not 1"
  printf '%s\t%s\t%s\n' "path not decodable" 'D:\Jobs\Bad\x81 x' \
    "the list's bytes for this path do not decode in this machine's ANSI code page: hfmigrate cannot find the folder" \
    "migrated" 'D:\Jobs\Plain' "enabled, as listed" >"$scratch/codepage.expected"
  head -2 "$scratch/codepage.check" | diff -u "$scratch/codepage.expected" - >&2 ||
    fail "an undecodable list path: the run or hfstore check did not keep its place"
  echo "test_win32: an undecodable list path keeps its place and hfstore check names it"
  WINEPREFIX=$p wineserver -k 2>/dev/null || true
}

generated=$scratch/generated
"$linux_bin/hfbench_generate" "$generated" 300 7 >/dev/null

platform_contract
inspector_usage
startup_running
undecodable_path
compare demo examples/legacy absent
compare generated "$generated" running
echo "test_win32: all passed"
