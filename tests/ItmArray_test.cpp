#include "Vyx/src/ItmArray.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <new>
#include <utility>
#include <vector>

namespace {

typedef std::vector<std::pair<int, int>> Ranges;
typedef std::vector<int32_t> Ints;

// Records every Release range into a log that outlives the array.
class RecordingArray : public TItemArrayTemplate<int32_t> {
 public:
  explicit RecordingArray(Ranges* aLog) : log(aLog) {}
  // Empties itself here: the base destructor only reaches the base Release.
  ~RecordingArray() override { Clear(); }
  using TItemArray::GetBuffer;

 protected:
  void Release(int start, int end) override { log->emplace_back(start, end); }

 private:
  Ranges* log;
};

Ints Items(RecordingArray& a) {
  Ints out;
  for (int i = 0; i < a.GetCount(); ++i) out.push_back(a[i]);
  return out;
}

void Fill(RecordingArray& a, int n) {
  for (int i = 0; i < n; ++i) a.Add() = 10 + i;
}

}  // namespace

TEST(ItemArray, GrowsLinearlyByThirtyTwoZeroFilledSlots) {
  Ranges log;
  RecordingArray a(&log);
  a.Add() = 7;
  EXPECT_EQ(a.GetCapacity(), 32);
  for (int i = 1; i < 32; ++i) a.Add() = i;
  EXPECT_EQ(a.GetCapacity(), 32);
  int32_t& fresh = a.Add();  // the 33rd: one more step of zeroed slots, not a doubling
  EXPECT_EQ(a.GetCapacity(), 64);
  EXPECT_EQ(a.GetCount(), 33);
  EXPECT_EQ(fresh, 0);
  EXPECT_EQ(a[0], 7);
  EXPECT_TRUE(log.empty());
}

TEST(ItemArray, SetCapacityNeverShrinksEmptiesAtZeroAndReportsImpossibleBlocks) {
  Ranges log;
  RecordingArray a(&log);
  Fill(a, 3);
  EXPECT_EQ(a.SetCapacity(10, 1), 1);  // below 32: a successful no-op
  EXPECT_EQ(a.GetCapacity(), 32);
  EXPECT_EQ(a.SetCapacity(40, 1), 1);
  EXPECT_EQ(a.GetCapacity(), 40);
  EXPECT_EQ(Items(a), (Ints{10, 11, 12}));
  EXPECT_TRUE(log.empty());
  EXPECT_EQ(a.SetCapacity(0, 0), 1);
  EXPECT_EQ(a.GetCapacity(), 0);
  EXPECT_EQ(a.GetCount(), 0);
  EXPECT_EQ(a.GetBuffer(), nullptr);
  EXPECT_EQ(log, (Ranges{{0, 3}}));

  // A block that cannot exist is reported, not allocated short: 4 items of 2^63 bytes
  // would wrap to a request for 0 bytes.
  struct Huge : TItemArray {
    size_t GetElementSize() const override { return SIZE_MAX / 2 + 1; }
  } huge;
  EXPECT_EQ(huge.SetCapacity(4, 1), 0);
  EXPECT_EQ(huge.GetCapacity(), 0);
  EXPECT_THROW(huge.SetCount(4, 1), std::bad_alloc);
  EXPECT_EQ(huge.GetCount(), 0);
}

TEST(ItemArray, SetCountSizesExactlyAndClearsOnlyNewBlocks) {
  Ranges log;
  RecordingArray a(&log);
  a.SetCount(5, 1);
  EXPECT_EQ(a.GetCapacity(), 5);
  EXPECT_EQ(Items(a), (Ints(5, 0)));
  for (int i = 0; i < 5; ++i) a[i] = 100 + i;
  a.SetCount(2, 1);
  EXPECT_EQ(log, (Ranges{{2, 5}}));
  EXPECT_EQ(a.GetCapacity(), 5);
  a.SetCount(4, 1);  // no new block: the dropped items' bytes come back
  EXPECT_EQ(Items(a), (Ints{100, 101, 102, 103}));
  a.SetCount(7, 1);  // a new block of exactly 7: its added slots are zeroed
  EXPECT_EQ(a.GetCapacity(), 7);
  EXPECT_EQ(Items(a), (Ints{100, 101, 102, 103, 0, 0, 0}));
  log.clear();
  a.ResetCount();
  EXPECT_EQ(log, (Ranges{{0, 7}}));
  EXPECT_EQ(a.GetCount(), 0);
  EXPECT_EQ(a.GetCapacity(), 7);
}

TEST(ItemArray, RefusedIndexOperationsChangeNothing) {
  struct Case {
    const char* name;
    int (*op)(RecordingArray&);
  } cases[] = {
      {"Insert(-1)", [](RecordingArray& a) { return a.Insert(-1); }},
      {"Insert(count + 1)", [](RecordingArray& a) { return a.Insert(5); }},
      {"PickOut(-1)", [](RecordingArray& a) { return a.PickOut(-1); }},
      {"PickOut(count)", [](RecordingArray& a) { return a.PickOut(4); }},
      {"Delete(-1)", [](RecordingArray& a) { return a.Delete(-1); }},
      {"Delete(count)", [](RecordingArray& a) { return a.Delete(4); }},
      {"Swap(3, 3)", [](RecordingArray& a) { return a.Swap(3, 3); }},
      {"Swap(-1, 0)", [](RecordingArray& a) { return a.Swap(-1, 0); }},
      {"Swap(0, count)", [](RecordingArray& a) { return a.Swap(0, 4); }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    Ranges log;
    RecordingArray a(&log);
    Fill(a, 4);
    EXPECT_EQ(c.op(a), 1);
    EXPECT_EQ(Items(a), (Ints{10, 11, 12, 13}));
    EXPECT_TRUE(log.empty());
  }
}

TEST(ItemArray, IndexOperationsMoveItemsAndReleaseOnlyOnDelete) {
  Ranges log;
  RecordingArray a(&log);
  Fill(a, 4);
  EXPECT_EQ(a.Insert(1), 0);  // the opened slot still holds the item moved out of it
  EXPECT_EQ(Items(a), (Ints{10, 11, 11, 12, 13}));
  a[1] = 99;
  EXPECT_EQ(a.Insert(5), 0);  // at the count: appends
  a[5] = 50;
  EXPECT_EQ(Items(a), (Ints{10, 99, 11, 12, 13, 50}));
  EXPECT_EQ(a.Swap(0, 5), 0);
  EXPECT_EQ(Items(a), (Ints{50, 99, 11, 12, 13, 10}));
  EXPECT_EQ(a.PickOut(1), 0);
  EXPECT_TRUE(log.empty());
  EXPECT_EQ(a.Delete(3), 0);
  EXPECT_EQ(log, (Ranges{{3, 4}}));
  EXPECT_EQ(Items(a), (Ints{50, 11, 12, 10}));
  // Regist appends only an absent item and returns its index.
  EXPECT_EQ(a.Regist(12), 2);
  EXPECT_EQ(a.Regist(77), 4);
  EXPECT_EQ(a.Search(4), -1);
}

TEST(ItemArray, AssignCopiesBytesAndReleasesOnlyTheSurplus) {
  Ranges log, srcLog;
  RecordingArray a(&log), src(&srcLog);
  Fill(a, 5);
  src.Add() = 7;
  src.Add() = 8;
  a.Assign(src);
  EXPECT_EQ(Items(a), (Ints{7, 8}));
  EXPECT_EQ(log, (Ranges{{2, 5}}));

  // Items of 8 bytes from an array of 4-byte items: only the source's bytes are read.
  TItemArrayTemplate<int64_t> wide;
  wide.Assign(src);
  ASSERT_EQ(wide.GetCount(), 2);
  EXPECT_EQ(wide[0], int64_t{7} | (int64_t{8} << 32));
}

TEST(ItemArray, ReleasesOnDestructionButNotAfterForceInitialize) {
  Ranges log;
  {
    RecordingArray a(&log);
    Fill(a, 3);
  }
  EXPECT_EQ(log, (Ranges{{0, 3}}));

  log.clear();
  char* taken;
  {
    RecordingArray a(&log);
    Fill(a, 3);
    taken = static_cast<char*>(a.GetBuffer());
    a.ForceInitialize();
    EXPECT_EQ(a.GetCount(), 0);
    EXPECT_EQ(a.GetCapacity(), 0);
  }
  EXPECT_TRUE(log.empty());
  EXPECT_EQ(reinterpret_cast<int32_t*>(taken)[2], 12);  // still alive: the caller owns it
  delete[] taken;
}
