#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "port/src/memorystream.h"
#include "tests/support/raisedtext.h"

// Test-only view of the chunk list.
struct PortMemoryStreamInspector_t {
  typedef std::pair<int, int> Chunk;  // capacity, bytes held

  static const PortMemoryStrmChunk_t* First(const PortMemoryStream_t& aStream) {
    const PortMemoryStrmChunk_t* chunk = aStream.currentChunk;
    while (chunk != nullptr && chunk->prev != nullptr) chunk = chunk->prev;
    return chunk;
  }
  static std::vector<Chunk> Layout(const PortMemoryStream_t& aStream) {
    std::vector<Chunk> layout;
    for (const PortMemoryStrmChunk_t* c = First(aStream); c != nullptr; c = c->next) {
      layout.emplace_back(c->allocSize, c->size);
    }
    return layout;
  }
  // Every invariant of the list, checked from the outside.
  static void ExpectConsistent(const PortMemoryStream_t& aStream) {
    if (aStream.currentChunk == nullptr) {
      EXPECT_EQ(aStream.size, 0);
      EXPECT_EQ(aStream.pos, 0);
      EXPECT_EQ(aStream.chunkTopPos, 0);
      return;
    }
    int total = 0;
    int top = -1;
    for (const PortMemoryStrmChunk_t* c = First(aStream); c != nullptr; c = c->next) {
      if (c->next != nullptr) {
        EXPECT_EQ(c->next->prev, c);
      }
      EXPECT_GE(c->allocSize, 4096);
      EXPECT_GE(c->size, 0);
      EXPECT_LE(c->size, c->allocSize);
      if (c == aStream.currentChunk) top = total;
      total += c->size;
    }
    EXPECT_EQ(total, aStream.size);
    EXPECT_EQ(top, aStream.chunkTopPos);
    EXPECT_LE(aStream.chunkTopPos, aStream.pos);
    EXPECT_LE(aStream.pos, aStream.chunkTopPos + aStream.currentChunk->size);
  }
  static void PrevChunk(PortMemoryStream_t& aStream) { aStream.PrevChunk(); }
  static void NextChunk(PortMemoryStream_t& aStream) { aStream.NextChunk(); }
};

namespace {

using Inspect = PortMemoryStreamInspector_t;
using Layout = std::vector<Inspect::Chunk>;

std::string Pattern(int aLength, int aSeed = 0) {
  std::string text;
  for (int i = 0; i < aLength; ++i) text += static_cast<char>('a' + (i + aSeed) % 26);
  return text;
}

std::string ReadAll(PortMemoryStream_t& aStream) {
  aStream.Seek(0, 0);
  std::string text(aStream.GetLength(), '\0');
  if (!text.empty()) aStream.ReadBuffer(&text[0], aStream.GetLength());
  return text;
}

void Append(PortMemoryStream_t& aStream, std::string& aModel, int aLength) {
  const std::string text = Pattern(aLength, static_cast<int>(aModel.size()));
  aStream.WriteBuffer(text.data(), aLength);
  aModel += text;
}

TEST(MemoryStream, NewFreedAndReservedOnlyStreamsHoldNothing) {
  PortMemoryStream_t stream;
  char byte;
  EXPECT_EQ(stream.Read(&byte, 1), 0);
  EXPECT_EQ(stream.GetPtr(), nullptr);

  std::string model;
  Append(stream, model, 9000);
  Append(stream, model, 9000);
  stream.Free();
  EXPECT_EQ(stream.GetLength(), 0);
  EXPECT_EQ(stream.GetPosition(), 0);
  EXPECT_TRUE(Inspect::Layout(stream).empty());

  // Chunks with room but no bytes merge to nothing.
  PortMemoryStream_t reserved;
  reserved.SizeRequest(100);
  reserved.SizeRequest(200);
  EXPECT_EQ(Inspect::Layout(reserved).size(), 2u);
  EXPECT_EQ(reserved.GetPtr(), nullptr);
  EXPECT_TRUE(Inspect::Layout(reserved).empty());
}

TEST(MemoryStream, AppendsFillTheLastChunkThenAddOneChunk) {
  struct Case {
    std::vector<int> writes;
    Layout layout;
  };
  const Case cases[] = {
      {{10}, {{4096, 10}}},
      {{10000}, {{10000, 10000}}},
      {{3000, 3000}, {{4096, 4096}, {4096, 1904}}},
      {{4096, 1}, {{4096, 4096}, {4096, 1}}},
      {{5000, 10, 6000}, {{5000, 5000}, {4096, 4096}, {4096, 1914}}},
  };
  for (const Case& c : cases) {
    PortMemoryStream_t stream;
    std::string model;
    for (int length : c.writes) Append(stream, model, length);
    EXPECT_EQ(Inspect::Layout(stream), c.layout);
    EXPECT_EQ(stream.GetPosition(), static_cast<int>(model.size()));
    EXPECT_EQ(ReadAll(stream), model);
  }
}

// Overwritten bytes stay where they are, across a chunk boundary too; only the part of a
// write beyond the end is appended.
TEST(MemoryStream, OverwriteKeepsTheLayoutAndAppendsOnlyPastTheEnd) {
  struct Case {
    std::vector<int> writes;
    int at, length;
    Layout layout;
  };
  const Case cases[] = {{{3000, 3000}, 4000, 200, {{4096, 4096}, {4096, 1904}}},
                        {{100}, 95, 20, {{4096, 115}}}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.at);
    PortMemoryStream_t stream;
    std::string model;
    for (int length : c.writes) Append(stream, model, length);
    stream.Seek(c.at, 0);
    const std::string patch(c.length, 'Z');
    stream.WriteBuffer(patch.data(), c.length);
    model.replace(c.at, c.length, patch);
    EXPECT_EQ(stream.GetPosition(), c.at + c.length);
    EXPECT_EQ(Inspect::Layout(stream), c.layout);
    EXPECT_EQ(ReadAll(stream), model);
  }
}

TEST(MemoryStream, SeekOriginsAndRefusedTargets) {
  struct Case {
    PortStreamUnit_t offset;
    int origin;
    int position;  // -1: refused
  };
  // From position 37 of a 100-byte stream; origin 2 counts backwards from the end.
  const Case cases[] = {
      {0, 0, 0},      {100, 0, 100},   {5, 1, 42},     {-37, 1, 0},     {0, 2, 100},
      {10, 2, 90},    {100, 2, 0},     {5, 3, 37},     {-1, 2, -1},     {101, 0, -1},
      {-1, 0, -1},    {64, 1, -1},     {-38, 1, -1},   {101, 2, -1},    {INT_MIN, 2, -1},
      {INT_MAX, 1, -1}, {INT_MIN, 1, -1},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.offset << "," << c.origin);
    PortMemoryStream_t stream;
    std::string model;
    Append(stream, model, 100);
    stream.Seek(37, 0);
    if (c.position < 0) {
      // Raised without the stream's description.
      EXPECT_EQ(RaisedText([&] { stream.Seek(c.offset, c.origin); }), " illegal parameter.");
      EXPECT_EQ(stream.GetPosition(), 37);
    } else {
      stream.Seek(c.offset, c.origin);
      EXPECT_EQ(stream.GetPosition(), c.position);
    }
  }
  PortMemoryStream_t empty;
  empty.Seek(0, 2);
  EXPECT_EQ(empty.GetPosition(), 0);
  EXPECT_EQ(RaisedText([&] { empty.Seek(1, 0); }), " illegal parameter.");
}

// Reads across chunks and short reads at the end are checked by the random test below.
TEST(MemoryStream, RefusedLengthsChangeNothing) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 1);
  char byte = 'x';
  stream.Seek(0, 2);
  // The base class's description: the memory stream has no name.
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(&byte, 1); }),
            "<PortStream_t super-class> read error.");
  const std::string refused = "<PortStream_t super-class> illegal parameter.";
  EXPECT_EQ(RaisedText([&] { stream.Write(&byte, -1); }), refused);
  EXPECT_EQ(RaisedText([&] { stream.Read(&byte, -1); }), refused);
  // The length would pass 2^31 - 1; refused before a byte is read from the source.
  EXPECT_EQ(RaisedText([&] { stream.Write(&byte, INT_MAX); }), refused);
  EXPECT_EQ(stream.Write(&byte, 0), 0);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 1}}));

  // Stepping to a chunk that does not exist is a program error, not a crash.
  EXPECT_EQ(RaisedText([&] { Inspect::PrevChunk(stream); }), " program error.");
  EXPECT_EQ(RaisedText([&] { Inspect::NextChunk(stream); }), " program error.");
  PortMemoryStream_t empty;
  EXPECT_EQ(RaisedText([&] { Inspect::NextChunk(empty); }), " program error.");
}

TEST(MemoryStream, GetPtrAndConvertToSingleChunk) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 3000);
  Append(stream, model, 3000);
  stream.Seek(5000, 0);
  const char* merged = static_cast<const char*>(stream.GetPtr());
  EXPECT_EQ(stream.GetPosition(), 0);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{6000, 6000}}));
  EXPECT_EQ(std::string(merged, 6000), model);
  // A single chunk is not merged again: the pointer follows the position.
  stream.Seek(100, 0);
  EXPECT_EQ(static_cast<const char*>(stream.GetPtr()), merged + 100);
  EXPECT_EQ(stream.GetPosition(), 100);

  // The merge keeps the free room of a chunk that has some.
  PortMemoryStream_t small;
  model.clear();
  Append(small, model, 10);
  small.SizeRequest(5000);
  EXPECT_EQ(Inspect::Layout(small), (Layout{{4096, 10}, {5000, 0}}));
  small.ConvertToSingleChunk();
  EXPECT_EQ(Inspect::Layout(small), (Layout{{4096, 10}}));
  EXPECT_EQ(small.GetPosition(), 0);
  small.Seek(0, 2);
  Append(small, model, 100);
  EXPECT_EQ(Inspect::Layout(small), (Layout{{4096, 110}}));
  EXPECT_EQ(ReadAll(small), model);
}

TEST(MemoryStream, SizeRequestReservesOneChunkAfterTheEnd) {
  // The reserved room serves the next append only while its chunk is current: from the
  // end it is; walking to the end from inside the stream stops at the earlier chunk.
  const std::pair<int, Layout> cases[] = {{4096, {{4096, 4096}, {10000, 5000}}},
                                          {100, {{4096, 4096}, {5000, 5000}}}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.first);
    PortMemoryStream_t stream;
    std::string model;
    Append(stream, model, 4096);
    for (int request : {0, 4096}) {  // room enough already: nothing reserved
      stream.SizeRequest(request);
      EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 4096}}));
    }
    stream.Seek(c.first, 0);
    stream.SizeRequest(10000);
    EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 4096}, {10000, 0}}));
    EXPECT_EQ(stream.GetPosition(), c.first);
    EXPECT_EQ(stream.GetLength(), 4096);
    stream.Seek(0, 2);
    Append(stream, model, 5000);
    EXPECT_EQ(Inspect::Layout(stream), c.second);
    EXPECT_EQ(ReadAll(stream), model);
  }
}

// Random writes, reads, seeks and the odd merge, reservation or reset, each checked
// against a plain string and a position.
TEST(MemoryStream, RandomOperationsMatchAStringModel) {
  std::mt19937 rng(20261206);
  auto pick = [&](int aLow, int aHigh) {
    return std::uniform_int_distribution<int>(aLow, aHigh)(rng);
  };
  const int ranges[][2] = {{0, 16}, {0, 600}, {1000, 5000}, {4000, 12000}};
  auto length = [&]() {
    const int* range = ranges[pick(0, 3)];
    return pick(range[0], range[1]);
  };
  PortMemoryStream_t stream;
  std::string model;
  int pos = 0;
  std::vector<char> buffer;
  for (int step = 0; step < 3000; ++step) {
    SCOPED_TRACE(step);
    const int size = static_cast<int>(model.size());
    const int op = pick(0, 19);
    if (op < 8) {
      const int n = length();
      std::string data(n, '\0');
      for (char& ch : data) ch = static_cast<char>(pick(0, 255));
      const size_t chunks_before = Inspect::Layout(stream).size();
      stream.WriteBuffer(data.data(), n);
      EXPECT_LE(Inspect::Layout(stream).size(), chunks_before + 1);
      model.replace(pos, std::min(n, size - pos), data);
      pos += n;
    } else if (op < 13) {
      const int n = length();
      buffer.resize(n + 1);
      const int got = stream.Read(buffer.data(), n);
      ASSERT_EQ(got, std::min(n, size - pos));
      ASSERT_EQ(std::string(buffer.data(), got), model.substr(pos, got));
      pos += got;
    } else if (op < 18) {  // origin 3 is a no-op, covered by the seek table
      const int origin = pick(0, 2);
      const int offset = pick(-size - 20, size + 20);
      const long long target = origin == 0 ? offset : origin == 1 ? pos + offset : size - offset;
      if (target < 0 || target > size) {
        ASSERT_EQ(RaisedText([&] { stream.Seek(offset, origin); }), " illegal parameter.");
      } else {
        stream.Seek(offset, origin);
        pos = static_cast<int>(target);
      }
    } else {
      const int kind = pick(0, 9);
      if (kind == 0) {
        stream.Free();
        model.clear();
        pos = 0;
      } else if (kind < 4) {
        const bool merges = Inspect::Layout(stream).size() > 1;
        const char* p = static_cast<const char*>(stream.GetPtr());
        if (merges) pos = 0;
        if (size > 0) {
          ASSERT_EQ(std::string(p, size - pos), model.substr(pos));
        }
      } else if (kind < 7) {
        stream.ConvertToSingleChunk();
        pos = 0;
      } else {
        stream.SizeRequest(pick(0, size + 9000));
      }
    }
    Inspect::ExpectConsistent(stream);
    ASSERT_EQ(stream.GetPosition(), pos);
    ASSERT_EQ(stream.GetLength(), static_cast<int>(model.size()));
  }
  EXPECT_EQ(ReadAll(stream), model);
}

}  // namespace
