#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Checks the licence lines and the formatting of all sources, and the rules of .clang-tidy on what is compiled.
# Usage: scripts/lint.sh [--changed] BUILD...     the folders of builds, each configured and built
# A file is checked as the first of the builds compiles it. --changed: only files that differ from the main branch,
# and for a changed header one file that includes it. Fails on any finding.
set -euo pipefail
cd "$(dirname "$0")/.."

changed=
[ "${1:-}" != --changed ] || { changed=1; shift; }
[ $# -gt 0 ] || { echo "usage: lint.sh [--changed] BUILD..." >&2; exit 2; }
for build in "$@"; do
  [ -e "$build/compile_commands.json" ] || {
    echo "lint.sh: $build/compile_commands.json is missing, run make lint or make check" >&2
    exit 1
  }
done

mapfile -t sources < <(
  git ls-files --cached --others --exclude-standard -- '*.h' '*.cc' | xargs -d '\n' ls -d 2>/dev/null)
[ ${#sources[@]} -gt 0 ] || { echo "lint.sh: no sources found" >&2; exit 1; }
scripts/check-spdx.sh
clang-format --dry-run -Werror "${sources[@]}"

difference=all
if [ -n "$changed" ]; then
  main=main
  ! git rev-parse -q --verify origin/main >/dev/null || main=origin/main
  base=$(git merge-base HEAD $main)
  difference=$(git diff --name-only --diff-filter=d "$base" -- '*.h' '*.cc'
    git ls-files --others --exclude-standard -- '*.h' '*.cc')
fi

mkdir -p build/lint
mapfile -t compiled < <(DIFFERENCE=$difference scripts/compiled-sources.py build/lint "$@")
if [ -z "$changed" ] && [ ${#compiled[@]} -lt 100 ]; then
  echo "lint.sh: only ${#compiled[@]} files compiled, expected at least 100" >&2
  exit 1
fi
folders=$(printf '%s\n' "${sources[@]}" | cut -d/ -f1 | sort -u | paste -sd'|')

# tidy FILES...: the files with the most to analyse first, so that no processor is idle at the end. The analyser
# takes four fifths of the time and follows test macros for most of it, so tests and benches go without it.
tidy() {
  local checks=$1
  shift
  [ $# -eq 0 ] || ls -S "$@" | tr '\n' '\0' |
    xargs -0 -n 1 -P "$(nproc)" clang-tidy --quiet -p build/lint --checks="$checks" \
      --header-filter="^$PWD/($folders)/" --extra-arg=-Wno-ignored-optimization-argument \
      --extra-arg=-Wno-unknown-warning-option >>build/lint/clang-tidy.txt 2>&1
}
tests=() others=()
for file in "${compiled[@]}"; do
  case "${file#"$PWD/"}" in tests/* | bench/*) tests+=("$file") ;; *) others+=("$file") ;; esac
done
: >build/lint/clang-tidy.txt
found=0
tidy '' ${others[@]+"${others[@]}"} || found=1
tidy '-clang-analyzer-*' ${tests[@]+"${tests[@]}"} || found=1
if [ $found = 1 ]; then
  grep -vE '^[0-9]+ warnings? generated|^Suppressed|^Use -header-filter' build/lint/clang-tidy.txt
  exit 1
fi
echo "lint: ${#sources[@]} files formatted, ${#compiled[@]} free of findings"
