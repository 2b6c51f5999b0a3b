#include "src/qorArchive.h"

#include <cctype>

namespace {
uint32_t Load32(const unsigned char* p) {
  return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24);
}
void Store32(unsigned char* p, uint32_t v) {
  p[0] = static_cast<unsigned char>(v);
  p[1] = static_cast<unsigned char>(v >> 8);
  p[2] = static_cast<unsigned char>(v >> 16);
  p[3] = static_cast<unsigned char>(v >> 24);
}
}  // namespace

void qorStdFileHeader_t::Load(const unsigned char aBytes[kQorHeaderSize]) {
  fileType = aBytes[kQorOffFileType];
  compression = aBytes[kQorOffCompression];
  userId = static_cast<uint16_t>(aBytes[kQorOffUserId] | (aBytes[kQorOffUserId + 1] << 8));
  fileSize = Load32(aBytes + kQorOffFileSize);
  magicCode = Load32(aBytes + kQorOffMagicCode);
  realSize = Load32(aBytes + kQorOffRealSize);
}

void qorStdFileHeader_t::Store(unsigned char aBytes[kQorHeaderSize]) const {
  aBytes[kQorOffFileType] = fileType;
  aBytes[kQorOffCompression] = compression;
  aBytes[kQorOffUserId] = static_cast<unsigned char>(userId);
  aBytes[kQorOffUserId + 1] = static_cast<unsigned char>(userId >> 8);
  Store32(aBytes + kQorOffFileSize, fileSize);
  Store32(aBytes + kQorOffMagicCode, magicCode);
  Store32(aBytes + kQorOffRealSize, realSize);
}

qorEndFileHeader_t::qorEndFileHeader_t() {
  fileType = kQorFileTypeEnd;
  compression = 0;
  userId = 0;
  fileSize = kQorHeaderSize;
  magicCode = kQorEndMagic;
  realSize = 0;
}

uint32_t QorMagicCodeOfExt(const PortString_t& aExt) {
  const int magic_length = 4;
  uint32_t magic = 0;
  for (int i = 0; i < magic_length && i + 1 < aExt.GetLength(); ++i) {
    uint32_t ch = static_cast<unsigned char>(toupper(static_cast<unsigned char>(aExt[i + 1])));
    magic |= ch << (8 * i);
  }
  return magic;
}

int QorMergeModeOfExt(const PortString_t& aExt) {
  static const struct {
    const char* ext;
    int mode;
  } kModes[] = {{".PB", kQorMergeArchive}, {".MB", kQorMergeOwnHeader}, {".TB", kQorMergeRaw},
                 {".AB", kQorMergeOwnHeader}, {".TMX", kQorMergeOwnHeader}};
  for (const auto& m : kModes) {
    if (CaseCompare(aExt, m.ext) == 0) return m.mode;
  }
  return kQorMergePlain;
}
