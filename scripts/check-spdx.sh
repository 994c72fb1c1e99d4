#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Checks that every source file names its licence in one line at its top.
# Usage: scripts/check-spdx.sh [--fix]     --fix adds the line where it is missing
set -euo pipefail
cd "$(dirname "$0")/.."

licence='SPDX-License-Identifier: Apache-2.0'
mapfile -t files < <(
  git ls-files --cached --others --exclude-standard -- '*.h' '*.cc' '*.c' '*.proto' '*.py' '*.sh' '*.cmake' \
    '*CMakeLists.txt' Makefile .ci/run scripts/pre-commit | xargs -d '\n' ls -d 2>/dev/null)
[ ${#files[@]} -ge 100 ] || { echo "check-spdx.sh: ${#files[@]} sources, expected at least 100" >&2; exit 1; }

missing=()
for file in "${files[@]}"; do
  { IFS= read -r first; IFS= read -r second; } <"$file" || true
  [[ $first == *"$licence" || ($first == '#!'* && $second == *"$licence") ]] || missing+=("$file")
done

if [ "${1:-}" = --fix ]; then
  for file in ${missing[@]+"${missing[@]}"}; do
    case "$file" in *.h | *.cc | *.c | *.proto) line="// $licence" ;; *) line="# $licence" ;; esac
    if [ "$(head -c 2 "$file")" = '#!' ]; then sed -i "1a $line" "$file"; else sed -i "1i $line" "$file"; fi
  done
elif [ ${#missing[@]} -gt 0 ]; then
  printf '%s: no licence line\n' "${missing[@]}" >&2
  echo "check-spdx.sh: ${#missing[@]} files without '$licence'; scripts/check-spdx.sh --fix adds it" >&2
  exit 1
fi
