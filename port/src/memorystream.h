// PortMemoryStream_t: a growable in-memory stream kept as a doubly linked list of chunks.
// Written bytes never move: an append fills the free room of the last chunk, then goes into
// exactly one new chunk sized for the rest of that write (at least 4096 bytes). The stream's
// bytes are the first `size` bytes of each chunk in list order; the free room of a chunk
// before the last is never used. chunkTopPos <= pos <= chunkTopPos + currentChunk->size.
#ifndef PORT_MEMORYSTREAM_H
#define PORT_MEMORYSTREAM_H

#include "port/src/stream.h"

struct PortMemoryStrmChunk_t {
  PortMemoryStrmChunk_t* prev;
  PortMemoryStrmChunk_t* next;
  PortStreamUnit_t allocSize;  // capacity of data, at least 4096
  PortStreamUnit_t size;       // bytes of stream data held, at the start of data
  unsigned char* data() { return reinterpret_cast<unsigned char*>(this + 1); }
};

class PortMemoryStream_t : public PortStream_t {
 public:
  PortMemoryStream_t();
  virtual ~PortMemoryStream_t();

  // Always stores all aLength bytes. Code 3 for a negative length or one that would take
  // the stream past 2^31 - 1 bytes, raised before anything changes.
  int Write(const void* aPtr, int aLength) override;
  int Read(void* aPtr, int aLength) override;         // negative length: code 3
  // Origin 2 counts backwards from the end. A target outside 0..length raises " illegal
  // parameter." (code 3, without description) and changes nothing.
  void Seek(PortStreamUnit_t aPos, int aWherence) override;
  PortStreamUnit_t GetPosition() override { return pos; }
  PortStreamUnit_t GetLength() override { return size; }
  void SizeRequest(PortStreamUnit_t aSize) override;  // links an empty chunk of that room

  void Free();                  // back to the state of a new stream
  void ConvertToSingleChunk();  // merges all chunks; the position becomes 0
  // The byte at the position inside one contiguous block (merging first, which moves the
  // position to 0); null without chunks or when the merge leaves none (length 0). Valid
  // until the stream grows, merges or frees.
  void* GetPtr();

 private:
  friend struct PortMemoryStreamInspector_t;  // test-only view of the chunk list
  PortMemoryStrmChunk_t* AllocChunk(PortStreamUnit_t aSize);
  void NewChunk(PortStreamUnit_t aSize);
  void PrevChunk();
  void NextChunk();
  void FreeAllChunk();

  PortMemoryStrmChunk_t* currentChunk;
  PortStreamUnit_t chunkTopPos;
  PortStreamUnit_t pos;
  PortStreamUnit_t size;
};

#endif
