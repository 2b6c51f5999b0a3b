#include <gtest/gtest.h>

#include <cfloat>
#include <string>
#include <vector>

#include "port/src/stream.h"
#include "tests/support/raisedtext.h"
#include "tests/support/teststream.h"

namespace {

std::string Pattern(int aLength) {
  std::string text;
  for (int i = 0; i < aLength; ++i) text += static_cast<char>('a' + i % 26);
  return text;
}

// The base class's own description ("<PortStream_t super-class>") shows in memorystream_test.
TEST(Stream, ErrorPutsTheDescriptionBeforeTheTableText) {
  TestStream_t named("", "list.ls");
  EXPECT_EQ(RaisedText([&] { named.Error(7); }), "list.ls could't open.");
  EXPECT_EQ(RaisedText([&] { named.Error(99); }), "list.ls unknown error.");
}

TEST(Stream, AccessChecksComeBeforeAnyTransfer) {
  struct Case {
    bool readable, writable;
    const char* write_text;
    const char* read_text;
  };
  const Case cases[] = {
      {false, false, "s could't write.", "s could't read."},
      {true, false, "s could't write.", "<nothing raised>"},
      {false, true, "<nothing raised>", "s could't read."},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.readable << c.writable);
    TestStream_t stream("xyz", "s");
    stream.SetAccess(c.readable, c.writable);
    char byte;
    // Even a zero-length transfer is checked.
    EXPECT_EQ(RaisedText([&] { stream.WriteBuffer("", 0); }), c.write_text);
    EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(&byte, 0); }), c.read_text);
    EXPECT_EQ(stream.WriteSizes().size(), c.writable ? 1u : 0u);
    EXPECT_EQ(stream.ReadSizes().size(), c.readable ? 1u : 0u);
    EXPECT_EQ(stream.Content(), "xyz");
  }
}

TEST(Stream, ShortTransfersRaiseAndKeepWhatWasDone) {
  TestStream_t stream("", "out.bin");
  stream.SetCap(3);
  EXPECT_EQ(RaisedText([&] { stream.WriteBuffer("abcdefgh", 8); }), "out.bin write error.");
  EXPECT_EQ(stream.Content(), "abc");
  EXPECT_EQ(RaisedText([&] { stream.WriteBuffer("def", 3); }), "<nothing raised>");

  stream.Seek(0, 0);
  char buffer[8];
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(buffer, 4); }), "out.bin read error.");
  EXPECT_EQ(stream.GetPosition(), 3);
  stream.SetCap(0);
  // Running out of data is a short read too.
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(buffer, 4); }), "out.bin read error.");
  EXPECT_EQ(std::string(buffer, 3), "def");
}

TEST(Stream, CopyFromMovesPiecesOfAtMost4096Bytes) {
  struct Case {
    int length;
    std::vector<int> pieces;
  };
  const Case cases[] = {{1, {1}}, {4096, {4096}}, {4097, {4096, 1}},
                        {10000, {4096, 4096, 1808}}};
  const std::string source_text = Pattern(12000);
  for (const Case& c : cases) {
    SCOPED_TRACE(c.length);
    TestStream_t src(source_text), dst("head");
    src.Seek(7, 0);
    dst.Seek(0, 2);
    dst.CopyFrom(src, c.length);
    EXPECT_EQ(src.ReadSizes(), c.pieces);
    EXPECT_EQ(dst.WriteSizes(), c.pieces);
    EXPECT_EQ(dst.Content(), "head" + source_text.substr(7, c.length));
  }
}

// Without a length, the rest of the source; with nothing to copy, neither stream is touched.
TEST(Stream, CopyFromDefaultLengthAndNoOps) {
  TestStream_t src("0123456789"), dst;
  src.Seek(3, 0);
  dst.CopyFrom(src);
  EXPECT_EQ(dst.Content(), "3456789");
  EXPECT_EQ(src.GetPosition(), 10);
  dst.CopyFrom(src);  // at the end
  EXPECT_EQ(src.ReadSizes().size(), 1u);

  for (int length : {0, -5}) {
    TestStream_t closed_src("abc"), closed_dst;
    closed_src.SetAccess(false, false);
    closed_dst.SetAccess(false, false);
    EXPECT_EQ(RaisedText([&] { closed_dst.CopyFrom(closed_src, length); }), "<nothing raised>");
    EXPECT_TRUE(closed_src.ReadSizes().empty());
  }
}

TEST(Stream, CopyFromFailingMidwayKeepsTheCompletePieces) {
  const std::string text = Pattern(9000);
  TestStream_t short_src(text.substr(0, 5000), "src"), dst1("", "dst");
  EXPECT_EQ(RaisedText([&] { dst1.CopyFrom(short_src, 9000); }), "src read error.");
  EXPECT_EQ(dst1.Content(), text.substr(0, 4096));

  TestStream_t src(text, "src"), dst2("", "dst");
  dst2.FailWriteAt(2);
  EXPECT_EQ(RaisedText([&] { dst2.CopyFrom(src, 9000); }), "dst write error.");
  EXPECT_EQ(dst2.Content(), text.substr(0, 4096));
  EXPECT_EQ(src.GetPosition(), 8192);
}

TEST(Stream, FillCharWritesPiecesOf256) {
  struct Case {
    int length;
    std::vector<int> pieces;
  };
  const Case cases[] = {{0, {}},         {-3, {}},         {1, {1}},
                        {256, {256}},    {257, {256, 1}},  {600, {256, 256, 88}}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.length);
    TestStream_t stream;
    stream.FillChar(c.length, 'x');
    EXPECT_EQ(stream.WriteSizes(), c.pieces);
    EXPECT_EQ(stream.Content(), std::string(c.length > 0 ? c.length : 0, 'x'));
  }
}

TEST(Stream, TextOutputWritesExactlyTheFormattedCharacters) {
  TestStream_t stream;
  stream << -5 << "|" << 255u << "|" << 1.5 << "|" << PortString_t("str") << "|"
         << reinterpret_cast<const unsigned char*>("uc")
         << reinterpret_cast<const signed char*>("sc") << 0 << 0u;
  EXPECT_EQ(stream.Content(), "-5|0xFF|1.500000|str|ucsc00x0");

  TestStream_t huge;
  huge << -DBL_MAX;
  ASSERT_EQ(huge.Content().size(), 317u);  // sign, 309 digits, point, 6 decimals
  EXPECT_EQ(huge.Content().substr(0, 18), "-17976931348623157");
  EXPECT_EQ(huge.Content().substr(310), ".000000");

  // Empty texts write nothing, so they pass even without access.
  TestStream_t closed;
  closed.SetAccess(false, false);
  EXPECT_EQ(RaisedText([&] { closed << "" << PortString_t(); }), "<nothing raised>");
  EXPECT_EQ(RaisedText([&] { closed << "a"; }), "<test stream> could't write.");
}

}  // namespace
