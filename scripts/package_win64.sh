#!/usr/bin/env bash
# Builds the Windows executables (scripts/build_win64.sh) and writes
# dist/hfmigrate-win64.zip: hfmigrate.exe, hfstore.exe and README-windows.txt.
# The server stand-in is never shipped: the tool launches the installed server.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh zip unzip
scripts/build_win64.sh

stage="$(mktemp -d)"
trap 'rm -rf "$stage"' EXIT
cp build-win64/bin/hfmigrate.exe build-win64/bin/hfstore.exe "$stage/"
# Windows line ends, for any editor a server administrator may open it with.
sed 's/$/\r/' >"$stage/README-windows.txt" <<'TEXT'
hfmigrate for Windows
=====================

hfmigrate.exe moves a legacy hot-folder installation into the hot-folder
server's configuration store, once, unattended. It reads the legacy list file
(C:\ProgramData\KYR\ZerOvurova\KYR ZerOvurova Preferences\KYR ZerOvurova DB)
and, for every listed folder, its [_KYR_HotFolder_]\folder.cfg; it registers
each folder in the store (C:\ProgramData\KYR\Dirorodiv\HotFolders.db) and
renames the folder's legacy settings directory to [_KYR_HotFolder_Old]. A
folder without folder.cfg, or one the store refuses, keeps its legacy settings
where they are.

It takes no arguments, opens no window, prints nothing and always ends with
exit status -1.

The server must run during the migration. When it does not, hfmigrate.exe
starts it by its bare name, hotfolder.exe, waits seven seconds, migrates, and
stops it again. Windows finds hotfolder.exe in the directory of hfmigrate.exe
first, then on PATH: copy hfmigrate.exe into the server's installation
directory and run it there, or put that directory on PATH.

To see the result, run hfstore.exe (from any directory):

  hfstore.exe list    one line per hot folder: enabled or disabled, the name,
                      the folder path and the filter chain
  hfstore.exe dump    every record of every hot folder, as JSON
  hfstore.exe --store FILE dump    the same for another copy of the store

Both executables need no installation and no DLL beyond Windows' own.
TEXT

mkdir -p dist
rm -f dist/hfmigrate-win64.zip
(cd "$stage" && zip -q -X "$OLDPWD/dist/hfmigrate-win64.zip" hfmigrate.exe hfstore.exe \
  README-windows.txt)
# Exactly these three; never the stand-in.
contents="$(zipinfo -1 dist/hfmigrate-win64.zip | LC_ALL=C sort | tr '\n' ' ')"
if [ "$contents" != "README-windows.txt hfmigrate.exe hfstore.exe " ]; then
  echo "package_win64: unexpected contents: $contents" >&2
  exit 1
fi
unzip -l dist/hfmigrate-win64.zip
