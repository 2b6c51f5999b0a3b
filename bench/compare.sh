#!/usr/bin/env bash
# compare.sh CORPUS_DIR: our compressor, as a process over files (qorcompress_file) and inside
# the link tool (qorLink with %comp: reading, compressing into memory, writing the archive),
# against gzip -1, lz4 -1 and zstd -1 on CORPUS_DIR/freedoom2.wad and CORPUS_DIR/utf16.txt
# (../shared/bench/make-corpus.sh builds them). One table from one run on this machine: MB/s
# of input (1 MB = 10^6 bytes) from the median wall-clock time and from the median CPU time
# of RUNS runs (default 5), and the compression ratio (input size / output size). BUILD names
# the build tree to use (default build-bench).
set -euo pipefail

corpus=$(cd "${1:?usage: bench/compare.sh CORPUS_DIR}" && pwd)
runs=${RUNS:-5}
root=$(cd "$(dirname "$0")/.." && pwd)
build=${BUILD:-$root/build-bench}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Release -DQOR_BENCH=ON -DQOR_TESTS=OFF >/dev/null
cmake --build "$build" -j 2 --target qorLink qorcompress_file >/dev/null

# Median wall-clock seconds and median CPU seconds (user + system) per call, over RUNS runs
# of REPS calls each of the command after REPS. The CPU figure holds up better when other
# work shares the cores; the repetitions lift small files above the timer's resolution.
median_times() {
  local reps=$1 walls=() cpus=() line
  shift
  for ((i = 0; i < runs; i++)); do
    /usr/bin/time -o "$work/time" -f '%e %U %S' \
      sh -c 'n=$1; shift; while [ "$n" -gt 0 ]; do "$@" || exit 1; n=$((n - 1)); done' sh "$reps" "$@"
    line=$(tail -1 "$work/time" | awk -v r="$reps" '{ print $1 / r, $2 / r, $3 / r }')
    walls+=("$(echo "$line" | awk '{ print $1 }')")
    cpus+=("$(echo "$line" | awk '{ print $2 + $3 }')")
  done
  printf '%s %s\n' \
    "$(printf '%s\n' "${walls[@]}" | sort -g | awk '{ t[NR] = $1 } END { print t[int((NR + 1) / 2)] }')" \
    "$(printf '%s\n' "${cpus[@]}" | sort -g | awk '{ t[NR] = $1 } END { print t[int((NR + 1) / 2)] }')"
}

printf '%-14s %-12s %10s %10s %8s\n' file tool 'MB/s wall' 'MB/s cpu' ratio
for name in freedoom2.wad utf16.txt; do
  input=$corpus/$name
  size=$(stat -c %s "$input")
  for tool in qorcompress qorLink gzip-1 lz4-1 zstd-1; do
    out=$work/out
    case $tool in
      qorcompress) cmd=("$build/bench/qorcompress_file" "$input" "$out") ;;
      qorLink) printf '%%comp\n%s\n' "$input" >"$work/one.ls"
        cmd=("$build/qorLink" "$work/one.ls" -o "$out") ;;  # writes $out.LB
      gzip-1) cmd=(sh -c 'gzip -1 -c "$0" >"$1"' "$input" "$out") ;;
      lz4-1) cmd=(sh -c 'lz4 -q -1 -c "$0" >"$1"' "$input" "$out") ;;
      zstd-1) cmd=(sh -c 'zstd -q -1 -c "$0" >"$1"' "$input" "$out") ;;
    esac
    reps=$(( (20000000 + size - 1) / size ))
    read -r wall cpu < <(median_times "$reps" "${cmd[@]}")
    [ "$tool" = qorLink ] && out=$out.LB
    outsize=$(stat -c %s "$out")
    awk -v f="$name" -v tool="$tool" -v s="$size" -v w="$wall" -v c="$cpu" -v o="$outsize" \
      'BEGIN { printf "%-14s %-12s %10.1f %10.1f %8.3f\n", f, tool, s / w / 1e6, s / (c > 0 ? c : 0.005) / 1e6, s / o }'
  done
done
