#!/usr/bin/env bash
# link_bench.sh CORPUS_DIR: times linking CORPUS_DIR/freedoom.ls with qorLink against tar on
# the same files (stored) and against the compressor alone on the same bytes (compressed),
# and measures the link's peak memory. Median of RUNS wall-clock runs (default 5).
# Targets: stored link <= 2 x tar -cf; compressed link <= 1.2 x compressor;
# peak memory < largest compressed entry + 16 MB.
set -euo pipefail

corpus=$(cd "${1:?usage: bench/link_bench.sh CORPUS_DIR}" && pwd)
runs=${RUNS:-5}
root=$(cd "$(dirname "$0")/.." && pwd)
build=$root/build-linkbench
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Release -DQOR_TESTS=OFF >/dev/null
cmake --build "$build" -j 2 --target qorLink >/dev/null
g++ -std=c++17 -O2 -I "$root" "$root/bench/compress_list.cpp" -o "$work/compress_list" \
  "$build/libqorCompress.a" "$build/libport.a" "$build/libVyx.a"

grep -v '^[;%]' "$corpus/freedoom.ls" > "$work/files"
{ echo '%nocompress'; cat "$corpus/freedoom.ls"; } > "$work/stored.ls"

calc() { awk "BEGIN { print ($1) }"; }

# Median wall-clock seconds of $runs runs of the command, run in the corpus directory.
median() {
  local times=() start end
  for _ in $(seq "$runs"); do
    start=$(date +%s.%N)
    (cd "$corpus" && "$@" >/dev/null)
    end=$(date +%s.%N)
    times+=("$(calc "$end - $start")")
  done
  printf '%s\n' "${times[@]}" | sort -g | awk '{ t[NR] = $1 } END { printf "%.3f", t[int((NR + 1) / 2)] }'
}

tar_s=$(median tar -cf "$work/all.tar" -T "$work/files")
stored_s=$(median "$build/qorLink" "$work/stored.ls" -o "$work/stored.LB")
compressor_s=$(median "$work/compress_list" "$work/files")
compressed_s=$(median "$build/qorLink" freedoom.ls -o "$work/compressed.LB")

summary=$(cd "$corpus" && "$work/compress_list" "$work/files")
largest=$(echo "$summary" | sed 's/.*largest payload \([0-9]*\) bytes.*/\1/')
peak_kb=$( (cd "$corpus" && /usr/bin/time -f '%M' "$build/qorLink" freedoom.ls \
  -o "$work/compressed.LB") 2>&1 | tail -1)
limit_kb=$(( (largest + 16 * 1024 * 1024) / 1024 ))

verdict() { if [ "$(calc "$1")" = 1 ]; then echo met; else echo MISSED; fi; }
echo "corpus: $(grep -c . "$work/files") files; compressor: $summary"
echo "archives: stored $(wc -c < "$work/stored.LB") bytes," \
  "compressed $(wc -c < "$work/compressed.LB") bytes"
printf 'stored link      %6ss   tar -cf     %6ss   ratio %.2f (target <= 2.0: %s)\n' \
  "$stored_s" "$tar_s" "$(calc "$stored_s / $tar_s")" "$(verdict "$stored_s <= 2 * $tar_s")"
printf 'compressed link  %6ss   compressor  %6ss   ratio %.2f (target <= 1.2: %s)\n' \
  "$compressed_s" "$compressor_s" "$(calc "$compressed_s / $compressor_s")" \
  "$(verdict "$compressed_s <= 1.2 * $compressor_s")"
printf 'peak memory      %6s KB  limit %s KB (largest payload %s bytes + 16 MB: %s)\n' \
  "$peak_kb" "$limit_kb" "$largest" "$(verdict "$peak_kb < $limit_kb")"
