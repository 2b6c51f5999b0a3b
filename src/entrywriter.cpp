#include "src/entrywriter.h"

#include <cstdint>
#include <cstring>

#include "port/src/error.h"
#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"
#include "src/linkoptions.h"

namespace {

const uint8_t kBodyCompressed = 1;
const int kErrIllegalFilename = 14;
const int kErrInvalidFormat = 15;
const int kErrRead = 9;

void WriteHeader(PortStream_t& dst_strm, const qorStdFileHeader_t& header) {
  unsigned char bytes[kQorHeaderSize];
  header.Store(bytes);
  dst_strm.WriteBuffer(bytes, kQorHeaderSize);
}

void PadEntry(PortStream_t& dst_strm, uint32_t entry_size) {
  dst_strm.FillChar(QorPadLength(entry_size), 0);
}

// The entry's bytes after its first `skip` bytes. A fileSize that does not even cover the
// header and its own name block would make every later length a lie, so it is refused; an
// entry past the 2 GiB stream range cannot be held by the file, so it reads as a short file.
PortStreamUnit_t EntryRest(PortStream_t& src_strm, const qorStdFileHeader_t& header, int skip) {
  if (header.fileSize < static_cast<uint32_t>(header.HeaderPartSize())) {
    src_strm.Error(kErrInvalidFormat);
  }
  uint32_t rest = header.fileSize - static_cast<uint32_t>(skip);
  if (rest > static_cast<uint32_t>(INT32_MAX)) src_strm.Error(kErrRead);
  return static_cast<PortStreamUnit_t>(rest);
}

// Fills `block` with the base name and zero bytes; returns the block's length (16, 32 or 48).
int BuildNameBlock(const PortFilename_t& src_name, unsigned char block[kQorNameBlockMax]) {
  PortString_t base_name = src_name.GetBaseFileName();
  // A name ending in a separator has no base name; an empty block would read as a nameless
  // entry, so the name is refused as a file name instead.
  if (base_name.GetLength() == 0) {
    PortString_t& text = PortErrorGetStr();
    text = "'" + src_name.GetNakedStr() + "'" + PortErrorGetMsg(kErrIllegalFilename);
    PortErrorThrow(text);
  }
  // At least one zero byte follows the name, so readers find its end.
  int header_add_size = (base_name.GetLength() + 1 + kQorHeaderSize - 1) & ~(kQorHeaderSize - 1);
  if (header_add_size > kQorNameBlockMax) {
    PortString_t& text = PortErrorGetStr();
    text = base_name + "it too long.\n";
    PortErrorThrow(text);
  }
  memset(block, 0, header_add_size);
  memcpy(block, base_name.c_str(), base_name.GetLength());
  return header_add_size;
}

void WritePlainFile(PortStream_t& dst_strm, PortStream_t& src_strm, PortFilename_t& src_name,
                    PortStringToken_t& token, bool comp_default, bool fname_default) {
  qorStdFileHeader_t header = {};
  header.fileType = kQorFileTypePlain;
  header.fileSize = static_cast<uint32_t>(src_strm.GetLength()) + kQorHeaderSize;
  header.magicCode = QorMagicCodeOfExt(src_name.GetExtName());
  NormalWrite(dst_strm, src_strm, src_name, header, token, comp_default, fname_default);
}

void WriteOwnHeaderFile(PortStream_t& dst_strm, PortStream_t& src_strm,
                        PortFilename_t& src_name, PortStringToken_t& token, bool comp_default,
                        bool fname_default) {
  unsigned char bytes[kQorHeaderSize];
  src_strm.ReadBuffer(bytes, kQorHeaderSize);
  qorStdFileHeader_t header;
  header.Load(bytes);
  EntryRest(src_strm, header, header.HeaderPartSize());
  // The file's own name block is not body: the entry gets the name block this line asks for.
  unsigned char own_name_block[kQorNameBlockMask];
  src_strm.ReadBuffer(own_name_block, header.NameBlockSize());
  NormalWrite(dst_strm, src_strm, src_name, header, token, comp_default, fname_default);
}

// The input's entries are read back to back: padding between them is not skipped.
void CopyArchiveEntries(PortStream_t& dst_strm, PortStream_t& src_strm) {
  for (;;) {
    unsigned char bytes[kQorHeaderSize];
    src_strm.ReadBuffer(bytes, kQorHeaderSize);
    qorStdFileHeader_t header;
    header.Load(bytes);
    if (header.fileType == kQorFileTypeEnd) return;
    PortStreamUnit_t rest = EntryRest(src_strm, header, kQorHeaderSize);
    dst_strm.WriteBuffer(bytes, kQorHeaderSize);
    dst_strm.CopyFrom(src_strm, rest);
    PadEntry(dst_strm, header.fileSize);
  }
}

void CopyRaw(PortStream_t& dst_strm, PortStream_t& src_strm) {
  PortStreamUnit_t length = src_strm.GetLength();
  dst_strm.CopyFrom(src_strm, length);
  PadEntry(dst_strm, static_cast<uint32_t>(length));
}

}  // namespace

void WriteEntry(PortStream_t& dst_strm, PortStream_t& src_strm, PortFilename_t& src_name,
                int merge_mode, PortStringToken_t& token, bool comp_default, bool fname_default) {
  switch (merge_mode) {
    case kQorMergeOwnHeader:
      WriteOwnHeaderFile(dst_strm, src_strm, src_name, token, comp_default, fname_default);
      break;
    case kQorMergeArchive:
      CopyArchiveEntries(dst_strm, src_strm);
      break;
    case kQorMergeRaw:
      CopyRaw(dst_strm, src_strm);
      break;
    default:
      WritePlainFile(dst_strm, src_strm, src_name, token, comp_default, fname_default);
      break;
  }
}

void NormalWrite(PortStream_t& dst_strm, PortStream_t& src_strm, PortFilename_t& src_name,
                 qorStdFileHeader_t& header, PortStringToken_t& token, bool compDefault,
                 bool fnameDefault) {
  int id = header.userId;
  if (CheckOptUserId(token, id)) header.userId = static_cast<uint16_t>(id);

  unsigned char header_add_buff[kQorNameBlockMax];
  int header_add_size = 0;
  if (CheckOptSetFileName(token, fnameDefault)) {
    header_add_size = BuildNameBlock(src_name, header_add_buff);
  }

  PortStreamUnit_t org_body_size = EntryRest(src_strm, header, header.HeaderPartSize());
  uint8_t org_comp = header.compression & kQorCompMask;

  if (org_comp == 0 && CheckOptCompress(token, compDefault)) {
    header.compression = static_cast<uint8_t>(header_add_size | kBodyCompressed);
    header.realSize = static_cast<uint32_t>(org_body_size);
    // The payload's length goes into the header, which precedes it and is never rewritten,
    // so the whole payload is staged first.
    PortMemoryStream_t mem_strm;
    qorCompressor_t compressor;
    compressor.compress(mem_strm, src_strm, org_body_size);
    header.fileSize =
        header_add_size + static_cast<uint32_t>(mem_strm.GetLength()) + kQorHeaderSize;
    mem_strm.Seek(0, 0);
    WriteHeader(dst_strm, header);
    dst_strm.WriteBuffer(header_add_buff, header_add_size);
    dst_strm.CopyFrom(mem_strm);
  } else {
    header.compression = static_cast<uint8_t>(header_add_size | org_comp);
    header.fileSize = header_add_size + static_cast<uint32_t>(org_body_size) + kQorHeaderSize;
    WriteHeader(dst_strm, header);
    dst_strm.WriteBuffer(header_add_buff, header_add_size);
    dst_strm.CopyFrom(src_strm, org_body_size);
  }
  PadEntry(dst_strm, header.fileSize);
}

void WriteEndRecord(PortStream_t& dst_strm) {
  qorEndFileHeader_t end_record;
  WriteHeader(dst_strm, end_record);
  PadEntry(dst_strm, end_record.fileSize);
}
