#include "src/unpacklist.h"

#include <cinttypes>
#include <cstdio>

#include "src/archivereader.h"

namespace {

const char* MethodName(int aMethod) {
  switch (aMethod) {
    case 0: return "stored";
    case 1: return "compressed";
    default: return "unknown";
  }
}

// The magic code's four bytes in file order, trailing zero bytes left out.
PortString_t MagicText(uint32_t aMagicCode) {
  unsigned char bytes[4];
  int used = 0;
  for (int i = 0; i < 4; ++i) {
    bytes[i] = static_cast<unsigned char>(aMagicCode >> (8 * i));
    if (bytes[i] != 0) used = i + 1;
  }
  return used == 0 ? PortString_t("\\x00") : EscapedText(bytes, used);
}

PortString_t NameColumn(const qorArchiveEntry_t& aEntry) {
  if (aEntry.header.NameBlockSize() == 0) return "-";
  PortString_t name;
  if (!aEntry.NameText(name)) {
    return EscapedText(aEntry.nameBlock, aEntry.header.NameBlockSize()) + " (unterminated)";
  }
  return EscapedText(reinterpret_cast<const unsigned char*>(name.c_str()), name.GetLength());
}

}  // namespace

PortString_t EscapedText(const unsigned char* aBytes, int aLength) {
  PortString_t text;
  for (int i = 0; i < aLength; ++i) {
    const unsigned char ch = aBytes[i];
    if (ch == '\\') {
      text += "\\\\";
    } else if (ch >= 0x20 && ch < 0x7F) {
      text += static_cast<char>(ch);
    } else {
      text += PortString_t::Format("\\x%02X", ch);
    }
  }
  return text;
}

void UnpackList(const PortString_t& aArchive, FILE* aOut) {
  qorArchiveReader_t reader(aArchive);
  fprintf(aOut, "%10s %4s %-10s %6s %10s %10s %-16s %s\n", "offset", "type", "method", "userId",
         "fileSize", "realSize", "magic", "name");
  uint64_t stored = 0;
  uint64_t expanded = 0;
  while (reader.Next()) {
    const qorArchiveEntry_t& e = reader.Entry();
    const qorStdFileHeader_t& h = e.header;
    fprintf(aOut, "%10d %4.2X %-10s %6u %10u %10u %-16s %s\n", e.offset, h.fileType,
           MethodName(e.Method()), h.userId, h.fileSize, h.realSize, MagicText(h.magicCode).c_str(),
           NameColumn(e).c_str());
    stored += static_cast<uint64_t>(e.BodySize());
    expanded += e.Method() == 1 ? h.realSize : static_cast<uint64_t>(e.BodySize());
  }
  reader.ThrowFirstProblem();
  PortString_t end = reader.EndRecordOffset() >= 0
                         ? PortString_t::Format("end record at offset %d", reader.EndRecordOffset())
                         : PortString_t("no end record");
  fprintf(aOut, "%d entries, %" PRIu64 " bytes stored, %" PRIu64 " bytes expanded, %s\n",
         reader.EntryCount(), stored, expanded, end.c_str());
}
