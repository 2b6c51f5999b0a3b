#include "Vyx/src/ItmArray.h"

#include <climits>
#include <cstring>
#include <new>

namespace {

size_t Bytes(int aCount, size_t aElementSize) {
  return static_cast<size_t>(aCount) * aElementSize;
}

}  // namespace

// The Release reached from here is always the base one: the derived part is already gone.
TItemArray::~TItemArray() { Clear(); }

void TItemArray::Release(int, int) {}

void TItemArray::Assign(const TItemArray& aSrc) {
  if (&aSrc == this) return;
  SetCount(aSrc.FCount, 1);
  // The copy uses this array's item size; bounding it by aSrc's block keeps an array of
  // smaller items from being read past its end.
  size_t want = Bytes(FCount, GetElementSize());
  size_t have = Bytes(aSrc.FCount, aSrc.GetElementSize());
  size_t len = want < have ? want : have;
  if (len > 0) memcpy(FBuffer, aSrc.FBuffer, len);
}

void TItemArray::ForceInitialize() {
  FCapacity = 0;
  FCount = 0;
  FBuffer = nullptr;
}

void TItemArray::Clear() {
  if (FCount > 0) Release(0, FCount);
  delete[] FBuffer;
  FBuffer = nullptr;
  FCount = 0;
  FCapacity = 0;
}

int TItemArray::SetCapacity(int ANewCapa, int beClear) {
  if (ANewCapa == FCapacity) return 1;
  if (ANewCapa == 0) {
    Clear();
    return 1;
  }
  if (ANewCapa < FCapacity) return 1;

  size_t elem = GetElementSize();
  if (elem != 0 && static_cast<size_t>(ANewCapa) > SIZE_MAX / elem) return 0;
  // nothrow, so that a failure leaves the array untouched and is reported as 0.
  char* block = new (std::nothrow) char[Bytes(ANewCapa, elem)];
  if (block == nullptr) return 0;
  if (FBuffer == nullptr) {
    if (beClear) memset(block, 0, Bytes(ANewCapa, elem));
  } else {
    memcpy(block, FBuffer, Bytes(FCount, elem));
    delete[] FBuffer;
    if (beClear) memset(block + Bytes(FCount, elem), 0, Bytes(ANewCapa - FCount, elem));
  }
  FBuffer = block;
  FCapacity = ANewCapa;
  return 1;
}

int TItemArray::GrowFor(int64_t aCount) {
  if (aCount <= FCapacity) return 1;
  int64_t step = GetGrowCount() > 0 ? GetGrowCount() : 1;
  int64_t steps = (aCount - FCapacity + step - 1) / step;
  int64_t capa = FCapacity + steps * step;
  if (capa > INT_MAX) return 0;
  return SetCapacity(static_cast<int>(capa), 1);
}

void TItemArray::SetCount(int ANewCount, int beClear) {
  if (ANewCount < FCount) Release(ANewCount, FCount);
  if (ANewCount > FCapacity && !SetCapacity(ANewCount, beClear)) throw std::bad_alloc();
  FCount = ANewCount;
}

void TItemArray::Grow() {
  // A grow count below 1 would leave a full array full and NewEntry writing past it.
  if (!GrowFor(static_cast<int64_t>(FCapacity) + 1)) throw std::bad_alloc();
}

void* TItemArray::NewEntry() {
  if (FCount == FCapacity) Grow();
  void* entry = GetItemPtr(FCount);
  ++FCount;
  return entry;
}

int TItemArray::Insert(int idx) {
  if (idx < 0 || idx > FCount) return 1;
  int tail = FCount - idx;
  NewEntry();
  memmove(GetItemPtr(idx + 1), GetItemPtr(idx), Bytes(tail, GetElementSize()));
  return 0;
}

void TItemArray::PickOutJob(int idx) {
  --FCount;
  memmove(GetItemPtr(idx), GetItemPtr(idx + 1), Bytes(FCount - idx, GetElementSize()));
}

int TItemArray::PickOut(int idx) {
  if (idx < 0 || idx >= FCount) return 1;
  PickOutJob(idx);
  return 0;
}

int TItemArray::Delete(int idx) {
  if (idx < 0 || idx >= FCount) return 1;
  Release(idx, idx + 1);
  PickOutJob(idx);
  return 0;
}

int TItemArray::Swap(int idxA, int idxB) {
  if (idxA == idxB || idxA < 0 || idxB < 0 || idxA >= FCount || idxB >= FCount) return 1;
  size_t elem = GetElementSize();
  char* tmp = new char[elem];
  memcpy(tmp, GetItemPtr(idxA), elem);
  memcpy(GetItemPtr(idxA), GetItemPtr(idxB), elem);
  memcpy(GetItemPtr(idxB), tmp, elem);
  delete[] tmp;
  return 0;
}

void TItemArray::ResetCount() { SetCount(0, 0); }
