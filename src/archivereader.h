// qorArchiveReader_t: walks the entries of an archive file from offset 0. Every bound is
// checked before anything is read: a header only when 16 bytes remain, an entry only when its
// fileSize covers its header and name block and its bytes lie inside the file. A caller that
// reads within an entry the walk returned never reads outside the file.
#ifndef QOR_ARCHIVEREADER_H
#define QOR_ARCHIVEREADER_H

#include <vector>

#include "port/src/filestream.h"
#include "port/src/string.h"
#include "src/qorArchive.h"

// The largest name block the compression byte can announce (bits 4-7 = 15).
const int kQorNameBlockLimit = 0xF0;

struct qorArchiveEntry_t {
  int index;                // 0 for the first entry
  PortStreamUnit_t offset;  // of the header; a multiple of 64
  qorStdFileHeader_t header;
  unsigned char nameBlock[kQorNameBlockLimit];  // the first header.NameBlockSize() bytes

  PortStreamUnit_t BodyOffset() const { return offset + header.HeaderPartSize(); }
  PortStreamUnit_t BodySize() const {
    return static_cast<PortStreamUnit_t>(header.fileSize - header.HeaderPartSize());
  }
  int PadSize() const { return QorPadLength(header.fileSize); }
  int Method() const { return header.compression & kQorCompMask; }  // 0 stored, 1 compressed
  // The name block's text up to its first zero byte; false when the block has none.
  bool NameText(PortString_t& aName) const;
};

// A problem found in an archive. index is the entry's, or -1 for the end record and what
// follows it.
struct qorArchiveProblem_t {
  PortStreamUnit_t offset;
  int index;
  PortString_t text;
};

enum qorWalkState_t {
  kQorWalkEntries,    // Next() may return more entries
  kQorWalkEndRecord,  // stopped at the end record (see Problems() for its soundness)
  kQorWalkEndOfFile,  // the file ended after a complete entry, without end record
  kQorWalkBroken,     // stopped at a damaged structure, recorded in Problems()
};

class qorArchiveReader_t {
 public:
  // Opens the archive; a missing file raises "<name> could't open.".
  explicit qorArchiveReader_t(const PortString_t& aArchiveName);

  // Moves to the next entry and returns true, or returns false when the walk is over.
  // The last entry may come with a state already kQorWalkBroken: its padding is cut short.
  bool Next();
  void Rewind();  // back to before the first entry, problems cleared

  const qorArchiveEntry_t& Entry() const { return entry; }
  qorWalkState_t State() const { return state; }
  int EntryCount() const { return entryCount; }  // entries returned so far
  PortStreamUnit_t EndRecordOffset() const { return endRecordOffset; }  // -1 without one
  PortStreamUnit_t Length() const { return length; }
  const PortString_t& Name() const { return name; }
  // For reading inside the current entry; callers Seek first.
  PortFileStream_t& Stream() { return stream; }

  // Whether the current entry's padding bytes are all zero; records a problem when not.
  bool CheckPadding();

  // Problems in the order found: those of the walk itself (a damaged structure, a malformed
  // end record, bytes after it) and those callers add.
  const std::vector<qorArchiveProblem_t>& Problems() const { return problems; }
  void AddProblem(PortStreamUnit_t aOffset, int aIndex, const PortString_t& aText);
  // "<archive>: entry 3, offset 192: <text>" (or "<archive>: offset N: <text>").
  PortString_t Describe(const qorArchiveProblem_t& aProblem) const;
  // Throws Describe() of the first problem as a PortString_t, if there is one.
  void ThrowFirstProblem() const;

 private:
  void ReadAt(PortStreamUnit_t aOffset, void* aBuffer, int aLength);
  void CheckEndRecord(PortStreamUnit_t aOffset);
  void Broken(PortStreamUnit_t aOffset, const PortString_t& aText);

  PortString_t name;
  PortFileStream_t stream;
  PortStreamUnit_t length;
  PortStreamUnit_t nextOffset;
  PortStreamUnit_t endRecordOffset;
  int entryCount;
  qorWalkState_t state;
  qorArchiveEntry_t entry;
  std::vector<qorArchiveProblem_t> problems;
};

#endif
