// Property: given any payload, payload length and realSize, the decoder writes exactly what a
// plain byte-at-a-time decoder gives, or raises " invalid file format." where that one refuses.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"
#include "tests/support/referenceexpander.h"

namespace {

bool EndsWith(const std::string& aText, const char* aTail) {
  const size_t tail = strlen(aTail);
  return aText.size() >= tail && aText.compare(aText.size() - tail, tail, aTail) == 0;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  FuzzBytes_t bytes(aData, aSize);
  // 0: the stream holds the payload alone; 1: bytes follow it, which must stay unread;
  // 2: the stream ends one byte before the payload length given.
  const int layout = bytes.Below(3);
  const int real_size = static_cast<int>(bytes.Le32());
  const std::string payload = bytes.Rest();
  const int payload_length = static_cast<int>(payload.size()) + (layout == 2 ? 1 : 0);

  PortMemoryStream_t source;
  source.WriteBuffer(payload.data(), static_cast<int>(payload.size()));
  if (layout == 1) source.WriteBuffer("\xFF\x01\x02", 3);
  source.Seek(0, 0);
  PortMemoryStream_t output;
  std::string raised;
  try {
    qorExpander_t().expand(output, source, payload_length, real_size);
  } catch (const char* text) {
    raised = text;
  }

  std::string expected;
  if (layout == 2) {
    // Nothing says how far a decoder reads before it meets the end of the stream.
    FuzzRequire(raised.empty() ? false : EndsWith(raised, " read error.") ||
                                             raised == " invalid file format.",
                "a short stream must fail");
    return 0;
  }
  if (!ReferenceExpand(payload, real_size, expected)) {
    FuzzRequire(raised == " invalid file format.", "a malformed payload must be refused");
    return 0;
  }
  FuzzRequire(raised.empty(), "a sound payload was refused");
  FuzzRequire(source.GetPosition() == payload_length, "the decoder read past its payload");
  std::string written(static_cast<size_t>(output.GetLength()), '\0');
  output.Seek(0, 0);
  output.ReadBuffer(&written[0], output.GetLength());
  FuzzRequire(written == expected, "expanded bytes differ from the plain decoder's");
  return 0;
}
