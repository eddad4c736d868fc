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

It takes no arguments, opens no window (not even for an error), prints
nothing and always ends with exit status -1. Use hfstore.exe check, below, to
see what it did.

Running it
----------
1. Run it as an administrator. It stops and starts the server, renames
   settings directories the server's service created and writes under
   C:\ProgramData, so Windows asks for elevation (a UAC prompt) when it
   starts. From a script, run it from an elevated Command Prompt or
   PowerShell.

2. Run it from the server's installation directory. The server must run
   during the migration. When it does not, hfmigrate.exe starts it by its bare
   name, hotfolder.exe, waits seven seconds, migrates, and stops it again.
   Windows finds hotfolder.exe in the directory of hfmigrate.exe first, then
   on PATH: copy hfmigrate.exe into the server's installation directory and
   run it there, or put that directory on PATH. A server that was already
   running (in any session, or as a service) is left running; hfmigrate never
   stops a server that ran before it started one.

3. Wait for it. hfmigrate.exe is a Windows (not a console) program, so cmd
   and PowerShell return at once while it goes on. A script that must wait
   for it uses

     start /wait hfmigrate.exe                    (cmd)
     Start-Process -Wait .\hfmigrate.exe          (PowerShell)

   and then checks the result with hfstore.exe check. Only one hfmigrate
   runs at a time on a machine: one started while another runs ends at once,
   changing nothing.

Did every folder make it?
-------------------------
  hfstore.exe check           one line per listed folder: the result, the
                              folder and what was found; then a summary
  hfstore.exe check --json    the same as one JSON object

The results are "migrated", "not migrated" (the settings are still where
they were, or there never were any), "interrupted" (the run ended before the
folder was registered), "enabled state differs", "settings not retired"
(registered, but its legacy settings are still live) and "path not
decodable" (the list holds bytes that do not decode in this machine's ANSI
code page, for example after switching Windows to UTF-8: hfmigrate cannot
find that folder; the line shows the path's bytes, those outside printable
ASCII as \xHH).

Exit status of hfstore.exe check:
  0  every listed folder that had legacy settings is migrated as listed
  1  not every one is, or the list or the store cannot be read
  2  a usage error

Running it again
----------------
Running hfmigrate.exe again is safe and is the way to finish a migration:

- after an interruption (a reboot, a killed process, a power loss): the
  next run puts back the settings of any folder the interrupted run retired
  but did not register, and migrates it;
- after a folder was refused or failed (hfstore check does not say
  "migrated"): mend the cause, for example close an Explorer window or a
  program that holds files inside the folder's [_KYR_HotFolder_] directory,
  and run it again. Folders already migrated are left as they are.

Other commands of hfstore.exe (from any directory):

  hfstore.exe list    one line per hot folder: enabled or disabled, the name,
                      the folder path and the filter chain
  hfstore.exe dump    every record of every hot folder, as JSON
  hfstore.exe --store FILE dump    the same for another copy of the store

Both executables need no installation and no DLL beyond Windows' own, and
handle folder paths longer than 260 characters.
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
