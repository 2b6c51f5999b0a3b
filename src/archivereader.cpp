#include "src/archivereader.h"

#include <cstring>

namespace {

// The end record is its header and this many zero bytes, 64 bytes in all.
const int kEndRecordZeros = kQorEntryAlign - kQorHeaderSize;

int FirstNonZero(const unsigned char* aBytes, int aLength) {
  for (int i = 0; i < aLength; ++i) {
    if (aBytes[i] != 0) return i;
  }
  return -1;
}

}  // namespace

bool qorArchiveEntry_t::NameText(PortString_t& aName) const {
  const void* end = memchr(nameBlock, 0, header.NameBlockSize());
  if (end == nullptr) return false;
  aName = PortString_t(reinterpret_cast<const char*>(nameBlock),
                       static_cast<int>(static_cast<const unsigned char*>(end) - nameBlock));
  return true;
}

qorArchiveReader_t::qorArchiveReader_t(const PortString_t& aArchiveName) : name(aArchiveName) {
  stream.ReadOpen(aArchiveName);
  length = stream.GetLength();
  Rewind();
}

void qorArchiveReader_t::Rewind() {
  nextOffset = 0;
  endRecordOffset = -1;
  entryCount = 0;
  state = kQorWalkEntries;
  problems.clear();
}

void qorArchiveReader_t::ReadAt(PortStreamUnit_t aOffset, void* aBuffer, int aLength) {
  stream.Seek(aOffset, 0);
  stream.ReadBuffer(aBuffer, aLength);
}

void qorArchiveReader_t::Broken(PortStreamUnit_t aOffset, const PortString_t& aText) {
  AddProblem(aOffset, entryCount, aText);
  state = kQorWalkBroken;
}

bool qorArchiveReader_t::Next() {
  if (state != kQorWalkEntries) return false;
  // 64-bit sums: a fileSize near 4 GiB must not wrap around to a small offset.
  const int64_t offset = nextOffset;
  const int64_t remain = static_cast<int64_t>(length) - offset;
  if (remain == 0) {
    state = kQorWalkEndOfFile;
    return false;
  }
  if (remain < kQorHeaderSize) {
    Broken(nextOffset,
           PortString_t::Format("the archive ends inside a header (%d of 16 bytes present)",
                                static_cast<int>(remain)));
    return false;
  }
  unsigned char bytes[kQorHeaderSize];
  ReadAt(nextOffset, bytes, kQorHeaderSize);
  entry.header.Load(bytes);
  if (entry.header.fileType == kQorFileTypeEnd) {
    CheckEndRecord(nextOffset);
    return false;
  }
  const qorStdFileHeader_t& h = entry.header;
  if (h.fileSize < static_cast<uint32_t>(h.HeaderPartSize())) {
    Broken(nextOffset, PortString_t::Format(
                           "fileSize %u is smaller than the header and name block (%d bytes)",
                           h.fileSize, h.HeaderPartSize()));
    return false;
  }
  if (h.fileSize > remain) {
    Broken(nextOffset,
           PortString_t::Format("fileSize %u runs past the end of the archive (%lld bytes left)",
                                h.fileSize, static_cast<long long>(remain)));
    return false;
  }
  entry.index = entryCount;
  entry.offset = nextOffset;
  if (h.NameBlockSize() > 0) {
    ReadAt(entry.offset + kQorHeaderSize, entry.nameBlock, h.NameBlockSize());
  }
  const int64_t padded = static_cast<int64_t>(h.fileSize) + entry.PadSize();
  if (padded > remain) {
    // The entry itself is whole and can still be checked; only the walk ends here.
    Broken(static_cast<PortStreamUnit_t>(offset + h.fileSize),
           PortString_t::Format("the archive ends inside the padding (%lld of %d bytes present)",
                                static_cast<long long>(remain - h.fileSize), entry.PadSize()));
  }
  nextOffset = static_cast<PortStreamUnit_t>(offset + padded);
  ++entryCount;
  return true;
}

void qorArchiveReader_t::CheckEndRecord(PortStreamUnit_t aOffset) {
  state = kQorWalkEndRecord;
  endRecordOffset = aOffset;
  const qorStdFileHeader_t& h = entry.header;
  const qorEndFileHeader_t want;
  PortString_t fields;
  if (h.compression != want.compression) fields += PortString_t::Format(", compression %u", h.compression);
  if (h.userId != want.userId) fields += PortString_t::Format(", userId %u", h.userId);
  if (h.fileSize != want.fileSize) fields += PortString_t::Format(", fileSize %u", h.fileSize);
  if (h.magicCode != want.magicCode) fields += PortString_t::Format(", magicCode 0x%08X", h.magicCode);
  if (h.realSize != want.realSize) fields += PortString_t::Format(", realSize %u", h.realSize);
  if (fields.GetLength() > 0) {
    AddProblem(aOffset, -1, "malformed end record: " + fields.Substr(2, fields.GetLength() - 2));
  }
  const int64_t after_header = static_cast<int64_t>(length) - aOffset - kQorHeaderSize;
  const int present = after_header < kEndRecordZeros ? static_cast<int>(after_header) : kEndRecordZeros;
  unsigned char zeros[kEndRecordZeros];
  ReadAt(aOffset + kQorHeaderSize, zeros, present);
  const int bad = FirstNonZero(zeros, present);
  if (bad >= 0) {
    AddProblem(aOffset + kQorHeaderSize + bad, -1,
               "non-zero byte in the 48 zero bytes of the end record");
  }
  if (present < kEndRecordZeros) {
    AddProblem(aOffset + kQorHeaderSize + present, -1,
               PortString_t::Format("the archive ends inside the end record (%d of 48 zero bytes present)",
                                    present));
  } else if (after_header > kEndRecordZeros) {
    AddProblem(aOffset + kQorEntryAlign, -1,
               PortString_t::Format("%lld bytes follow the end record",
                                    static_cast<long long>(after_header - kEndRecordZeros)));
  }
}

bool qorArchiveReader_t::CheckPadding() {
  const int64_t start = static_cast<int64_t>(entry.offset) + entry.header.fileSize;
  const int64_t end = start + entry.PadSize();
  const int present = static_cast<int>((end > length ? length : end) - start);
  unsigned char pad[kQorEntryAlign];
  ReadAt(static_cast<PortStreamUnit_t>(start), pad, present);
  const int bad = FirstNonZero(pad, present);
  if (bad < 0) return true;
  AddProblem(static_cast<PortStreamUnit_t>(start + bad), entry.index, "non-zero byte in the padding");
  return false;
}

void qorArchiveReader_t::AddProblem(PortStreamUnit_t aOffset, int aIndex, const PortString_t& aText) {
  problems.push_back(qorArchiveProblem_t{aOffset, aIndex, aText});
}

PortString_t qorArchiveReader_t::Describe(const qorArchiveProblem_t& aProblem) const {
  if (aProblem.index < 0) {
    return PortString_t::Format("%s: offset %d: %s", name.c_str(), aProblem.offset,
                                aProblem.text.c_str());
  }
  return PortString_t::Format("%s: entry %d, offset %d: %s", name.c_str(), aProblem.index,
                              aProblem.offset, aProblem.text.c_str());
}

void qorArchiveReader_t::ThrowFirstProblem() const {
  if (!problems.empty()) throw Describe(problems.front());
}
