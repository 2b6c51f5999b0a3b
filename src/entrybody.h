// Reading an entry's body for checking and extraction: expanding a compressed body, and
// proving that qorLink's compressor would write the very same payload again. Both read only
// inside the entry that the archive walk returned.
#ifndef QOR_ENTRYBODY_H
#define QOR_ENTRYBODY_H

#include "port/src/stream.h"
#include "src/archivereader.h"

// A write-only stream that keeps nothing and counts what it is given.
class qorDiscardStream_t : public PortStream_t {
 public:
  qorDiscardStream_t() : size(0) { SetWritable(); }
  int Write(const void* aPtr, int aLength) override;
  int Read(void* aPtr, int aLength) override;  // nothing to read: 0
  void Seek(PortStreamUnit_t aPos, int aWherence) override;  // only to the end
  PortStreamUnit_t GetPosition() override { return size; }
  PortStreamUnit_t GetLength() override { return size; }

 private:
  PortStreamUnit_t size;
};

// Expands the current entry's compressed body into aDst (realSize bytes). False, with
// nothing more written, when the payload is malformed or realSize does not fit a stream;
// a failure to read the archive itself is raised.
bool ExpandEntryBody(qorArchiveReader_t& aReader, PortStream_t& aDst);

// The problem a body that ExpandEntryBody refused is reported as.
qorArchiveProblem_t BadBodyProblem(const qorArchiveEntry_t& aEntry);

// Whether compressing the aExpanded bytes (realSize of them, from its start) gives exactly
// the current entry's payload.
bool RecompressesToBody(qorArchiveReader_t& aReader, PortStream_t& aExpanded);

#endif
