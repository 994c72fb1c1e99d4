#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# without_avx2.sh QZ_TRAIN: qz-train on an emulated processor without AVX2 shows its help and refuses to
# train with one line; an illegal instruction anywhere ends it by a signal.
expect() {
  wanted=$1 pattern=$2
  shift 2
  output=$(qemu-x86_64 -cpu Nehalem "$@" 2>&1)
  code=$?
  if [ $code -ne "$wanted" ] || ! printf '%s\n' "$output" | grep -qe "$pattern"; then
    printf '%s\n' "$*: exit code $code, expected $wanted and a line '$pattern':" "$output"
    exit 1
  fi
}
expect 0 '^ *fit  *Train on' "$1" --help
expect 0 ' --hold-out' "$1" fit --help
expect 2 '^qz-train: .*MANIFEST' "$1" fit
expect 4 '^qz-train: this processor lacks AVX2 or FMA' "$1" fit absent -o model
