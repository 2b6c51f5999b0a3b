#!/usr/bin/env bash
# Links the example project with the qorLink built in BUILD_DIR into BUILD_DIR/demo/stage1.LB,
# then prints where each entry starts and what its 16-byte header says.
set -euo pipefail

if [ $# -ne 1 ] || [ ! -x "$1/qorLink" ] || [ ! -x "$1/qorUnpack" ]; then
  echo "usage: example/demo.sh BUILD_DIR   (BUILD_DIR holds the built qorLink and qorUnpack; see 'make build')" >&2
  exit 2
fi
build=$(cd "$1" && pwd)
example=$(cd "$(dirname "$0")" && pwd)
archive=$build/demo/stage1.LB
mkdir -p "$build/demo"

# Listed names are relative to the directory qorLink runs in.
(cd "$example" && "$build/qorLink" stage1 -o "$archive")

bytes() { tail -c +$(($1 + 1)) "$archive" | head -c "$2"; }
size=$(wc -c < "$archive")
echo "linked example/stage1.ls -> ${archive#"$PWD"/} ($size bytes)"
echo
printf '%-8s %-47s  %-4s %-4s %6s %8s %-5s %8s %s\n' offset "header bytes" type comp userId \
  fileSize magic realSize name
offset=0
while [ "$offset" -lt "$size" ]; do
  # shellcheck disable=SC2046
  set -- $(bytes "$offset" 16 | od -An -v -tu1)
  hex=$(bytes "$offset" 16 | od -An -v -tx1 | tr -s ' \n' ' ')
  file_size=$(($5 + 256 * $6 + 65536 * $7 + 16777216 * $8))
  real_size=$((${13} + 256 * ${14} + 65536 * ${15} + 16777216 * ${16}))
  magic=$(bytes $((offset + 8)) 4 | tr -d '\0')
  name_block=$(($2 & 0xF0))
  name=""
  [ "$name_block" -gt 0 ] && name=$(bytes $((offset + 16)) "$name_block" | tr -d '\0')
  printf '0x%06X %-47s  0x%02X 0x%02X %6d %8d %-5s %8d %s\n' "$offset" "${hex# }" "$1" "$2" \
    $(($3 + 256 * $4)) "$file_size" "$magic" "$real_size" "$name"
  [ "$1" -eq 255 ] && break
  if [ "$file_size" -lt 16 ]; then echo "(no entry header here: stopping)"; break; fi
  offset=$((offset + (file_size + 63) / 64 * 64))
done

echo
"$build/qorUnpack" list "$archive"
echo
"$build/qorUnpack" test "$archive"
# The response file that extract writes rebuilds the archive byte for byte.
rm -rf "$build/demo/extracted"
"$build/qorUnpack" extract "$archive" -C "$build/demo/extracted"
(cd "$build/demo/extracted" && "$build/qorLink" stage1.ls -o stage1.LB)
cmp "$archive" "$build/demo/extracted/stage1.LB" && echo "extracted to ${build#"$PWD"/}/demo/extracted and relinked: identical"
