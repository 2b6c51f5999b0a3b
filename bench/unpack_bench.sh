#!/usr/bin/env bash
# unpack_bench.sh CORPUS_DIR: links CORPUS_DIR/freedoom.ls (compressed, name blocks), then
# times `qorUnpack test` on the archive and `qorUnpack extract` against `tar -xf` of the
# same files, and checks that the extracted response file relinks the archive byte for byte.
# Median of RUNS wall-clock runs (default 5); every extraction goes into a fresh directory.
# Targets: test >= 300 MB/s of expanded data; extract >= half the speed of tar -xf. Extract is
# timed as it is by default (every compressed body recompressed to prove the relink exact)
# and with --no-verify.
set -euo pipefail

corpus=$(cd "${1:?usage: bench/unpack_bench.sh CORPUS_DIR}" && pwd)
runs=${RUNS:-5}
root=$(cd "$(dirname "$0")/.." && pwd)
build=$root/build-unpackbench
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Release -DQOR_TESTS=OFF >/dev/null
cmake --build "$build" -j 2 --target qorLink qorUnpack >/dev/null
(cd "$corpus" && "$build/qorLink" freedoom.ls -o "$work/freedoom.LB")

calc() { awk "BEGIN { print ($1) }"; }

# Wall-clock seconds of one run; "{}" in the command becomes a fresh directory. The
# directories stay until the end: deleting thousands of files slows the file system's next
# creations and would blur the figures.
timed() {
  local out start end
  out=$(mktemp -d -p "$work")
  start=$(date +%s.%N)
  "${@//\{\}/$out}" >/dev/null || { echo "failed: $*" >&2; exit 1; }
  end=$(date +%s.%N)
  calc "$end - $start"
}
median() { printf '%s\n' "$@" | sort -g | awk '{ t[NR] = $1 } END { print t[int((NR + 1) / 2)] }'; }

expanded=$("$build/qorUnpack" test "$work/freedoom.LB" | sed 's/.* entries, \([0-9]*\) bytes expanded.*/\1/')
"$build/qorUnpack" extract "$work/freedoom.LB" -C "$work/x" >/dev/null
(cd "$work/x" && "$build/qorLink" freedoom.ls -o freedoom.LB >/dev/null)
cmp -s "$work/freedoom.LB" "$work/x/freedoom.LB" && roundtrip=identical || roundtrip=DIFFERENT
(cd "$work/x" && rm freedoom.ls freedoom.LB && tar -cf "$work/files.tar" .)

# Interleaved, so that every command meets the same state of the machine and file system.
tests=() tars=() extracts=() fasts=()
for _ in $(seq "$runs"); do
  tests+=("$(timed "$build/qorUnpack" test "$work/freedoom.LB")")
  tars+=("$(timed tar -xf "$work/files.tar" -C {})")
  extracts+=("$(timed "$build/qorUnpack" extract "$work/freedoom.LB" -C {})")
  fasts+=("$(timed "$build/qorUnpack" extract --no-verify "$work/freedoom.LB" -C {})")
done
test_s=$(median "${tests[@]}") tar_s=$(median "${tars[@]}")
extract_s=$(median "${extracts[@]}") fast_s=$(median "${fasts[@]}")

verdict() { if [ "$(calc "$1")" = 1 ]; then echo met; else echo MISSED; fi; }
test_mbs=$(calc "$expanded / $test_s / 1e6")
echo "archive: $(stat -c %s "$work/freedoom.LB") bytes, $expanded bytes expanded; relinked: $roundtrip"
printf 'test:    %.3f s, %.0f MB/s expanded (target >= 300: %s)\n' "$test_s" "$test_mbs" \
  "$(verdict "$test_mbs >= 300")"
ratio() {
  printf '%-20s %.3f s; tar -xf %.3f s; ratio %.2f (target <= 2: %s)\n' "$1" "$2" "$tar_s" \
    "$(calc "$2 / $tar_s")" "$(verdict "$2 <= 2 * $tar_s")"
}
ratio "extract:" "$extract_s"
ratio "extract --no-verify:" "$fast_s"
