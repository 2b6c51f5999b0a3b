// PortString_t in a serialized stream: a 4-byte length, then a text record (a 4-byte count
// and the characters up to the first NUL).
#include <memory>

#include "port/src/serialize.h"
#include "port/src/string.h"

namespace {

const int kInvalidFormat = 15;

}  // namespace

void PortString_t::Write(PortSerializeWriter_t& aWriter) {
  aWriter.Write(static_cast<int>(GetLength()));
  aWriter.Write(GetCharPtr());
}

void PortString_t::Read(PortSerializeReader_t& aReader) {
  Clear();
  int length;
  aReader.Read(length);
  // The length field decides an allocation, so it must be one the stream could back up.
  PortStream_t* strm = aReader.GetStream();
  if (length < 0 || length > strm->GetLength() - strm->GetPosition()) {
    aReader.Error(kInvalidFormat);
  }
  // Zeroed: a text record shorter than the length (a string holding a NUL) leaves no
  // undefined bytes in the string.
  std::unique_ptr<char[]> buffer(new char[static_cast<size_t>(length) + 1]());
  aReader.Read(buffer.get(), length + 1);
  NewString(buffer.get(), length);
}
