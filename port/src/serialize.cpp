#include "port/src/serialize.h"

#include <cstdint>
#include <cstring>
#include <new>

#include "port/src/error.h"

namespace {

const int kHashBuckets = 256;
const int kNoId = -1;
// Error codes of the table raised here.
const int kProgramError = 2;
const int kIllegalParameter = 3;
const int kNoStream = 12;
const int kInvalidFormat = 15;
// Every ID item takes this many bytes, which bounds the IDs a stream can have given out.
const PortStreamUnit_t kIdBytes = 4;

void* const kDefined = reinterpret_cast<void*>(1);

}  // namespace

PortSerialize_t::PortSerialize_t() : version(0), flag(0), strm(nullptr) {
  for (int i = 0; i < kHashBuckets; ++i) hashIdx[i] = kNoId;
  PortSerializeRegPack_t& null_entry = ptrList.Add();
  null_entry.ptr = nullptr;
  null_entry.userData = nullptr;
  null_entry.hashNext = kNoId;
  // Linked by hand (SetPtr links no null pointer) so that searching null finds ID 0.
  hashIdx[GetHashKey(nullptr)] = 0;
}

void PortSerialize_t::Error(int aCause) { PortErrorThrow(aCause); }

PortStream_t& PortSerialize_t::Stream() {
  if (strm == nullptr) Error(kNoStream);
  return *strm;
}

int PortSerialize_t::GetHashKey(const void* aPtr) {
  // The low 32 bits of the address: bits 2-9 ORed with bits 10-17.
  uint32_t v = static_cast<uint32_t>(reinterpret_cast<uintptr_t>(aPtr));
  return static_cast<int>(((v >> 2) | (v >> 10)) & 0xFF);
}

PortSerializePtrID_t PortSerialize_t::SearchPtrID(const void* aPtr) const {
  for (PortSerializePtrID_t id = hashIdx[GetHashKey(aPtr)]; id != kNoId;
       id = ptrList[id].hashNext) {
    if (ptrList[id].ptr == aPtr) return id;
  }
  return kNoId;
}

void PortSerialize_t::SetPtr(int aId, const void* aPtr) {
  PortSerializeRegPack_t& entry = ptrList[aId];
  entry.ptr = aPtr;
  entry.userData = nullptr;
  entry.hashNext = kNoId;
  if (aPtr != nullptr) {
    int key = GetHashKey(aPtr);
    entry.hashNext = hashIdx[key];
    hashIdx[key] = aId;
  }
}

PortSerializePtrID_t PortSerialize_t::AddPtr(const void* aPtr) {
  PortSerializePtrID_t id = ptrList.GetCount();
  // Still whole steps of 32, but about half the size again each time: one step per 32
  // entries would copy the registry over and over, quadratic in the number of pointers
  // (and so in the length of a stream being read).
  if (id == ptrList.GetCapacity() && !ptrList.GrowFor(static_cast<int64_t>(id) + id / 2 + 1)) {
    throw std::bad_alloc();
  }
  ptrList.Add();
  SetPtr(id, aPtr);
  return id;
}

int PortSerializeWriter_t::Write(const void* aBuffPtr, int aSize) {
  Stream().WriteBuffer(aBuffPtr, aSize);
  return 0;
}

int PortSerializeWriter_t::Write(unsigned char aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(signed char aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(unsigned short aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(short aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(int aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(unsigned int aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(float aData) { return Write(&aData, sizeof aData); }
int PortSerializeWriter_t::Write(double aData) { return Write(&aData, sizeof aData); }

// long is 4 bytes in the stream layout, narrower than here; a value that would not come
// back is refused rather than cut.
int PortSerializeWriter_t::Write(unsigned long aData) {
  if (aData > UINT32_MAX) Error(kIllegalParameter);
  return Write(static_cast<uint32_t>(aData));
}

int PortSerializeWriter_t::Write(long aData) {
  if (aData < INT32_MIN || aData > INT32_MAX) Error(kIllegalParameter);
  return Write(static_cast<int32_t>(aData));
}

int PortSerializeWriter_t::Write(const char* aStrBuff) {
  int count = aStrBuff == nullptr ? 0 : static_cast<int>(strlen(aStrBuff));
  Write(count);
  if (count > 0) Write(static_cast<const void*>(aStrBuff), count);
  return 0;
}

int PortSerializeWriter_t::WritePtr(const void* aPtr) {
  PortSerializePtrID_t id = SearchPtrID(aPtr);
  if (id == kNoId) {
    id = AddPtr(aPtr);
    ++unresolveCount;
  }
  return Write(id);
}

int PortSerializeWriter_t::WritePtrID(const void* aPtr, PortSerializePtrID_t* aPtrID) {
  PortSerializePtrID_t id = 0;
  // The null pointer needs no definition: counting it would take unresolveCount below 0.
  if (aPtr != nullptr) {
    id = SearchPtrID(aPtr);
    if (id == kNoId) {
      id = AddPtr(aPtr);
    } else if (GetUserData(id) != nullptr) {
      return 1;
    } else {
      --unresolveCount;
    }
    SetUserData(id, kDefined);
  }
  if (aPtrID != nullptr) *aPtrID = id;
  return Write(id);
}

void PortSerializeWriter_t::WriteFourcc(PortFourcc_t aId, bool aOnVerbose) {
  if (TagActive(aOnVerbose)) Write(aId);
}

void PortSerializeWriter_t::Term() {
  if (unresolveCount != 0) Error(kProgramError);
}

int PortSerializeReader_t::Read(void* aBuffPtr, int aSize) {
  Stream().ReadBuffer(aBuffPtr, aSize);
  return 0;
}

int PortSerializeReader_t::Read(unsigned char& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(signed char& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(unsigned short& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(short& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(int& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(unsigned int& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(float& aData) { return Read(&aData, sizeof aData); }
int PortSerializeReader_t::Read(double& aData) { return Read(&aData, sizeof aData); }

int PortSerializeReader_t::Read(unsigned long& aData) {
  uint32_t v;
  Read(&v, sizeof v);
  aData = v;
  return 0;
}

int PortSerializeReader_t::Read(long& aData) {
  int32_t v;
  Read(&v, sizeof v);
  aData = v;
  return 0;
}

int PortSerializeReader_t::Read(char* aStrBuff, int aBuffSize) {
  int count;
  Read(count);
  if (count <= 0) return 0;
  int kept = 0;
  if (aBuffSize > 0) {
    kept = count < aBuffSize ? count : aBuffSize - 1;
    aStrBuff[kept] = 0;
    Read(static_cast<void*>(aStrBuff), kept);
  }
  // The items after the text must be read from where the text ends.
  Skip(count - kept);
  return 0;
}

void PortSerializeReader_t::Skip(int aCount) {
  const int kScratch = 256;
  char scratch[kScratch];
  while (aCount > 0) {
    int piece = aCount < kScratch ? aCount : kScratch;
    Read(static_cast<void*>(scratch), piece);
    aCount -= piece;
  }
}

int PortSerializeReader_t::ReadPtrID(PortSerializePtrID_t& aId) { return Read(aId); }

// A stream of n bytes holds at most n / 4 ID items, and a writer's first mention of an ID is
// one of them, so a larger ID cannot come from a writer. Refusing it keeps a few hostile
// bytes from demanding a registry of gigabytes; anything else is reached in one allocation.
void PortSerializeReader_t::ExtendTo(PortSerializePtrID_t aId) {
  if (aId < 0) Error(kInvalidFormat);
  int count = ptrList.GetCount();
  if (aId < count) return;
  if (aId > count) {
    if (strm != nullptr && aId > strm->GetLength() / kIdBytes) Error(kInvalidFormat);
    if (!ptrList.GrowFor(static_cast<int64_t>(aId) + 1)) throw std::bad_alloc();
  }
  while (ptrList.GetCount() <= aId) AddPtr(nullptr);
}

int PortSerializeReader_t::ReadPtr(void** aPtr) {
  PortSerializePtrID_t id;
  ReadPtrID(id);
  if (id == 0) {
    *aPtr = nullptr;
    return 0;
  }
  ExtendTo(id);
  if (GetPtr(id) != nullptr) {
    *aPtr = const_cast<void*>(GetPtr(id));
  } else {
    *aPtr = GetUserData(id);
    SetUserData(id, aPtr);
  }
  return 0;
}

void PortSerializeReader_t::RegistPtr(PortSerializePtrID_t aId, const void* aPtr) {
  ExtendTo(aId);
  // ID 0 stays the null pointer whatever a stream says.
  if (aId == 0 || GetPtr(aId) != nullptr) return;
  void** waiting = static_cast<void**>(GetUserData(aId));
  while (waiting != nullptr) {
    void** next = static_cast<void**>(*waiting);
    *waiting = const_cast<void*>(aPtr);
    waiting = next;
  }
  SetPtr(aId, aPtr);
}

void PortSerializeReader_t::ReadRegistPtr(const void* aPtr) {
  PortSerializePtrID_t id;
  ReadPtrID(id);
  RegistPtr(id, aPtr);
}

void PortSerializeReader_t::CheckFourcc(PortFourcc_t aId, bool aOnVerbose) {
  if (!TagActive(aOnVerbose)) return;
  PortFourcc_t tag;
  Read(tag);
  if (tag != aId) Error(kInvalidFormat);
}

void PortSerializeReader_t::Term() {
  bool unresolved = false;
  for (int id = 1; id < ptrList.GetCount(); ++id) {
    void** waiting = static_cast<void**>(GetUserData(id));
    while (waiting != nullptr) {
      void** next = static_cast<void**>(*waiting);
      *waiting = nullptr;
      waiting = next;
      unresolved = true;
    }
    SetUserData(id, nullptr);
  }
  if (unresolved) Error(kInvalidFormat);
}
