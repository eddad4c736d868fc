#!/usr/bin/env bash
# Cross-builds hfmigrate.exe, hfstore.exe, the hotfolder.exe stand-in and the
# Windows platform tests for 64-bit Windows into build-win64/, statically:
# the dependencies come from Debian's source packages, built once into a cache
# outside the work tree by scripts/win64_deps.sh.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh \
  g++-mingw-w64-x86-64-posix gcc-mingw-w64-x86-64-posix binutils-mingw-w64-x86-64 \
  googletest dpkg-dev xz-utils tcl wine wine64
deps="$(scripts/win64_deps.sh)"
# Libraries found in another dependency prefix must not stay in the cache.
if ! grep -qxF "HF_WIN64_DEPS:PATH=$deps" build-win64/CMakeCache.txt 2>/dev/null; then
  rm -f build-win64/CMakeCache.txt
fi

cmake -S . -B build-win64 -DCMAKE_BUILD_TYPE=Release \
  -DCMAKE_TOOLCHAIN_FILE="$PWD/cmake/mingw-w64-x86_64.cmake" -DHF_WIN64_DEPS="$deps" >/dev/null
cmake --build build-win64 -j"$(nproc)"

# Static: every DLL an executable imports is one of Windows' own, which Wine
# implements; a runtime of the compiler or of a dependency is a failure (Wine
# carries a zlib1.dll of its own, so those names are refused by name too).
wine_dlls="$(dirname "$(find /usr/lib -path '*wine/x86_64-windows/kernel32.dll' | head -1)")"
for exe in build-win64/bin/*.exe build-win64/tests/*.exe; do
  for dll in $(x86_64-w64-mingw32-objdump -p "$exe" | awk '/DLL Name:/ {print tolower($3)}'); do
    if [ ! -f "$wine_dlls/$dll" ] || [[ "$dll" =~ ^(lib|zlib|wx|sqlite|expat) ]]; then
      echo "build_win64: $exe needs $dll, which Windows does not have" >&2
      exit 1
    fi
  done
done
# No console window: the tool is a GUI-subsystem program.
subsystem="$(x86_64-w64-mingw32-objdump -p build-win64/bin/hfmigrate.exe | awk '/^Subsystem/')"
if [[ "$subsystem" != *"(Windows GUI)"* ]]; then
  echo "build_win64: hfmigrate.exe is not a GUI-subsystem program" >&2
  exit 1
fi

# No dialog: the shipped executables import no message box (the GUI
# library's assertion alert and last-resort error message are answered by
# platform/win32_no_dialogs.cpp), so nothing can wait for a click.
for exe in build-win64/bin/hfmigrate.exe build-win64/bin/hfstore.exe; do
  if x86_64-w64-mingw32-objdump -p "$exe" | grep -qiE 'MessageBox|TaskDialog'; then
    echo "build_win64: $exe can open a message box" >&2
    exit 1
  fi
done

# What Windows reads before a shipped program runs: its manifest (the
# execution level asked for, long paths, the supported systems, no code-page
# override) and its version resource, with the project's version. An
# executable without them is refused.
version="$(sed -n 's/^CMAKE_PROJECT_VERSION:STATIC=//p' build-win64/CMakeCache.txt)"
check_resources() {
  local exe=$1 level=$2 rc problem
  # windres fails on an executable without any resource: nothing to read.
  rc="$(x86_64-w64-mingw32-windres -i "$exe" -O rc 2>/dev/null)" || rc=""
  problem="$(perl -0777 -e '
    my ($level, $version) = @ARGV; my $rc = <STDIN>; my @missing;
    my ($block) = $rc =~ m{^1 24 /\* RT_MANIFEST \*/\nBEGIN\n(.*?)\nEND$}ms;
    my $xml = join "", map { s/^\s*"//; s/"\s*$//; s/""/"/g; s/\\n/\n/g; $_ } split /\n/, $block // "";
    $xml =~ s/<!--.*?-->//gs;
    push @missing, "a manifest" unless $xml =~ /<assembly\b/;
    push @missing, "requestedExecutionLevel $level"
      unless $xml =~ /<requestedExecutionLevel\s+level="\Q$level\E"/;
    push @missing, "longPathAware" unless $xml =~ m{<longPathAware\b[^>]*>\s*true\s*</longPathAware>};
    push @missing, "the Windows 10/11 and Server 2016-2022 entry"
      unless $xml =~ /<supportedOS\s+Id="\{8e0f7a12-bfb3-4fe8-b9a5-48fd50a15a9a\}"/;
    push @missing, "no code-page override" if $xml =~ /activeCodePage/;
    push @missing, "a version resource of $version"
      unless $rc =~ /^1 VERSIONINFO$/m && $rc =~ /VALUE "FileVersion", "\Q$version\E"/
        && $rc =~ /VALUE "ProductName", "[^"]+"/ && $rc =~ /VALUE "FileDescription", "[^"]+"/;
    print join(", ", @missing);' "$level" "$version" <<<"$rc")"
  if [ -n "$problem" ]; then
    echo "build_win64: $exe lacks $problem" >&2
    exit 1
  fi
}
check_resources build-win64/bin/hfmigrate.exe requireAdministrator
check_resources build-win64/bin/hfstore.exe asInvoker
