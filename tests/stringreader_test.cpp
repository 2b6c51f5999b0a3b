#include "port/src/stringreader.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "tests/support/teststream.h"

namespace {

typedef std::vector<std::string> Lines;

std::string ToStd(const PortString_t& aStr) { return std::string(aStr.c_str(), aStr.GetLength()); }

// The reference: split at every line feed, no line after a final one, trailing CRs dropped.
Lines SplitLines(const std::string& aText) {
  Lines lines;
  size_t start = 0;
  while (start < aText.size()) {
    size_t end = aText.find('\n', start);
    if (end == std::string::npos) end = aText.size();
    std::string line = aText.substr(start, end - start);
    while (!line.empty() && line.back() == '\r') line.pop_back();
    lines.push_back(line);
    start = end + 1;
  }
  return lines;
}

// The lines up to eof(); past it gets() returns an empty line.
Lines ReadAll(const std::string& aText, int aStart = 0) {
  TestStream_t stream(aText);
  stream.Seek(aStart, 0);
  PortStringReader_t reader(&stream);
  Lines lines;
  while (!reader.eof()) lines.push_back(ToStd(reader.gets()));
  EXPECT_EQ("", ToStd(reader.gets()));
  return lines;
}

// Reads to the end, going on after each read error; returns the lines and counts the errors.
Lines ReadThroughErrors(PortStringReader_t& aReader, int& aErrors, int aMaxErrors) {
  Lines lines;
  aErrors = 0;
  while (!aReader.eof() && aErrors <= aMaxErrors) {
    try {
      lines.push_back(ToStd(aReader.gets()));
    } catch (const char* text) {
      EXPECT_STREQ("list.ls read error.", text);
      ++aErrors;
    }
  }
  return lines;
}

std::string NumberedLines(int aCount) {
  std::string text;
  for (int i = 0; i < aCount; ++i) text += "line " + std::to_string(i) + "\n";
  return text;
}

}  // namespace

TEST(StringReader, LineEndings) {
  const struct {
    std::string text;
    Lines lines;
  } cases[] = {
      {"", {}},
      {"a\nb\n", {"a", "b"}},
      {"a\nb", {"a", "b"}},
      {"a\r\nb\r\n", {"a", "b"}},
      {"a\rb\n", {"a\rb"}},
      {"\n\n", {"", ""}},
      {"a\n\nb", {"a", "", "b"}},
      {"x\r\r\n", {"x"}},
      {"x\n\r", {"x", ""}},
      {"\r", {""}},
      {"x\r", {"x"}},
      {std::string("a\0b\n\0", 5), {std::string("a\0b", 3), std::string("\0", 1)}},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.lines, ReadAll(c.text)) << testing::PrintToString(c.text);
  }
}

// The stream's position runs ahead by whole fills, so after the first line it shows the
// buffer's size: the buffer doubles only when a line with its terminator does not fit.
TEST(StringReader, BufferDoublesOnlyForALineThatDoesNotFit) {
  // {first line's length, position after reading it}
  const int cases[][2] = {{10, 1024}, {1023, 1024}, {1024, 2048}, {2047, 2048}, {3000, 4096}};
  const std::string tail = NumberedLines(800);
  for (const auto& c : cases) {
    SCOPED_TRACE(c[0]);
    const std::string first(c[0], 'q');
    TestStream_t stream(first + "\n" + tail);
    PortStringReader_t reader(&stream);
    EXPECT_EQ(0, stream.GetPosition());
    EXPECT_EQ(first, ToStd(reader.gets()));
    EXPECT_EQ(c[1], stream.GetPosition());
    Lines rest;
    while (!reader.eof()) rest.push_back(ToStd(reader.gets()));
    EXPECT_EQ(SplitLines(tail), rest);
  }
}

// Lines of up to 1023 bytes with their terminator fit the 1024-byte buffer, so it never
// grows and the lines wrap from its end to its front. Each fill tops the buffer up: when
// a line needed one, the stream stands 1024 bytes past the line's start (unless it ended).
TEST(StringReader, LinesWrappingTheRingBufferStayIntact) {
  const int lengths[] = {50, 1000, 300, 7, 1022, 0, 640, 301, 999};
  std::string text;
  for (int i = 0; i < 45; ++i) {
    text += std::string(lengths[i % 9], static_cast<char>('A' + i % 26)) + "\n";
  }
  TestStream_t stream(text);
  PortStringReader_t reader(&stream);
  int line_start = 0;
  for (const std::string& expected : SplitLines(text)) {
    const int position_before = stream.GetPosition();
    ASSERT_EQ(expected, ToStd(reader.gets()));
    const int ahead = stream.GetPosition() - line_start;
    EXPECT_LE(ahead, 1024) << "line at " << line_start;
    if (stream.GetPosition() != position_before && stream.GetPosition() < stream.GetLength()) {
      EXPECT_EQ(1024, ahead) << "line at " << line_start;
    }
    line_start += static_cast<int>(expected.size()) + 1;
  }
  EXPECT_TRUE(reader.eof());
}

TEST(StringReader, EveryPrefixGivesTheLinesOfAPlainSplit) {
  std::string text;
  for (int i = 0; i < 60; ++i) text += std::string(i % 7, 'w') + (i % 3 ? "\n" : "\r\n");
  text += std::string(1500, 'L') + "\r\r\n" + "tail\r";
  for (size_t n = 0; n <= text.size(); ++n) {
    const std::string prefix = text.substr(0, n);
    ASSERT_EQ(SplitLines(prefix), ReadAll(prefix)) << "prefix length " << n;
  }
}

// Random texts read by readers started at many stream positions put line ends, CR runs and
// long lines at every position relative to the ring buffer's end and its growth points.
TEST(StringReader, MatchesAPlainSplitFromManyStartPositions) {
  std::mt19937 rng(20261206);
  const char alphabet[] = {'a', 'b', ' ', '\t', '\r', '\0'};
  for (int round = 0; round < 12; ++round) {
    std::string text;
    while (text.size() < 9000) {
      const bool is_long = rng() % 8 == 0;
      const int length = static_cast<int>(rng() % (is_long ? 2600 : 90));
      for (int i = 0; i < length; ++i) text += alphabet[rng() % sizeof(alphabet)];
      text += std::string(rng() % 3, '\r') + "\n";
    }
    if (round % 2) text.pop_back();
    for (int start = 0; start < 1100; start += 1 + static_cast<int>(rng() % 97)) {
      ASSERT_EQ(SplitLines(text.substr(start)), ReadAll(text, start))
          << "round " << round << " start " << start;
    }
  }
}

// A stream that delivers less per call than asked: each shortfall is a read error, but the
// bytes that did arrive are kept, so reading on yields every line once and nothing else.
TEST(StringReader, ShortReadRaisesReadErrorAndKeepsWhatArrived) {
  const std::string text = NumberedLines(400) + std::string(1500, 'x') + "\r\nend";
  const int cases[][2] = {{100, 0}, {1, 0}, {0, 2}, {0, 5}};  // {cap per call, failing call}
  for (const auto& c : cases) {
    TestStream_t stream(text, "list.ls");
    stream.SetCap(c[0]);
    stream.FailReadAt(c[1]);
    PortStringReader_t reader(&stream);
    int errors = 0;
    EXPECT_EQ(SplitLines(text), ReadThroughErrors(reader, errors, 1 << 20));
    EXPECT_LT(0, errors);
    if (c[1] > 0) {
      EXPECT_EQ(1, errors);
    }
  }
}

// A file that shrank after its length was measured: what arrived is returned, the missing
// rest is a read error on every later call and never reads as the end of the text.
TEST(StringReader, StreamShorterThanMeasuredRaisesReadError) {
  class ShrunkStream_t : public TestStream_t {
   public:
    using TestStream_t::TestStream_t;
    PortStreamUnit_t GetLength() override { return TestStream_t::GetLength() + 50; }
    int Read(void* aPtr, int aLength) override {
      const int left = TestStream_t::GetLength() - GetPosition();
      return TestStream_t::Read(aPtr, aLength < left ? aLength : left);
    }
  };
  ShrunkStream_t stream("a\nb\nc", "list.ls");
  PortStringReader_t reader(&stream);
  int errors = 0;
  EXPECT_EQ(Lines({"a", "b"}), ReadThroughErrors(reader, errors, 3));
  EXPECT_EQ(4, errors);
  EXPECT_FALSE(reader.eof());
}
