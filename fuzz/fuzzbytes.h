// FuzzBytes_t: takes a fuzz input apart into choices, numbers and byte strings, front to back.
// Past the end every read gives zeros or empty strings, so any input is a complete script.
#ifndef FUZZ_FUZZBYTES_H
#define FUZZ_FUZZBYTES_H

#include <cstddef>
#include <cstdint>
#include <string>

class FuzzBytes_t {
 public:
  FuzzBytes_t(const uint8_t* aData, size_t aSize) : data(aData), size(aSize), pos(0) {}

  size_t Left() const { return size - pos; }
  uint8_t Byte() { return pos < size ? data[pos++] : 0; }
  uint32_t Le32() {
    uint32_t value = 0;
    for (int i = 0; i < 4; ++i) value |= static_cast<uint32_t>(Byte()) << (8 * i);
    return value;
  }
  // A choice among aCount (1..256) possibilities.
  int Below(int aCount) { return Byte() % aCount; }
  std::string Take(size_t aCount) {
    if (aCount > Left()) aCount = Left();
    std::string bytes(reinterpret_cast<const char*>(data + pos), aCount);
    pos += aCount;
    return bytes;
  }
  // A string whose length comes first, as one byte times aUnit.
  std::string Sized(size_t aUnit) { return Take(Byte() * aUnit); }
  std::string Rest() { return Take(Left()); }

 private:
  const uint8_t* data;
  size_t size;
  size_t pos;
};

#endif
