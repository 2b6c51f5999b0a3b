#include <gtest/gtest.h>

#include <climits>
#include <cstring>
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
  static int CurrentIndex(const PortMemoryStream_t& aStream) {
    int index = 0;
    for (const PortMemoryStrmChunk_t* c = First(aStream); c != aStream.currentChunk; c = c->next) {
      ++index;
    }
    return index;
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

TEST(MemoryStream, NewStreamIsEmpty) {
  PortMemoryStream_t stream;
  EXPECT_EQ(stream.GetLength(), 0);
  EXPECT_EQ(stream.GetPosition(), 0);
  EXPECT_EQ(stream.GetPtr(), nullptr);
  char byte;
  EXPECT_EQ(stream.Read(&byte, 1), 0);
  EXPECT_TRUE(stream.CanRead());
  EXPECT_TRUE(stream.CanWrite());
  EXPECT_TRUE(Inspect::Layout(stream).empty());
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

TEST(MemoryStream, OverwriteAcrossAChunkBoundaryKeepsTheLayout) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 3000);
  Append(stream, model, 3000);
  stream.Seek(4000, 0);
  const std::string patch(200, 'Z');
  stream.WriteBuffer(patch.data(), 200);
  model.replace(4000, 200, patch);
  EXPECT_EQ(stream.GetPosition(), 4200);
  EXPECT_EQ(stream.GetLength(), 6000);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 4096}, {4096, 1904}}));
  EXPECT_EQ(ReadAll(stream), model);
}

TEST(MemoryStream, WriteStraddlingTheEndOverwritesThenAppends) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 100);
  stream.Seek(5, 2);
  const std::string tail(20, 'Q');
  stream.WriteBuffer(tail.data(), 20);
  model.replace(95, 5, tail);
  EXPECT_EQ(stream.GetLength(), 115);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 115}}));
  EXPECT_EQ(ReadAll(stream), model);
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

TEST(MemoryStream, ChunkBoundaryBelongsToTheChunkWhereTheWalkStops) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 3000);
  Append(stream, model, 3000);  // chunks hold 0..4096 and 4096..6000
  struct Step {
    PortStreamUnit_t target;
    int chunk;
  };
  const Step steps[] = {{4096, 1}, {0, 0}, {4096, 0}, {5000, 1}, {4096, 1}, {6000, 1}};
  for (const Step& s : steps) {
    SCOPED_TRACE(s.target);
    stream.Seek(s.target, 0);
    EXPECT_EQ(Inspect::CurrentIndex(stream), s.chunk);
    Inspect::ExpectConsistent(stream);
  }
}

TEST(MemoryStream, ReadsCrossChunksAndStopShortAtTheEnd) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 3000);
  Append(stream, model, 3000);
  char buffer[200];
  stream.Seek(4000, 0);
  stream.ReadBuffer(buffer, 200);
  EXPECT_EQ(std::string(buffer, 200), model.substr(4000, 200));
  stream.Seek(10, 2);
  EXPECT_EQ(stream.Read(buffer, 50), 10);
  EXPECT_EQ(std::string(buffer, 10), model.substr(5990));
  EXPECT_EQ(stream.Read(buffer, 1), 0);
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(buffer, 1); }),
            "<PortStream_t super-class> read error.");
}

TEST(MemoryStream, RefusedLengthsChangeNothing) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 1);
  char byte = 'x';
  const std::string refused = "<PortStream_t super-class> illegal parameter.";
  EXPECT_EQ(RaisedText([&] { stream.Write(&byte, -1); }), refused);
  EXPECT_EQ(RaisedText([&] { stream.Read(&byte, -1); }), refused);
  // The length would pass 2^31 - 1; refused before a byte is read from the source.
  EXPECT_EQ(RaisedText([&] { stream.Write(&byte, INT_MAX); }), refused);
  EXPECT_EQ(stream.GetLength(), 1);
  EXPECT_EQ(stream.Write(&byte, 0), 0);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 1}}));
}

TEST(MemoryStream, ChunkSteppingWithoutANeighbourIsAProgramError) {
  PortMemoryStream_t empty;
  PortMemoryStream_t single;
  std::string model;
  Append(single, model, 10);
  for (PortMemoryStream_t* stream : {&empty, &single}) {
    EXPECT_EQ(RaisedText([&] { Inspect::PrevChunk(*stream); }), " program error.");
    EXPECT_EQ(RaisedText([&] { Inspect::NextChunk(*stream); }), " program error.");
  }
}

TEST(MemoryStream, GetPtrMergesOnlyWhenThereAreSeveralChunks) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 3000);
  Append(stream, model, 3000);
  stream.Seek(5000, 0);
  const char* merged = static_cast<const char*>(stream.GetPtr());
  EXPECT_EQ(stream.GetPosition(), 0);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{6000, 6000}}));
  EXPECT_EQ(std::string(merged, 6000), model);

  stream.Seek(100, 0);
  EXPECT_EQ(static_cast<const char*>(stream.GetPtr()), merged + 100);
  EXPECT_EQ(stream.GetPosition(), 100);
}

TEST(MemoryStream, ConvertToSingleChunkKeepsBytesAndFreeRoom) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 10);
  stream.SizeRequest(5000);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 10}, {5000, 0}}));
  stream.ConvertToSingleChunk();
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 10}}));
  EXPECT_EQ(stream.GetPosition(), 0);
  stream.Seek(0, 2);
  Append(stream, model, 100);  // into the merged chunk's free room
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 110}}));
  EXPECT_EQ(ReadAll(stream), model);

  Append(stream, model, 8000);
  stream.ConvertToSingleChunk();
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{8110, 8110}}));
  EXPECT_EQ(ReadAll(stream), model);
}

TEST(MemoryStream, StreamWithOnlyReservedRoomMergesToNothing) {
  PortMemoryStream_t stream;
  stream.SizeRequest(100);
  stream.SizeRequest(200);
  EXPECT_EQ(Inspect::Layout(stream).size(), 2u);
  EXPECT_EQ(stream.GetLength(), 0);
  EXPECT_EQ(stream.GetPtr(), nullptr);
  EXPECT_TRUE(Inspect::Layout(stream).empty());
}

TEST(MemoryStream, SizeRequestReservesOneChunkAfterTheEnd) {
  struct Case {
    PortStreamUnit_t position;  // when the request is made
    Layout after_append;
  };
  // The reserved room serves the next append only while its chunk is current: from the
  // end it is; walking to the end from inside the stream stops at the earlier chunk.
  const Case cases[] = {{4096, {{4096, 4096}, {10000, 5000}}},
                        {100, {{4096, 4096}, {5000, 5000}}}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.position);
    PortMemoryStream_t stream;
    std::string model;
    Append(stream, model, 4096);
    for (int request : {0, 4096}) {
      stream.SizeRequest(request);
      EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 4096}}));
    }
    stream.Seek(c.position, 0);
    stream.SizeRequest(10000);
    EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 4096}, {10000, 0}}));
    EXPECT_EQ(stream.GetPosition(), c.position);
    EXPECT_EQ(stream.GetLength(), 4096);
    stream.Seek(0, 2);
    Append(stream, model, 5000);
    EXPECT_EQ(Inspect::Layout(stream), c.after_append);
    EXPECT_EQ(ReadAll(stream), model);
  }
}

TEST(MemoryStream, FreeReturnsToANewStream) {
  PortMemoryStream_t stream;
  std::string model;
  Append(stream, model, 9000);
  Append(stream, model, 9000);
  stream.Free();
  EXPECT_EQ(stream.GetLength(), 0);
  EXPECT_EQ(stream.GetPosition(), 0);
  EXPECT_EQ(stream.GetPtr(), nullptr);
  EXPECT_TRUE(Inspect::Layout(stream).empty());
  model.clear();
  Append(stream, model, 10);
  EXPECT_EQ(Inspect::Layout(stream), (Layout{{4096, 10}}));
  EXPECT_EQ(ReadAll(stream), model);
}

// Random writes, reads, seeks and the odd merge, reservation or reset, each checked
// against a plain string and a position.
TEST(MemoryStream, RandomOperationsMatchAStringModel) {
  std::mt19937 rng(20261206);
  auto pick = [&](int aLow, int aHigh) {
    return std::uniform_int_distribution<int>(aLow, aHigh)(rng);
  };
  auto length = [&]() {
    switch (pick(0, 3)) {
      case 0: return pick(0, 16);
      case 1: return pick(0, 600);
      case 2: return pick(1000, 5000);
      default: return pick(4000, 12000);
    }
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
    } else if (op < 18) {
      const int origin = pick(0, 3);
      const int offset = pick(-size - 20, size + 20);
      const long long target = origin == 0 ? offset : origin == 1 ? pos + offset : size - offset;
      if (origin == 3) {
        stream.Seek(offset, origin);
      } else if (target < 0 || target > size) {
        ASSERT_EQ(RaisedText([&] { stream.Seek(offset, origin); }), " illegal parameter.");
      } else {
        stream.Seek(offset, origin);
        pos = static_cast<int>(target);
      }
    } else {
      switch (pick(0, 9)) {
        case 0:
          stream.Free();
          model.clear();
          pos = 0;
          break;
        case 1: case 2: case 3: {
          const bool merges = Inspect::Layout(stream).size() > 1;
          const char* p = static_cast<const char*>(stream.GetPtr());
          if (merges) pos = 0;
          if (size > 0) {
            ASSERT_EQ(std::string(p, size - pos), model.substr(pos));
          }
          break;
        }
        case 4: case 5: case 6:
          stream.ConvertToSingleChunk();
          pos = 0;
          break;
        default:
          stream.SizeRequest(pick(0, size + 9000));
          break;
      }
    }
    Inspect::ExpectConsistent(stream);
    ASSERT_EQ(stream.GetPosition(), pos);
    ASSERT_EQ(stream.GetLength(), static_cast<int>(model.size()));
  }
  EXPECT_EQ(ReadAll(stream), model);
}

}  // namespace
