#!/usr/bin/env bash
# Installs the Debian packages the project builds and tests with, when any is
# missing, together with any further packages named as arguments. Quiet when
# everything is there; safe to run again.
set -euo pipefail

packages=(
  cmake make g++ pkg-config clang-14 libclang-rt-14-dev
  libwxgtk3.2-dev libsqlite3-dev nlohmann-json3-dev
  libgtest-dev libgmock-dev
  "$@"
)

missing=()
for p in "${packages[@]}"; do
  if ! dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed'; then
    missing+=("$p")
  fi
done
[ ${#missing[@]} -eq 0 ] && exit 0

echo "setup: installing ${missing[*]}"
sudo=""
[ "$(id -u)" -ne 0 ] && sudo="sudo"
export DEBIAN_FRONTEND=noninteractive
$sudo apt-get update -qq
$sudo apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null
