// PortStream_t: the abstract byte stream. Derived streams implement Write, Read, Seek,
// GetPosition and GetLength; the base builds whole-buffer transfers that raise on any short
// count, stream-to-stream copies, fills and text output on them. Every failure is thrown as
// the stream's description directly followed by an error-table text.
#ifndef PORT_STREAM_H
#define PORT_STREAM_H

#include "port/src/resource.h"
#include "port/src/string.h"

typedef PORT_s32_t PortStreamUnit_t;  // every length, position and count: streams stay below 2 GiB

class PortStream_t : public PortResource_t {
 public:
  PortStream_t() : flags(0) {}
  virtual ~PortStream_t() {}

  // Stores up to aLength bytes at the position and returns the count stored.
  virtual int Write(const void* aPtr, int aLength) = 0;
  // Copies up to aLength bytes from the position; a short count means the data ended.
  virtual int Read(void* aPtr, int aLength) = 0;
  // Origins as fseek: 0 start, 1 current, 2 end (file streams add aPos to the end, memory
  // streams count backwards from it).
  virtual void Seek(PortStreamUnit_t aPos, int aWherence) = 0;
  virtual PortStreamUnit_t GetPosition() = 0;
  virtual PortStreamUnit_t GetLength() = 0;
  virtual void SizeRequest(PortStreamUnit_t aSize);  // a hint; the base ignores it

  bool CanWrite() const { return (flags & 1) != 0; }
  bool CanRead() const { return (flags & 2) != 0; }

  [[noreturn]] void Error(int aErrorNum);  // throws GetDescription() + the table text
  void WriteBuffer(const void* aPtr, PortStreamUnit_t aLength);  // code 8 on a short write
  void ReadBuffer(void* aPtr, PortStreamUnit_t aLength);         // code 9 on a short read
  // Copies aLeng bytes from aSrc's position in pieces of at most 4096 bytes; nothing at all
  // (not even an access check) for aLeng <= 0.
  void CopyFrom(PortStream_t& aSrc, PortStreamUnit_t aLeng);
  void CopyFrom(PortStream_t& aSrc);  // the rest of aSrc
  void FillChar(PortStreamUnit_t aLength, char aCode);  // in pieces of 256 bytes

  PortStream_t& operator<<(const PORT_char_t* aStr);
  PortStream_t& operator<<(const unsigned char* aStr);
  PortStream_t& operator<<(const signed char* aStr);
  PortStream_t& operator<<(const PortString_t& aStr);
  PortStream_t& operator<<(int aIntValue);            // "%d"
  PortStream_t& operator<<(unsigned int aUintValue);  // "0x%X"
  PortStream_t& operator<<(double aFloatValue);       // "%f"

 protected:
  virtual const PortString_t& GetDescription() const;  // "<PortStream_t super-class>"
  void SetWritable() { flags |= 1; }
  void SetReadable() { flags |= 2; }
  void ResetWritable() { flags &= ~1u; }
  void ResetReadable() { flags &= ~2u; }
  void CheckWritable();  // code 10
  void CheckReadable();  // code 11

 private:
  PORT_u32_t flags;
};

#endif
