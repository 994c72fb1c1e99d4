#!/usr/bin/env bash
# Checks the formatting of all C++ sources, and the rules of .clang-tidy on all that are compiled.
# Needs build/host configured and built, and build/target likewise for what only the device has.
# Fails on any finding.
set -euo pipefail
cd "$(dirname "$0")/.."

for build in build/host build/target; do
  [ -e $build/compile_commands.json ] || {
    echo "lint.sh: $build/compile_commands.json is missing, run make lint" >&2
    exit 1
  }
done

mapfile -t sources < <(
  git ls-files --cached --others --exclude-standard -- '*.h' '*.cc' | xargs -d '\n' ls -d 2>/dev/null)
[ ${#sources[@]} -gt 0 ] || { echo "lint.sh: no sources found" >&2; exit 1; }
clang-format --dry-run -Werror "${sources[@]}"

# What the compilers see, without what was generated in a build folder; each file once, as the first
# of the builds compiles it. Flags of g++ alone are left out.
mkdir -p build/lint
mapfile -t compiled < <(
  python3 - "$PWD" build/host build/target <<'PYTHON'
import json
import os
import re
import sys

root = sys.argv[1]
generated = os.path.join(root, "build") + os.sep
entries = {}
for build in sys.argv[2:]:
    for entry in json.load(open(os.path.join(build, "compile_commands.json"))):
        file = os.path.normpath(os.path.join(entry["directory"], entry["file"]))
        if file.startswith(root + os.sep) and not file.startswith(generated):
            entry["command"] = re.sub(r" -fstack-usage", "", entry["command"])
            entries.setdefault(file, entry)
json.dump(list(entries.values()), open("build/lint/compile_commands.json", "w"))
print("\n".join(sorted(entries)))
PYTHON
)
[ ${#compiled[@]} -gt 1 ] || { echo "lint.sh: nothing compiled" >&2; exit 1; }
rooms=$(printf '%s\n' "${sources[@]}" | cut -d/ -f1 | sort -u | paste -sd'|')
printf '%s\0' "${compiled[@]}" |
  xargs -0 -n 1 -P 2 clang-tidy --quiet -p build/lint --header-filter="^$PWD/($rooms)/" \
    --extra-arg=-Wno-ignored-optimization-argument >build/lint/clang-tidy.txt 2>&1 || {
  grep -vE '^[0-9]+ warnings? generated|^Suppressed|^Use -header-filter' build/lint/clang-tidy.txt
  exit 1
}
echo "lint: ${#sources[@]} files formatted, ${#compiled[@]} free of findings"
