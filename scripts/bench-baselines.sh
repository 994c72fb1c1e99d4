#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Times our kernels and the libraries that others would use instead, in interleaved rounds, and prints one
# table; then our operators and kernels one by one. All of it stays in build/host/baselines.
#   bench-baselines.sh BASELINES      the folder with the programs of the baselines' setup.sh and run.sh
# PEERS_DIR (default a folder under /tmp) is where they are built; ROUNDS and BENCH_MAX_MS are described in run.sh.
# UPDATE=1 also rewrites docs/performance.md and its picture.
set -euo pipefail
cd "$(dirname "$0")/.."

baselines=${1:?no folder of the baselines (make bench-baselines BASELINES=FOLDER)}
[ -x "$baselines/setup.sh" ] && [ -x "$baselines/run.sh" ] || {
  echo "bench-baselines.sh: no setup.sh and run.sh in '$baselines', should be the folder of the baselines" \
    "(make bench-baselines BASELINES=FOLDER)" >&2
  exit 1
}
grep -q ' avx2' /proc/cpuinfo || {
  echo "bench-baselines.sh: this processor has no AVX2, which the table is about" >&2
  exit 1
}
export PEERS_DIR=${PEERS_DIR:-${TMPDIR:-/tmp}/qz-peers}
[ -x "$PEERS_DIR/bin/fftmix" ] || "$baselines/setup.sh" >&2

bin=$PWD/build/host/bin
export PEERS_EXTRA=$PEERS_DIR/extra
cat >"$PEERS_EXTRA" <<EXTRA
$bin/baseline_lines_Avx2
$bin/baseline_lines_Baseline
EXTRA
# Where the processor has more than AVX2, both we and the network library use it by default.
if grep -q ' avx512_vnni' /proc/cpuinfo; then
  cat >>"$PEERS_EXTRA" <<EXTRA
$bin/baseline_lines
ONEDNN_MAX_CPU_ISA=AVX2 $PEERS_DIR/bin/onednn | sed 's/|oneDNN [^ ]*/&, AVX2 only,/'
EXTRA
fi
results=build/host/baselines
mkdir -p "$results"
"$baselines/run.sh" | tee "$results/table.md"
cp "$PEERS_DIR/raw.txt" "$results"
# Several times, of which the shortest counts: a neighbour can slow a machine down for seconds.
for run in parts gains; do : >"$results/$run.txt"; done
for _ in 1 2 3 4 5; do
  BENCH_MAX_MS=200 "$bin/baseline_lines_Avx2" --parts >>"$results/parts.txt"
  taskset -c $(($(nproc) > 1 ? 1 : 0)) "$bin/kernel_comparison_test" --time >>"$results/gains.txt"
done
[ -z "${UPDATE:-}" ] || scripts/performance/performance.py "$results"
