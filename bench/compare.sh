#!/usr/bin/env bash
# compare.sh CORPUS_DIR: our compressor, as a process over files (qorcompress_file) and inside
# the link tool (qorLink with %comp: reading, compressing into memory, writing the archive),
# against gzip -1, lz4 -1 and zstd -1 on CORPUS_DIR/freedoom2.wad and CORPUS_DIR/utf16.txt
# (../shared/bench/make-corpus.sh builds them). One table from one run on this machine:
# MB/s of input (1 MB = 10^6 bytes) from the median wall-clock time of RUNS runs (default 5),
# and the compression ratio (input size / output size).
set -euo pipefail

corpus=$(cd "${1:?usage: bench/compare.sh CORPUS_DIR}" && pwd)
runs=${RUNS:-5}
root=$(cd "$(dirname "$0")/.." && pwd)
build=$root/build-bench
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Release -DQOR_BENCH=ON -DQOR_TESTS=OFF >/dev/null
cmake --build "$build" -j 2 --target qorLink qorcompress_file >/dev/null

# Median wall-clock seconds of RUNS runs of the command given as arguments.
median_time() {
  local times=() start end
  for ((i = 0; i < runs; i++)); do
    start=$(date +%s.%N)
    "$@"
    end=$(date +%s.%N)
    times+=("$(awk "BEGIN { print $end - $start }")")
  done
  printf '%s\n' "${times[@]}" | sort -g | awk '{ t[NR] = $1 } END { print t[int((NR + 1) / 2)] }'
}

qor_link() {  # input output
  printf '%%comp\n%s\n' "$1" >"$work/one.ls"
  "$build/qorLink" "$work/one.ls" -o "$2"  # writes $2.LB
}

printf '%-14s %-10s %10s %8s\n' file tool MB/s ratio
for name in freedoom2.wad utf16.txt; do
  input=$corpus/$name
  size=$(stat -c %s "$input")
  for tool in qorcompress qorLink gzip-1 lz4-1 zstd-1; do
    out=$work/out
    case $tool in
      qorcompress) cmd=("$build/bench/qorcompress_file" "$input" "$out") ;;
      qorLink) cmd=(qor_link "$input" "$out") ;;
      gzip-1) cmd=(sh -c 'gzip -1 -c "$0" >"$1"' "$input" "$out") ;;
      lz4-1) cmd=(sh -c 'lz4 -q -1 -c "$0" >"$1"' "$input" "$out") ;;
      zstd-1) cmd=(sh -c 'zstd -q -1 -c "$0" >"$1"' "$input" "$out") ;;
    esac
    t=$(median_time "${cmd[@]}")
    [ "$tool" = qorLink ] && out=$out.LB
    outsize=$(stat -c %s "$out")
    awk -v f="$name" -v tool="$tool" -v s="$size" -v t="$t" -v o="$outsize" \
      'BEGIN { printf "%-14s %-10s %10.1f %8.3f\n", f, tool, s / t / 1e6, s / o }'
  done
done
