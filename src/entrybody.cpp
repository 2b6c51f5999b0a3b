#include "src/entrybody.h"

#include <cstdint>
#include <cstring>

#include "port/src/error.h"
#include "qorCompress/src/qorCompress.h"

namespace {

const int kErrIllegalParameter = 3;
const int kErrInvalidFormat = 15;

// Compares what is written to it with the next bytes of a stream of expected bytes, and
// remembers whether everything matched; it never asks for more than the expected length.
class qorCompareStream_t : public PortStream_t {
 public:
  qorCompareStream_t(PortStream_t& aExpected, PortStreamUnit_t aLength)
      : expected(aExpected), remain(aLength), written(0), same(true) {
    SetWritable();
  }
  int Write(const void* aPtr, int aLength) override {
    if (aLength < 0) Error(kErrIllegalParameter);
    if (same && aLength > remain) same = false;
    if (same) {
      unsigned char want[4096];
      const unsigned char* got = static_cast<const unsigned char*>(aPtr);
      for (int done = 0; same && done < aLength;) {
        const int piece = aLength - done < 4096 ? aLength - done : 4096;
        expected.ReadBuffer(want, piece);
        same = memcmp(want, got + done, piece) == 0;
        done += piece;
      }
      remain -= aLength;
    }
    written += aLength;
    return aLength;
  }
  int Read(void*, int) override { return 0; }
  void Seek(PortStreamUnit_t, int) override { Error(kErrIllegalParameter); }
  PortStreamUnit_t GetPosition() override { return written; }
  PortStreamUnit_t GetLength() override { return written; }
  bool Matched() const { return same && remain == 0; }

 private:
  PortStream_t& expected;
  PortStreamUnit_t remain;
  PortStreamUnit_t written;
  bool same;
};

}  // namespace

int qorDiscardStream_t::Write(const void*, int aLength) {
  if (aLength < 0) Error(kErrIllegalParameter);
  size += aLength;
  return aLength;
}

int qorDiscardStream_t::Read(void*, int) { return 0; }

void qorDiscardStream_t::Seek(PortStreamUnit_t aPos, int aWherence) {
  if (aPos != 0 || aWherence != 2) Error(kErrIllegalParameter);
}

bool ExpandEntryBody(qorArchiveReader_t& aReader, PortStream_t& aDst) {
  const qorArchiveEntry_t& entry = aReader.Entry();
  if (entry.header.realSize > static_cast<uint32_t>(INT32_MAX)) return false;
  aReader.Stream().Seek(entry.BodyOffset(), 0);
  qorExpander_t expander;
  try {
    expander.expand(aDst, aReader.Stream(), entry.BodySize(),
                    static_cast<int>(entry.header.realSize));
  } catch (const char* text) {
    // Only the decoder's verdict on the payload is an answer; anything else (a disk that
    // fails to read) is a failure of the run and goes on to the handler in main.
    if (strcmp(text, PortErrorGetMsg(kErrInvalidFormat).c_str()) != 0) throw;
    return false;
  }
  return true;
}

qorArchiveProblem_t BadBodyProblem(const qorArchiveEntry_t& aEntry) {
  return qorArchiveProblem_t{
      aEntry.BodyOffset(), aEntry.index,
      PortString_t::Format("the compressed body (%d bytes) does not expand to exactly realSize "
                           "%u bytes",
                           aEntry.BodySize(), aEntry.header.realSize)};
}

bool RecompressesToBody(qorArchiveReader_t& aReader, PortStream_t& aExpanded) {
  const qorArchiveEntry_t& entry = aReader.Entry();
  aReader.Stream().Seek(entry.BodyOffset(), 0);
  aExpanded.Seek(0, 0);
  qorCompareStream_t compare(aReader.Stream(), entry.BodySize());
  qorCompressor_t compressor;
  compressor.compress(compare, aExpanded, static_cast<int>(entry.header.realSize));
  return compare.Matched();
}
