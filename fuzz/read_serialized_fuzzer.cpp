// Property: any sequence of serializer reads over any stream raises only " read error." or
// " invalid file format.", and after Term() every pointer read is null or a registered object.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>

#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/memorystream.h"
#include "port/src/serialize.h"

namespace {

const int kSlots = 64;
const int kCanary = 8;
const char kCanaryByte = '\x5A';

bool Expected(const char* aText) {
  const size_t n = strlen(aText);
  auto ends = [&](const char* aTail) {
    const size_t t = strlen(aTail);
    return n >= t && strcmp(aText + n - t, aTail) == 0;
  };
  return ends(" read error.") || ends(" invalid file format.");
}

// Reads a text into a buffer of aSize bytes followed by canary bytes, which must survive; the
// buffer itself must be left as it was or hold a NUL.
void ReadText(PortSerializeReader_t& aReader, int aSize) {
  char buffer[16 + kCanary];
  memset(buffer, kCanaryByte, sizeof buffer);
  aReader.Read(buffer, aSize);
  for (int i = aSize; i < aSize + kCanary; ++i) {
    FuzzRequire(buffer[i] == kCanaryByte, "text read wrote past its buffer");
  }
  bool untouched = true;
  for (int i = 0; i < aSize; ++i) untouched = untouched && buffer[i] == kCanaryByte;
  FuzzRequire(untouched || memchr(buffer, '\0', aSize) != nullptr, "text read left no NUL");
}

// One step of the script; `aOp`'s high bits are its argument.
void Step(PortSerializeReader_t& aReader, uint8_t aOp, void* aSlots[kSlots], int& aSlotsUsed,
          int aObjects[kSlots], int& aObjectsUsed) {
  const int arg = aOp >> 4;
  switch (aOp % 12) {
    case 0: { int v; aReader.Read(v); break; }
    case 1: { unsigned char v; aReader.Read(v); break; }
    case 2: { short v; aReader.Read(v); break; }
    case 3: { double v; aReader.Read(v); break; }
    case 4: { long v; aReader.Read(v); break; }
    case 5: ReadText(aReader, 1 + arg); break;
    case 6:
      // A pointer variable is read once and stays in place: a waiting chain runs through it.
      if (aSlotsUsed < kSlots) aReader.ReadPtr(&aSlots[aSlotsUsed++]);
      break;
    case 7:
      if (aObjectsUsed < kSlots) aReader.ReadRegistPtr(&aObjects[aObjectsUsed++]);
      break;
    case 8:
      if (aObjectsUsed < kSlots) {
        PortSerializePtrID_t id;
        aReader.ReadPtrID(id);
        aReader.RegistPtr(id, &aObjects[aObjectsUsed++]);
      }
      break;
    case 9:
      aReader.SetFlag(arg & 1);
      aReader.CheckFourcc(0x31474154, (arg & 2) != 0);
      break;
    case 10: { PortString_t text; text.Read(aReader); break; }
    default: {
      char raw[16];
      aReader.Read(raw, arg);
      break;
    }
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  FuzzBytes_t bytes(aData, aSize);
  const std::string script = bytes.Sized(1);
  const std::string content = bytes.Rest();
  PortMemoryStream_t stream;
  stream.WriteBuffer(content.data(), static_cast<int>(content.size()));
  stream.Seek(0, 0);

  void* slots[kSlots] = {};
  int objects[kSlots] = {};
  int slots_used = 0;
  int objects_used = 0;
  PortSerializeReader_t reader;
  reader.SetStream(&stream);
  reader.SetFlag(0);
  try {
    for (char op : script) {
      Step(reader, static_cast<uint8_t>(op), slots, slots_used, objects, objects_used);
    }
  } catch (const char* text) {
    FuzzRequire(Expected(text), "unexpected failure text");
  }
  try {
    reader.Term();
  } catch (const char* text) {
    FuzzRequire(Expected(text), "unexpected failure text from Term");
  }
  for (int i = 0; i < slots_used; ++i) {
    const bool object = slots[i] >= static_cast<void*>(objects) &&
                        slots[i] < static_cast<void*>(objects + objects_used);
    FuzzRequire(slots[i] == nullptr || object, "a pointer holds neither null nor an object");
  }
  return 0;
}
