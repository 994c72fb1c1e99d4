#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Unpacks the libraries that programs for the device's processor are built and run with, Debian's for
# armhf, into a folder of their own. Nothing is installed on the machine, no root is needed, and what
# else is installed does not matter.
# Usage: scripts/make-sysroot.sh FOLDER     (silent when all is there already)
set -euo pipefail

[ $# -eq 1 ] || { echo "usage: make-sysroot.sh FOLDER" >&2; exit 2; }
packages=(libc6-dev libstdc++6 libprotobuf-dev libnanopb-dev libsndfile1-dev libsoxr-dev libminizip-dev
  zlib1g-dev libcli11-dev nlohmann-json3-dev libgtest-dev libgmock-dev)

folder=$1
[ "$(cat "$folder/packages" 2>/dev/null)" != "${packages[*]}" ] || exit 0
if [ -e "$folder" ] && [ ! -e "$folder/packages" ]; then
  echo "make-sysroot.sh: $folder exists and is not of this script's making" >&2
  exit 1
fi
command -v apt-get >/dev/null || {
  echo "make-sysroot.sh: not a Debian system; $folder needs its armhf packages: ${packages[*]}" >&2
  exit 1
}
echo "make-sysroot.sh: fetching ${packages[*]} for armhf" >&2

# Beside the folder, which is replaced at the end by what is whole.
mkdir -p "$(dirname "$folder")"
part=$(mktemp -d "$folder.part-XXXXXX")
part=$(cd "$part" && pwd)
trap 'rm -rf "$part"' EXIT
work=$part/apt
mkdir -p "$work"/state/lists/partial "$work"/cache/archives/partial "$part/sysroot"

# apt's view of an armhf machine on which nothing is installed yet, with this machine's sources.
: >"$work/status"
cat >"$work/apt.conf" <<CONF
APT::Architecture "armhf";
APT::Architectures "armhf";
APT::Install-Recommends "0";
APT::Sandbox::User "";
Acquire::Languages "none";
Dir::State "$work/state";
Dir::State::status "$work/status";
Dir::Cache "$work/cache";
CONF
export APT_CONFIG=$work/apt.conf

# An index that can't be fetched need not matter: the others may hold every package.
if ! apt-get -q update >"$work/log" 2>&1; then
  grep '^[WE]: Failed to fetch' "$work/log" >&2 || true
  echo "make-sysroot.sh: a package index could not be fetched; trying with the others" >&2
fi
apt-get -q install -y --download-only "${packages[@]}" >"$work/log" 2>&1 || {
  cat "$work/log" >&2
  echo "make-sysroot.sh: could not fetch ${packages[*]} for armhf" >&2
  exit 1
}
for package in "$work"/cache/archives/*.deb; do dpkg-deb -x "$package" "$part/sysroot"; done
echo "${packages[*]}" >"$part/sysroot/packages"
rm -rf "$folder"
mv "$part/sysroot" "$folder"
