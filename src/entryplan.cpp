#include "src/entryplan.h"

#include <cctype>
#include <cstring>

#include "port/src/filename.h"

namespace {


bool IsNameByte(unsigned char aCh) {
  return aCh >= 0x20 && aCh != 0x7F && aCh != ' ' && aCh != '/' && aCh != '\\' && aCh != '#' &&
         aCh != ';';
}

// qorLink writes a name block of the name's length plus one, rounded up to 16: the name, a
// zero byte and zero bytes up to the block's end.
bool NameBlockIsCanonical(const qorArchiveEntry_t& aEntry, const PortString_t& aName) {
  const int block = aEntry.header.NameBlockSize();
  if (block != (aName.GetLength() + 1 + 15) / 16 * 16 || block > kQorNameBlockMax) return false;
  for (int i = aName.GetLength(); i < block; ++i) {
    if (aEntry.nameBlock[i] != 0) return false;
  }
  return true;
}

// Whether qorLink, listing a file of this name, writes a plain entry with this magic code.
bool NameGivesMagic(const PortString_t& aName, uint32_t aMagicCode) {
  PortString_t ext = PortFilename_t(aName).GetExtName();
  return QorMergeModeOfExt(ext) == kQorMergePlain && QorMagicCodeOfExt(ext) == aMagicCode;
}

}  // namespace

bool IsSafeEntryName(const PortString_t& aName) {
  const int len = aName.GetLength();
  if (len == 0 || aName[0] == '%' || aName == "." || strstr(aName.c_str(), "..") != nullptr) {
    return false;
  }
  for (int i = 0; i < len; ++i) {
    if (!IsNameByte(static_cast<unsigned char>(aName[i]))) return false;
  }
  return true;
}

PortString_t DefaultEntryName(int aIndex, uint32_t aMagicCode) {
  PortString_t name = PortString_t::Format("%04d", aIndex);
  PortString_t ext;
  for (int i = 0; i < 4; ++i) {
    const unsigned char ch = static_cast<unsigned char>(aMagicCode >> (8 * i));
    if (ch == 0) break;
    ext += static_cast<char>(tolower(ch));
  }
  if (ext.GetLength() > 0) name += "." + ext;
  return name;
}

qorEntryPlan_t RawPlan(int aIndex) {
  return qorEntryPlan_t{false, false, false, PortString_t::Format("%04d.TB", aIndex)};
}

qorEntryPlan_t PlanEntry(const qorArchiveEntry_t& aEntry, bool aPaddingZero) {
  const qorStdFileHeader_t& h = aEntry.header;
  // qorLink gives a plain file fileType 1 and, stored, realSize 0; a body it compresses has
  // method 1. Anything else came from elsewhere and is kept as it is.
  const bool stored = aEntry.Method() == 0 && h.realSize == 0;
  if (h.fileType != kQorFileTypePlain || !aPaddingZero || !(stored || aEntry.Method() == 1)) {
    return RawPlan(aEntry.index);
  }
  qorEntryPlan_t plan{true, !stored, h.NameBlockSize() > 0, PortString_t()};
  if (plan.setFileName) {
    if (!aEntry.NameText(plan.name) || !NameBlockIsCanonical(aEntry, plan.name)) {
      return RawPlan(aEntry.index);
    }
  } else {
    plan.name = DefaultEntryName(aEntry.index, h.magicCode);
  }
  if (!IsSafeEntryName(plan.name) || !NameGivesMagic(plan.name, h.magicCode)) {
    return RawPlan(aEntry.index);
  }
  return plan;
}
