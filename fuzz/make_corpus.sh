#!/usr/bin/env bash
# Regenerates the seed corpora in fuzz/corpus/ with the tools themselves: archives linked by
# qorLink from the example data, payloads cut out of their compressed entries, and the
# example response file. Usage: fuzz/make_corpus.sh BUILD_DIR (a tree that built qorLink).
set -euo pipefail
here="$(cd "$(dirname "$0")" && pwd)"
link="$(cd "$1" && pwd)/qorLink"
corpus="$here/corpus"
work="$(mktemp -d)"
trap 'rm -rf "$work"' EXIT

le32() { od -An -tu4 -j "$2" -N4 "$1" | tr -d ' '; }
# The 4 bytes of a number, little-endian, as printf escapes.
le32_bytes() {
  printf '\\x%02x\\x%02x\\x%02x\\x%02x' \
    $(($1 & 255)) $(($1 >> 8 & 255)) $(($1 >> 16 & 255)) $(($1 >> 24 & 255))
}

cp -r "$here/../example/data" "$work/data"
cd "$work"
printf 'hello hello hello, said the archive.\n' > text.txt
head -c 3000 /dev/zero | tr '\0' 'A' > run.bin
printf 'H\0e\0l\0l\0o\0\0\0\0\0\0\0!\0' > words.bin
cat > all.ls <<'LIST'
; every kind of line
text.txt id=7
%setfilename
run.bin nocomp
words.bin
%nosetfilename
data/hero.MB
data/music.PB
data/font.TB
LIST
printf 'text.txt nocomp\n%%noendrecord\n' > bare.ls
printf 'run.bin\nwords.bin setfilename\n' > packed.ls
for list in all bare packed; do "$link" "$list.ls" -o "$list.LB"; done
cp "$here/../example/stage1.ls" stage1.ls

for target in expand_payload compress_input split_text link_inputs unpack_archive \
              read_serialized; do
  rm -rf "${corpus:?}/${target}_fuzzer"
  mkdir -p "$corpus/${target}_fuzzer"
done

cp all.LB bare.LB packed.LB "$corpus/unpack_archive_fuzzer/"

# Payloads: the first entry of packed.LB (run.bin) and both of all.LB's compressed ones.
payload() {  # archive offset name
  local size real comp
  size=$(le32 "$1" $(($2 + 4)))
  real=$(le32 "$1" $(($2 + 12)))
  comp=$(od -An -tu1 -j $(($2 + 1)) -N1 "$1" | tr -d ' ')
  { printf '\0'; printf "$(le32_bytes "$real")"
    dd if="$1" bs=1 skip=$(($2 + 16 + (comp & 240))) count=$((size - 16 - (comp & 240))) status=none
  } > "$corpus/expand_payload_fuzzer/$3"
}
payload packed.LB 0 run
payload all.LB 0 text
payload packed.LB $(( ($(le32 packed.LB 4) + 63) / 64 * 64 )) words

cp text.txt words.bin "$corpus/compress_input_fuzzer/"
{ printf '\xe5'; cat words.bin; } > "$corpus/compress_input_fuzzer/stretched"
{ printf '\x00\x02#;'; cat all.ls; } > "$corpus/split_text_fuzzer/all"
{ printf '\x08\x02;#'; cat stage1.ls; } > "$corpus/split_text_fuzzer/stage1"
cp all.ls stage1.ls "$corpus/link_inputs_fuzzer/"
head -c 512 all.LB > "$corpus/link_inputs_fuzzer/archive"

# Serializer scripts (op bytes, see the target) followed by the stream they read.
{ printf '\x04\x06\x07\x06\x05'; printf '\x01\0\0\0\x01\0\0\0\x01\0\0\0\x02\0\0\0hi'; } \
  > "$corpus/read_serialized_fuzzer/pointers"
{ printf '\x03\x0a\x19\x00'; printf '\x06\0\0\0\x03\0\0\0abcTAG1\x07\0\0\0'; } \
  > "$corpus/read_serialized_fuzzer/text"
