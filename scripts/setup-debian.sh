#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs what is missing of the Debian packages that this project needs; silent when nothing is.
# Usage: scripts/setup-debian.sh [build] [test] [sanitize] [clip] [demo] [train] [validation] [counts] [lint] [target]
# No argument: all groups.
set -euo pipefail

packages_of() {
  case "$1" in
    build)
      echo g++ cmake ninja-build make python3 nanopb libnanopb-dev libprotobuf-dev \
        protobuf-compiler libsndfile1-dev libsoxr-dev libminizip-dev zlib1g-dev libcli11-dev \
        nlohmann-json3-dev libeigen3-dev binutils
      ;;
    test) echo libgtest-dev libgmock-dev libbenchmark-dev qemu-user ;;
    sanitize) echo clang-14 libclang-rt-14-dev ;;
    clip) echo sox libsox-fmt-base alsa-utils sound-theme-freedesktop ;;
    demo)
      echo sox libsox-fmt-base libsox-fmt-mp3 alsa-utils sound-theme-freedesktop scratch \
        elpa-redtick
      ;;
    train) echo espeak-ng sox libsox-fmt-base sound-theme-freedesktop scratch ;;
    validation) echo python3 python3-numpy python3-sklearn ;;
    lint) echo git clang-format clang-tidy ;;
    counts) echo valgrind python3 ;;
    target)
      echo g++-arm-linux-gnueabihf qemu-user cmake ninja-build make python3 nanopb protobuf-compiler
      ;;
    *)
      echo "setup-debian.sh: no such group: '$1', expected build, test, sanitize, clip, demo, train, validation, counts, lint or target" >&2
      exit 2
      ;;
  esac
}

installed() {
  [ "$(dpkg-query -W -f '${db:Status-Status}' "$1" 2>/dev/null)" = installed ]
}

still_missing() {
  local package
  for package in "$@"; do installed "$package" || echo "$package"; done
}

[ $# -gt 0 ] || set -- build test sanitize clip demo train validation counts lint target
wanted=()
for group in "$@"; do
  names=$(packages_of "$group")
  read -ra names <<<"$names"
  wanted+=("${names[@]}")
done

if ! command -v dpkg-query >/dev/null; then
  echo "setup-debian.sh: not a Debian system; install the equivalents of: ${wanted[*]}" >&2
  exit 1
fi

mapfile -t missing < <(still_missing "${wanted[@]}")
[ ${#missing[@]} -gt 0 ] || exit 0
echo "setup-debian.sh: installing ${missing[*]}" >&2

run=(env DEBIAN_FRONTEND=noninteractive)
if [ "$(id -u)" != 0 ]; then
  if ! command -v sudo >/dev/null; then
    echo "setup-debian.sh: neither root nor sudo; install as root: ${missing[*]}" >&2
    exit 1
  fi
  run=(sudo "${run[@]}")
fi

# An index that can't be fetched need not matter: the others, or those of earlier, may have every package.
"${run[@]}" apt-get -q update >&2 ||
  echo "setup-debian.sh: the package index could not be updated; trying with the present one" >&2
# One package that can't be installed must not prevent the others.
"${run[@]}" apt-get -q install -y --no-install-recommends "${missing[@]}" >&2 ||
  for package in "${missing[@]}"; do
    "${run[@]}" apt-get -q install -y --no-install-recommends "$package" >&2 || true
  done

mapfile -t missing < <(still_missing "${missing[@]}")
if [ ${#missing[@]} -gt 0 ]; then
  echo "setup-debian.sh: could not be installed: ${missing[*]}" >&2
  exit 1
fi
