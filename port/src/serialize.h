// Pointer-aware serialization: values, texts and pointer-linked structures written to a stream
// and read back in the same order. A pointer travels as an ID: 0 is null, the others are given
// as 1, 2, 3... in the order the writer first meets them; the reader maps each ID to the object
// it rebuilt, also for pointers read before their object. The stream has no header:
//
//   item       := raw | number | text | ptrref | ptrdef | tag      (machine byte order)
//   number     := 1, 2, 4 or 8 bytes; int, long and their unsigned forms are 4 bytes
//   text       := count:s32 char[count]                            (no NUL; count <= 0: no chars)
//   ptrref     := id:s32                                           (WritePtr / ReadPtr)
//   ptrdef     := id:s32                                           (WritePtrID / ReadRegistPtr)
//   tag        := fourcc:u32, absent when written with aOnVerbose while the verbose bit is clear
//
// Example: WritePtr(&b), WritePtrID(&a), WritePtrID(&b), Write("hi") on a fresh writer give
//   01 00 00 00  02 00 00 00  01 00 00 00  02 00 00 00 68 69
#ifndef PORT_SERIALIZE_H
#define PORT_SERIALIZE_H

#include "Vyx/src/ItmArray.h"
#include "port/src/stream.h"

typedef PORT_s32_t PortSerializePtrID_t;  // 0: the null pointer; -1: not registered
typedef PORT_u32_t PortFourcc_t;

// One registry entry; the entry at index n belongs to ID n.
struct PortSerializeRegPack_t {
  const void* ptr;  // null for ID 0 and for reader entries whose object is not registered yet
  void* userData;   // writer: the value 1 once defined; reader: head of the waiting chain
  PORT_s32_t hashNext;  // next ID in the same hash bucket, -1 at its end
};

// What both directions share: the registry with its 256-bucket hash index, the stream (not
// owned), a version number kept for the caller and a flag word whose bit 0 is the verbose bit.
class PortSerialize_t {
 public:
  static constexpr int kVerbose = 1;

  PortSerialize_t();
  virtual ~PortSerialize_t() {}
  PortSerialize_t(const PortSerialize_t&) = delete;
  PortSerialize_t& operator=(const PortSerialize_t&) = delete;

  void SetStream(PortStream_t* aStrm) { strm = aStrm; }
  PortStream_t* GetStream() const { return strm; }
  void SetVersion(int aVersion) { version = aVersion; }
  int GetVersion() const { return version; }
  void SetFlag(int aFlag) { flag = aFlag; }
  int GetFlag() const { return flag; }

  [[noreturn]] void Error(int aCause);
  // The ID under which aPtr is registered, or -1.
  PortSerializePtrID_t SearchPtrID(const void* aPtr) const;

 protected:
  PortSerializePtrID_t AddPtr(const void* aPtr);
  void SetPtr(int aId, const void* aPtr);
  const void* GetPtr(int aId) { return ptrList[aId].ptr; }
  void* GetUserData(int aId) { return ptrList[aId].userData; }
  void SetUserData(int aId, void* aData) { ptrList[aId].userData = aData; }
  // A tag given with aOnVerbose is written and read only while the verbose bit is set.
  bool TagActive(bool aOnVerbose) const { return !aOnVerbose || (flag & kVerbose) != 0; }
  PortStream_t& Stream();  // code 12 when no stream is set

 private:
  static int GetHashKey(const void* aPtr);

  PORT_s32_t version;
  PORT_s32_t flag;

 protected:
  TItemArrayTemplate<PortSerializeRegPack_t> ptrList;
  PORT_s32_t hashIdx[256];
  PortStream_t* strm;
};

// Writes items; every int result is 0 unless stated. A short write raises code 8 through
// the stream, a write with no stream code 12.
class PortSerializeWriter_t : public PortSerialize_t {
 public:
  PortSerializeWriter_t() : unresolveCount(0) {}

  int Write(const void* aBuffPtr, int aSize);
  int Write(unsigned char aData);
  int Write(signed char aData);
  int Write(unsigned short aData);
  int Write(short aData);
  int Write(int aData);
  int Write(unsigned int aData);
  int Write(unsigned long aData);  // 4 bytes: a value beyond 32 bits raises code 3
  int Write(long aData);           // 4 bytes: a value beyond 32 bits raises code 3
  int Write(float aData);
  int Write(double aData);
  int Write(const char* aStrBuff);  // a text; null writes the empty text

  // A reference to aPtr, which must be defined with WritePtrID somewhere in the same pass.
  int WritePtr(const void* aPtr);
  // Where the object's data goes: writes its ID and stores it in *aPtrID (when not null).
  // Returns 1 and writes nothing when aPtr has been defined before. The null pointer is
  // written as ID 0 every time and is never counted as defined or unresolved.
  int WritePtrID(const void* aPtr, PortSerializePtrID_t* aPtrID);
  void WriteFourcc(PortFourcc_t aId, bool aOnVerbose);
  // Ends a pass: raises code 2 when a pointer referred to was never defined.
  void Term();

  int GetUnresolveCount() const { return unresolveCount; }

 protected:
  PORT_s32_t unresolveCount;  // referred to with WritePtr, not yet defined
};

// Reads the items in the order they were written; every int result is 0. A stream that ends
// early raises code 9 through the stream, one whose IDs or tags are impossible code 15.
class PortSerializeReader_t : public PortSerialize_t {
 public:
  int Read(void* aBuffPtr, int aSize);
  int Read(unsigned char& aData);
  int Read(signed char& aData);
  int Read(unsigned short& aData);
  int Read(short& aData);
  int Read(int& aData);
  int Read(unsigned int& aData);
  int Read(unsigned long& aData);  // 4 bytes, zero-extended
  int Read(long& aData);           // 4 bytes, sign-extended
  int Read(float& aData);
  int Read(double& aData);
  // A text, cut to aBuffSize - 1 characters and a NUL; the rest of a longer text is skipped.
  // A text of count 0 or less leaves aStrBuff as it was.
  int Read(char* aStrBuff, int aBuffSize);

  // Reads a reference into the variable *aPtr that keeps the pointer. Until its object is
  // registered the variable holds a link of the waiting chain (null or another waiting
  // variable), so it must stay in place and be read only once.
  int ReadPtr(void** aPtr);
  template <class T>
  int ReadPtr(T** aPtr) { return ReadPtr(reinterpret_cast<void**>(aPtr)); }
  int ReadPtrID(PortSerializePtrID_t& aId);
  // Registers the object of an ID and stores its address in every variable waiting for it.
  // The first registration of an ID stands; ID 0 stays the null pointer. A negative ID, or
  // one that the stream is too short to have given out, raises code 15.
  void RegistPtr(PortSerializePtrID_t aId, const void* aPtr);
  void ReadRegistPtr(const void* aPtr);
  void CheckFourcc(PortFourcc_t aId, bool aOnVerbose);  // code 15 when the tag differs
  // Ends a pass: variables still waiting for an object are set to null, then code 15 is
  // raised if there were any, so no chain link is ever taken for an object.
  void Term();

 private:
  void ExtendTo(PortSerializePtrID_t aId);
  void Skip(int aCount);
};

#endif
