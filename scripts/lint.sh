#!/usr/bin/env bash
# Checks the formatting of all C++ sources, and the rules of .clang-tidy on all that are compiled.
# Needs a configured and built build/host. Fails on any finding.
set -euo pipefail
cd "$(dirname "$0")/.."

database=build/host/compile_commands.json
[ -e "$database" ] || { echo "lint.sh: $database is missing, run make lint" >&2; exit 1; }

mapfile -t sources < <(
  git ls-files --cached --others --exclude-standard -- '*.h' '*.cc' | xargs -d '\n' ls -d 2>/dev/null)
[ ${#sources[@]} -gt 0 ] || { echo "lint.sh: no sources found" >&2; exit 1; }
clang-format --dry-run -Werror "${sources[@]}"

# What the compiler sees, without what was generated in the build folder.
mapfile -t compiled < <(
  python3 - "$database" "$PWD" <<'PYTHON'
import json
import os
import sys

database, root = sys.argv[1:]
files = {os.path.normpath(os.path.join(e["directory"], e["file"])) for e in json.load(open(database))}
build = os.path.join(root, "build") + os.sep
print("\n".join(sorted(f for f in files if f.startswith(root + os.sep) and not f.startswith(build))))
PYTHON
)
[ ${#compiled[@]} -gt 1 ] || { echo "lint.sh: nothing compiled in $database" >&2; exit 1; }
rooms=$(printf '%s\n' "${sources[@]}" | cut -d/ -f1 | sort -u | paste -sd'|')
printf '%s\0' "${compiled[@]}" |
  xargs -0 -n 1 -P 2 clang-tidy --quiet -p build/host --header-filter="^$PWD/($rooms)/" \
    >build/host/clang-tidy.txt 2>&1 || {
  grep -vE '^[0-9]+ warnings? generated|^Suppressed|^Use -header-filter' build/host/clang-tidy.txt
  exit 1
}
echo "lint: ${#sources[@]} files formatted, ${#compiled[@]} free of findings"
