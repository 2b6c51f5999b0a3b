// TItemArray: a growable array of fixed-size items in one contiguous block from new[].
// Items are raw bytes: moved and copied with memmove/memcpy, never constructed or destroyed;
// a derived class fixes the size and may override Release to free what items own.
// Invariant: 0 <= FCount <= FCapacity, FBuffer null exactly when FCapacity is 0.
#ifndef VYX_ITMARRAY_H
#define VYX_ITMARRAY_H

#include <cstddef>
#include <cstdint>

class TItemArray {
 public:
  TItemArray() : FCapacity(0), FCount(0), FBuffer(nullptr) {}
  virtual ~TItemArray();
  TItemArray(const TItemArray&) = delete;
  TItemArray& operator=(const TItemArray&) = delete;

  // Byte-copies aSrc's items over this array's, giving it aSrc's count; only the items
  // beyond that count are released. Never reads past aSrc's block, whatever its item size.
  virtual void Assign(const TItemArray& aSrc);
  virtual size_t GetElementSize() const = 0;
  // Forgets the block without releasing it, for a caller that has taken the block over.
  virtual void ForceInitialize();

  int GetCount() const { return FCount; }
  int GetCapacity() const { return FCapacity; }

  // Releases every item, then frees the block.
  void Clear();
  // Returns 1 on success (a smaller non-zero capacity is a no-op success; 0 empties the
  // array) and 0, with the array unchanged, when no block of that size is obtained.
  // beClear zero-fills the slots the new block adds.
  int SetCapacity(int ANewCapa, int beClear);
  // Raises the capacity in whole grow steps, in one allocation, until it holds aCount items.
  // Returns SetCapacity's result; 0 also when that capacity does not fit in an int.
  int GrowFor(int64_t aCount);
  // Releases the items beyond ANewCount; a count above the capacity makes the capacity
  // exactly ANewCount. Throws std::bad_alloc when that block is not obtained.
  void SetCount(int ANewCount, int beClear);
  // One grow step of GetGrowCount() zero-filled slots; throws std::bad_alloc on failure.
  void Grow();
  // Index operations return 0 on success and 1, changing nothing, for a refused index.
  // Insert opens slot idx (0..count) by moving the items after it up; the caller fills it.
  int Insert(int idx);
  // Removes item idx without Release: what it owns passes to the caller.
  int PickOut(int idx);
  // Releases item idx, then removes it.
  int Delete(int idx);
  // Exchanges two distinct items.
  int Swap(int idxA, int idxB);
  // The removal step of PickOut and Delete; idx must be below the count.
  void PickOutJob(int idx);
  // Releases every item and keeps the block.
  void ResetCount();

 protected:
  virtual int GetGrowCount() const { return 32; }
  // Items [start, end) are about to be dropped and are still in place.
  virtual void Release(int start, int end);

  void* GetBuffer() const { return FBuffer; }
  void* GetItemPtr(int n) const {
    return FBuffer + static_cast<ptrdiff_t>(n) * static_cast<ptrdiff_t>(GetElementSize());
  }
  // Appends one item, growing by one step when full; its bytes are left as they are.
  void* NewEntry();

 private:
  int FCapacity;
  int FCount;

 protected:
  char* FBuffer;
};

// The typed array: items of T addressed without range test.
template <class T>
class TItemArrayTemplate : public TItemArray {
 public:
  ~TItemArrayTemplate() override {}

  T& operator[](int n) { return *static_cast<T*>(GetItemPtr(n)); }
  const T& operator[](int n) const { return *static_cast<const T*>(GetItemPtr(n)); }
  // Appends an item whose bytes are not initialised.
  T& Add() { return *static_cast<T*>(NewEntry()); }

  T Get(int n) const { return (*this)[n]; }
  void Set(int n, T aItem) { (*this)[n] = aItem; }
  // Index of the first item equal to aItem by operator==, or -1.
  int Search(T aItem) const {
    for (int i = 0; i < GetCount(); ++i) {
      if ((*this)[i] == aItem) return i;
    }
    return -1;
  }
  // Index of aItem, appended first when absent.
  int Regist(T aItem) {
    int idx = Search(aItem);
    if (idx >= 0) return idx;
    Add() = aItem;
    return GetCount() - 1;
  }

 protected:
  size_t GetElementSize() const override { return sizeof(T); }
};

#endif
