#!/usr/bin/env bash
# Cross-builds the Windows dependencies from Debian 12 source packages into
# static libraries: wxWidgets 3.2 (MSW port, base and xml only), expat, zlib
# and SQLite, with the header-only JSON library beside them. The result lands in a cache outside the work tree, keyed by the
# source package versions, the compiler and this script, and is reused when
# present. Prints the dependency prefix on standard output; all else goes to
# standard error.
set -euo pipefail

host=x86_64-w64-mingw32
cc=$host-gcc-posix
cxx=$host-g++-posix
packages=(wxwidgets3.2 expat zlib sqlite3 nlohmann-json3)
jobs="$(nproc)"

cache="${XDG_CACHE_HOME:-$HOME/.cache}/hfmigrate-win64"
mkdir -p "$cache"
# One run at a time builds; another waits and then finds the result.
exec 9>"$cache/lock"
flock 9

log() { echo "win64_deps: $*" >&2; }

# --- Source lists -----------------------------------------------------------
# deb-src entries derived from the Debian sources this machine already uses,
# in a private apt configuration and state, so the machine's own stays as is.
apt_dir="$cache/apt"
mkdir -p "$apt_dir/sources.list.d" "$apt_dir/state/lists/partial" \
  "$apt_dir/cache/archives/partial"
: >"$apt_dir/preferences"
. /etc/os-release
release="${VERSION_CODENAME:?no release name in /etc/os-release}"

# deb822 stanzas: every enabled "deb" stanza of this release, as deb-src.
deb822_to_src() {
  awk -v rel="$release" '
    function flush() {
      if (types ~ /(^| )deb( |$)/ && enabled != "no" && suites != "") {
        print "Types: deb-src"; print "URIs: " uris; print "Suites: " suites
        print "Components: " comps
        if (signed != "") print "Signed-By: " signed
        print ""
      }
      types = uris = suites = comps = signed = enabled = ""
    }
    /^#/ { next }
    /^[ \t]*$/ { flush(); next }
    {
      key = tolower($1); sub(/:$/, "", key); $1 = ""; sub(/^ +/, "")
      if (key == "types") types = $0
      else if (key == "uris") uris = $0
      else if (key == "components") comps = $0
      else if (key == "signed-by") signed = $0
      else if (key == "enabled") enabled = tolower($0)
      else if (key == "suites") {
        n = split($0, s, " ")
        for (i = 1; i <= n; i++)
          if (s[i] == rel || index(s[i], rel "-") == 1) suites = suites (suites ? " " : "") s[i]
      }
    }
    END { flush() }' "$@"
}

# One-line entries: every "deb" line of this release, as deb-src.
list_to_src() {
  awk -v rel="$release" '
    $1 == "deb" {
      for (i = 2; i <= NF; i++) if ($i !~ /^\[/ && $i !~ /\]$/ && $i !~ /=/) break
      suite = $(i + 1)
      if (suite == rel || index(suite, rel "-") == 1) { $1 = "deb-src"; print }
    }' "$@"
}

shopt -s nullglob
deb822=(/etc/apt/sources.list.d/*.sources)
lists=(/etc/apt/sources.list.d/*.list)
[ -f /etc/apt/sources.list ] && lists+=(/etc/apt/sources.list)
{ [ ${#deb822[@]} -eq 0 ] || deb822_to_src "${deb822[@]}"; } >"$apt_dir/sources.list.d/src.sources"
{ [ ${#lists[@]} -eq 0 ] || list_to_src "${lists[@]}"; } >"$apt_dir/sources.list"
shopt -u nullglob
if [ ! -s "$apt_dir/sources.list.d/src.sources" ] && [ ! -s "$apt_dir/sources.list" ]; then
  log "no Debian $release sources configured on this machine"
  exit 1
fi

apt_opts=(
  -o "Dir::Etc::SourceList=$apt_dir/sources.list"
  -o "Dir::Etc::SourceParts=$apt_dir/sources.list.d"
  -o "Dir::Etc::Preferences=$apt_dir/preferences"
  -o "Dir::Etc::PreferencesParts=$apt_dir/preferences.d"
  -o "Dir::State=$apt_dir/state"
  -o "Dir::State::status=/var/lib/dpkg/status"
  -o "Dir::Cache=$apt_dir/cache"
  -o "APT::Sandbox::User=$(id -un)"
  -o "Debug::NoLocking=1"
)
# The lists are refreshed once a day; a failed refresh keeps the old ones.
stamp="$apt_dir/state/updated"
if [ -z "$(find "$stamp" -mmin -1440 2>/dev/null)" ]; then
  log "refreshing the source lists"
  if apt-get "${apt_opts[@]}" -qq update >&2; then
    touch "$stamp"
  elif [ ! -f "$stamp" ]; then
    log "apt-get update failed"
    exit 1
  fi
fi

# Fetches a source package into the download directory, newest version
# first; a version the mirror cannot serve (a security update it lacks, say)
# gives way to the next older one. Prints the version fetched.
downloads="$cache/sources"
mkdir -p "$downloads"
fetch_source() {
  local v
  for v in $(apt-cache "${apt_opts[@]}" showsrc "$1" | awk '/^Version:/ {print $2}' |
    sort -u | sort -r -V); do
    if [ -f "$downloads/$1_${v#*:}.dsc" ] ||
      (cd "$downloads" && apt-get "${apt_opts[@]}" -qq source --download-only "$1=$v" \
        >/dev/null 2>&1); then
      echo "$v"
      return 0
    fi
    log "$1 $v could not be fetched; trying an older version"
  done
  log "no source package $1 could be fetched"
  return 1
}

# --- Cache key --------------------------------------------------------------
pins=()
for p in "${packages[@]}"; do pins+=("$p=$(fetch_source "$p")"); done
key="$({
  printf '%s\n' "${pins[@]}"
  $cxx --version | head -1
  $cc --version | head -1
  sha256sum <"$0"
} | sha256sum | cut -c1-16)"
out="$cache/$key"
if [ -f "$out/done" ]; then
  echo "$out/prefix"
  exit 0
fi

# --- Build ------------------------------------------------------------------
log "building ${pins[*]} with $($cxx --version | head -1) into $out"
work="$cache/$key.work"
rm -rf "$work" "$out"
# A build that stops half-way leaves nothing a later run could take for done.
trap '[ -f "$out/done" ] || rm -rf "$out"; rm -rf "$work"' EXIT
# Installed straight to its place: wx-config keeps the prefix it was built
# for. Only the "done" mark makes the result visible to later runs.
prefix="$out/prefix"
mkdir -p "$work/src" "$prefix/include" "$prefix/lib"
for pin in "${pins[@]}"; do
  p=${pin%%=*} v=${pin#*=}
  dpkg-source --no-check -x "$downloads/${p}_${v#*:}.dsc" "$work/src/$p" >&2
done
srcdir() { echo "$work/src/$1"; }

cmake_cross=(
  -DCMAKE_SYSTEM_NAME=Windows -DCMAKE_SYSTEM_PROCESSOR=x86_64
  -DCMAKE_C_COMPILER="$cc" -DCMAKE_CXX_COMPILER="$cxx"
  -DCMAKE_RC_COMPILER=$host-windres -DCMAKE_BUILD_TYPE=Release
  -DBUILD_SHARED_LIBS=OFF
)

build_zlib() {
  # The dfsg tarball has no MinGW makefile; the CMake static target works.
  local src b=$work/build-zlib
  src="$(srcdir zlib)"
  cmake -S "$src" -B "$b" "${cmake_cross[@]}" >&2
  cmake --build "$b" --target zlibstatic -j"$jobs" >&2
  cp "$b/libzlibstatic.a" "$prefix/lib/libz.a"
  cp "$src/zlib.h" "$b/zconf.h" "$prefix/include/"
}

build_expat() {
  local src b=$work/build-expat
  src="$(srcdir expat)"
  [ -f "$src/CMakeLists.txt" ] || src="$src/expat"
  cmake -S "$src" -B "$b" "${cmake_cross[@]}" -DCMAKE_INSTALL_PREFIX="$prefix" \
    -DEXPAT_SHARED_LIBS=OFF -DEXPAT_BUILD_TOOLS=OFF -DEXPAT_BUILD_EXAMPLES=OFF \
    -DEXPAT_BUILD_TESTS=OFF -DEXPAT_BUILD_DOCS=OFF -DEXPAT_BUILD_PKGCONFIG=OFF >&2
  # Debian's security patches test "#if XML_DTD == 1"; CMake defines it empty.
  sed -i 's/^#define XML_DTD *$/#define XML_DTD 1/' "$b/expat_config.h"
  grep -q '^#define XML_DTD 1$' "$b/expat_config.h"
  cmake --build "$b" -j"$jobs" >&2
  cmake --install "$b" >&2
}

build_sqlite() {
  # Debian ships the full tree: generate the amalgamation natively (it needs
  # tclsh), then cross-compile that one file.
  local src b=$work/build-sqlite
  src="$(srcdir sqlite3)"
  mkdir -p "$b"
  (cd "$b" && "$src/configure" --disable-tcl >&2 && make sqlite3.c >&2)
  $cc -O2 -DSQLITE_THREADSAFE=1 -c "$b/sqlite3.c" -o "$b/sqlite3.o"
  $host-ar rcs "$prefix/lib/libsqlite3.a" "$b/sqlite3.o"
  cp "$b/sqlite3.h" "$src/src/sqlite3ext.h" "$prefix/include/" 2>/dev/null ||
    cp "$b/sqlite3.h" "$prefix/include/"
}

build_wx() {
  # The +dfsg tarball lacks the bundled expat, zlib and image libraries; its
  # PCRE2 is there. The image libraries are GUI-only.
  local src b=$work/build-wx
  src="$(srcdir wxwidgets3.2)"
  mkdir -p "$b"
  (cd "$b" && "$src/configure" --host=$host --prefix="$prefix" \
    CC="$cc" CXX="$cxx" CPPFLAGS="-DXML_STATIC -I$prefix/include" LDFLAGS="-L$prefix/lib" \
    --with-msw --disable-gui --disable-shared --with-expat=sys --with-zlib=sys \
    --with-regex=builtin --without-liblzma --without-libcurl --disable-webrequest \
    --disable-tests >&2)
  make -C "$b" -j"$jobs" >&2
  make -C "$b" install >&2
  # A base-only install leaves out a header that wx/init.h includes.
  local inc
  inc="$(find "$prefix/include" -maxdepth 1 -name 'wx-3.*' | head -1)"
  [ -f "$inc/wx/msw/init.h" ] || cp "$src/include/wx/msw/init.h" "$inc/wx/msw/"
}

build_json() {
  # Header-only: its single-header form is installed as it stands.
  cp -r "$(srcdir nlohmann-json3)/single_include/nlohmann" "$prefix/include/"
}

build_zlib
build_json
build_expat
build_sqlite
build_wx

printf '%s\n' "${pins[@]}" >"$out/versions"
touch "$out/done"
log "done: $out"
echo "$out/prefix"
