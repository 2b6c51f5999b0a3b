// Archive records shared by the programs that write and read archives.
// An archive is a sequence of entries, each starting on a multiple of 64 bytes:
//   entry  := header(16) nameBlock(compression & 0xF0) body padding
//   body   := fileSize - 16 - nameBlock bytes, stored as is (compression & 0x0F == 0)
//             or compressed (== 1, expanding to realSize bytes)
//   padding:= zero bytes up to the next multiple of 64 (none when fileSize % 64 == 0)
// closed by the end record: FF 00 0000 10000000 "END0" 00000000, then 48 zero bytes.
// Every number is little-endian.
#ifndef QOR_ARCHIVE_H
#define QOR_ARCHIVE_H

#include <cstdint>

#include "port/src/string.h"

const int kQorHeaderSize = 16;
const int kQorEntryAlign = 64;
const int kQorNameBlockMax = 48;
const uint8_t kQorFileTypePlain = 0x01;
const uint8_t kQorFileTypeEnd = 0xFF;
const uint8_t kQorCompMask = 0x0F;       // compression bits 0-3: 0 stored, 1 compressed
const uint8_t kQorNameBlockMask = 0xF0;  // compression bits 4-7: name block length / 16
const uint32_t kQorEndMagic = 0x30444E45;  // "END0"

// Field offsets inside the 16 header bytes.
const int kQorOffFileType = 0;
const int kQorOffCompression = 1;
const int kQorOffUserId = 2;
const int kQorOffFileSize = 4;
const int kQorOffMagicCode = 8;
const int kQorOffRealSize = 12;

struct qorStdFileHeader_t {
  uint8_t fileType;
  uint8_t compression;
  uint16_t userId;
  uint32_t fileSize;   // 16 + name block + stored body, padding excluded
  uint32_t magicCode;  // four bytes in file order, read as a little-endian number
  uint32_t realSize;   // expanded body length when compressed

  void Load(const unsigned char aBytes[kQorHeaderSize]);
  void Store(unsigned char aBytes[kQorHeaderSize]) const;
  int NameBlockSize() const { return compression & kQorNameBlockMask; }
  int HeaderPartSize() const { return kQorHeaderSize + NameBlockSize(); }
};

// The end record has the entry header's layout.
struct qorEndFileHeader_t : qorStdFileHeader_t {
  qorEndFileHeader_t();
};

// Zero bytes that pad an entry of `fileSize` bytes to the next multiple of 64.
inline int QorPadLength(uint32_t fileSize) {
  return (kQorEntryAlign - static_cast<int>(fileSize % kQorEntryAlign)) % kQorEntryAlign;
}

// How a listed file goes into the archive, chosen from its extension.
enum qorMergeMode_t {
  kQorMergeOwnHeader = 0,  // starts with its own 16-byte header: kept, body stored or compressed
  kQorMergeArchive = 1,    // an archive: its entries copied unchanged up to its end record
  kQorMergeRaw = 2,        // copied byte for byte, no header
  kQorMergePlain = 3,      // plain data: a new header, body stored or compressed
};

// What qorLink derives from a listed file's extension (dot included, as
// PortFilename_t::GetExtName gives it; empty without one):
// the magic code of a plain file: the first four characters after the dot, upper-cased
// (toupper), in file order, the remaining bytes zero;
uint32_t QorMagicCodeOfExt(const PortString_t& aExt);
// the merge mode, compared ignoring case: ".PB" 1 (archive), ".MB" ".AB" ".TMX" 0 (own
// header), ".TB" 2 (raw copy), anything else 3 (plain file).
int QorMergeModeOfExt(const PortString_t& aExt);

#endif
