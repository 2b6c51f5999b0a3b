#!/usr/bin/env bash
# unpack_bench.sh CORPUS_DIR: links CORPUS_DIR/freedoom.ls (compressed, name blocks), then
# times `qorUnpack test` on the archive and `qorUnpack extract` against `tar -xf` of the
# same files, and checks that the extracted response file relinks the archive byte for byte.
# Best of RUNS wall-clock runs (default 5); every extraction goes into a fresh directory.
# Targets: test >= 300 MB/s of expanded data; extract >= half the speed of tar -xf.
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

# Best wall-clock seconds of $runs runs; "{}" in the command becomes a fresh directory.
best() {
  local best_s="" start end s n=0 out
  for _ in $(seq "$runs"); do
    n=$((n + 1))
    out=$work/out.$n
    start=$(date +%s.%N)
    "${@//\{\}/$out}" >/dev/null
    end=$(date +%s.%N)
    rm -rf "$out"
    s=$(calc "$end - $start")
    if [ -z "$best_s" ] || [ "$(calc "$s < $best_s")" = 1 ]; then best_s=$s; fi
  done
  printf '%.3f' "$best_s"
}

expanded=$("$build/qorUnpack" test "$work/freedoom.LB" | sed 's/.* entries, \([0-9]*\) bytes expanded.*/\1/')
"$build/qorUnpack" extract "$work/freedoom.LB" -C "$work/x" >/dev/null
(cd "$work/x" && "$build/qorLink" freedoom.ls -o freedoom.LB >/dev/null)
cmp -s "$work/freedoom.LB" "$work/x/freedoom.LB" && roundtrip=identical || roundtrip=DIFFERENT
(cd "$work/x" && rm freedoom.ls freedoom.LB && tar -cf "$work/files.tar" .)

test_s=$(best "$build/qorUnpack" test "$work/freedoom.LB")
tar_s=$(best sh -c 'mkdir "$1" && tar -xf "$2" -C "$1"' - {} "$work/files.tar")
extract_s=$(best "$build/qorUnpack" extract "$work/freedoom.LB" -C {})

verdict() { if [ "$(calc "$1")" = 1 ]; then echo met; else echo MISSED; fi; }
test_mbs=$(calc "$expanded / $test_s / 1e6")
echo "archive: $(stat -c %s "$work/freedoom.LB") bytes, $expanded bytes expanded; relinked: $roundtrip"
printf 'test:    %s s, %.0f MB/s expanded (target >= 300: %s)\n' "$test_s" "$test_mbs" \
  "$(verdict "$test_mbs >= 300")"
printf 'extract: %s s; tar -xf %s s; ratio %.2f (target <= 2: %s)\n' "$extract_s" "$tar_s" \
  "$(calc "$extract_s / $tar_s")" "$(verdict "$extract_s <= 2 * $tar_s")"
