#include "port/src/memorystream.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <new>

#include "port/src/error.h"

namespace {
// Smallest chunk capacity: keeps runs of small writes from allocating often.
const PortStreamUnit_t kMinChunkSize = 4096;

void ReleaseChunk(PortMemoryStrmChunk_t* aChunk) {
  aChunk->~PortMemoryStrmChunk_t();
  delete[] reinterpret_cast<unsigned char*>(aChunk);
}
}  // namespace

PortMemoryStream_t::PortMemoryStream_t()
    : currentChunk(nullptr), chunkTopPos(0), pos(0), size(0) {
  SetWritable();
  SetReadable();
}

PortMemoryStream_t::~PortMemoryStream_t() { Free(); }

PortMemoryStrmChunk_t* PortMemoryStream_t::AllocChunk(PortStreamUnit_t aSize) {
  const PortStreamUnit_t capacity = std::max(aSize, kMinChunkSize);
  // Record and data area are one allocation; the data follows the record.
  unsigned char* raw = new unsigned char[sizeof(PortMemoryStrmChunk_t) + capacity];
  PortMemoryStrmChunk_t* chunk = new (raw) PortMemoryStrmChunk_t;
  chunk->prev = nullptr;
  chunk->next = nullptr;
  chunk->allocSize = capacity;
  chunk->size = 0;
  return chunk;
}

void PortMemoryStream_t::NewChunk(PortStreamUnit_t aSize) {
  PortMemoryStrmChunk_t* chunk = AllocChunk(aSize);
  if (currentChunk != nullptr) {
    // Called only at the end of the stream: chunks after the current one hold no bytes.
    for (PortMemoryStrmChunk_t* rest = currentChunk->next; rest != nullptr;) {
      PortMemoryStrmChunk_t* following = rest->next;
      ReleaseChunk(rest);
      rest = following;
    }
    chunk->prev = currentChunk;
    currentChunk->next = chunk;
    chunkTopPos += currentChunk->size;
    pos = chunkTopPos;
  }
  currentChunk = chunk;
}

void PortMemoryStream_t::PrevChunk() {
  if (currentChunk == nullptr || currentChunk->prev == nullptr) PortErrorThrow(2);
  currentChunk = currentChunk->prev;
  chunkTopPos -= currentChunk->size;
  pos = chunkTopPos;
}

void PortMemoryStream_t::NextChunk() {
  if (currentChunk == nullptr || currentChunk->next == nullptr) PortErrorThrow(2);
  chunkTopPos += currentChunk->size;
  pos = chunkTopPos;
  currentChunk = currentChunk->next;
}

void PortMemoryStream_t::FreeAllChunk() {
  if (currentChunk == nullptr) return;
  PortMemoryStrmChunk_t* chunk = currentChunk;
  while (chunk->prev != nullptr) chunk = chunk->prev;
  while (chunk != nullptr) {
    PortMemoryStrmChunk_t* following = chunk->next;
    ReleaseChunk(chunk);
    chunk = following;
  }
  currentChunk = nullptr;
}

void PortMemoryStream_t::Free() {
  FreeAllChunk();
  chunkTopPos = 0;
  pos = 0;
  size = 0;
}

int PortMemoryStream_t::Write(const void* aPtr, int aLength) {
  if (aLength == 0) return 0;
  if (aLength < 0) Error(3);
  // The length must stay within the signed 32-bit unit; refuse before anything changes.
  if (static_cast<int64_t>(pos) + aLength > INT32_MAX) Error(3);
  const unsigned char* src = static_cast<const unsigned char*>(aPtr);
  PortStreamUnit_t remain = aLength;

  while (pos < size) {
    const PortStreamUnit_t offset = pos - chunkTopPos;
    const PortStreamUnit_t room = currentChunk->size - offset;
    if (room == 0) {
      NextChunk();
      continue;
    }
    const PortStreamUnit_t n = std::min(remain, room);
    std::memcpy(currentChunk->data() + offset, src, n);
    src += n;
    remain -= n;
    pos += n;
    if (remain == 0) return aLength;
  }

  if (size > 0) {
    const PortStreamUnit_t room = currentChunk->allocSize - currentChunk->size;
    if (room > 0) {
      const PortStreamUnit_t n = std::min(remain, room);
      std::memcpy(currentChunk->data() + currentChunk->size, src, n);
      src += n;
      remain -= n;
      currentChunk->size += n;
      size += n;
      pos += n;
      if (remain == 0) return aLength;
    }
  }

  NewChunk(remain);
  std::memcpy(currentChunk->data(), src, remain);
  currentChunk->size = remain;
  size += remain;
  pos += remain;
  return aLength;
}

int PortMemoryStream_t::Read(void* aPtr, int aLength) {
  if (aLength == 0) return 0;
  if (aLength < 0) Error(3);
  unsigned char* dst = static_cast<unsigned char*>(aPtr);
  int count = 0;
  while (count < aLength && pos < size) {
    const PortStreamUnit_t offset = pos - chunkTopPos;
    const PortStreamUnit_t available = currentChunk->size - offset;
    if (available == 0) {
      NextChunk();
      continue;
    }
    const PortStreamUnit_t n = std::min(aLength - count, available);
    std::memcpy(dst + count, currentChunk->data() + offset, n);
    pos += n;
    count += n;
  }
  return count;
}

void PortMemoryStream_t::Seek(PortStreamUnit_t aPos, int aWherence) {
  // 64-bit arithmetic: an offset near the 32-bit limits must be refused, not wrap around.
  int64_t target;
  switch (aWherence) {
    case 0: target = aPos; break;
    case 1: target = static_cast<int64_t>(GetPosition()) + aPos; break;
    case 2: target = static_cast<int64_t>(GetLength()) - aPos; break;
    default: return;
  }
  if (target < 0 || target > GetLength()) PortErrorThrow(3);
  if (GetLength() == 0) return;
  while (target < chunkTopPos) PrevChunk();
  while (target > chunkTopPos + currentChunk->size) NextChunk();
  pos = static_cast<PortStreamUnit_t>(target);
}

void PortMemoryStream_t::SizeRequest(PortStreamUnit_t aSize) {
  if (aSize - GetLength() <= 0) return;
  const PortStreamUnit_t here = GetPosition();
  Seek(0, 2);
  NewChunk(aSize);
  Seek(here, 0);
}

void PortMemoryStream_t::ConvertToSingleChunk() {
  if (currentChunk == nullptr) return;
  const PortStreamUnit_t length = GetLength();
  if (length == 0) {
    Free();
    return;
  }
  Seek(0, 0);
  if (currentChunk->next == nullptr) return;
  PortMemoryStrmChunk_t* merged = AllocChunk(length);
  PortStreamUnit_t filled = 0;
  for (PortMemoryStrmChunk_t* chunk = currentChunk; chunk != nullptr; chunk = chunk->next) {
    std::memcpy(merged->data() + filled, chunk->data(), chunk->size);
    filled += chunk->size;
  }
  Free();
  currentChunk = merged;
  currentChunk->size = length;
  size = length;
}

void* PortMemoryStream_t::GetPtr() {
  if (currentChunk == nullptr) return nullptr;
  if (currentChunk->prev != nullptr || currentChunk->next != nullptr) {
    ConvertToSingleChunk();
    // A stream of length 0 holding only reserved chunks is emptied by the merge.
    if (currentChunk == nullptr) return nullptr;
  }
  return currentChunk->data() + (pos - chunkTopPos);
}
