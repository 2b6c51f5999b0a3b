#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>

#include "port/src/filestream.h"
#include "tests/support/raisedtext.h"

namespace {

// A fresh directory per test, removed with everything in it.
class FileStream : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/filestream_test.XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir = pattern;
  }
  void TearDown() override { std::filesystem::remove_all(dir); }

  std::string Path(const std::string& aName) const { return dir + "/" + aName; }
  void Put(const std::string& aName, const std::string& aContent) const {
    std::ofstream(Path(aName), std::ios::binary) << aContent;
  }
  std::string Get(const std::string& aName) const {
    std::ostringstream content;
    content << std::ifstream(Path(aName), std::ios::binary).rdbuf();
    return content.str();
  }

  std::string dir;
};

// Written through a backslashed name, read back through the slash form.
TEST_F(FileStream, WrittenBytesReadBack) {
  ASSERT_EQ(mkdir(Path("a").c_str(), 0700), 0);
  PortFileStream_t stream;
  stream.WriteOpen((dir + "\\a\\b.dat").c_str());
  stream.WriteBuffer("hello, world", 12);
  EXPECT_EQ(stream.GetPosition(), 12);
  // Reopening for reading closes (and so flushes) the written file first.
  stream.ReadOpen(Path("a/b.dat").c_str());
  char buffer[16];
  stream.ReadBuffer(buffer, 12);
  EXPECT_EQ(std::string(buffer, 12), "hello, world");
  EXPECT_EQ(stream.Read(buffer, 1), 0);  // end of file: a short count, no error
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(buffer, 1); }), Path("a/b.dat") + " read error.");
}

TEST_F(FileStream, WriteOpenTruncatesAndDestructionCloses) {
  Put("t.bin", "old content");
  {
    PortFileStream_t stream;
    stream.WriteOpen(Path("t.bin").c_str());
    stream.WriteBuffer("new", 3);
  }
  EXPECT_EQ(Get("t.bin"), "new");
  // A heap stream left in a released anchor is closed by its deletion.
  PortResourceAnchor_t::NewAnchor();
  PortFileStream_t* owned = new PortFileStream_t;
  owned->WriteOpen(Path("owned.bin").c_str());
  owned->WriteBuffer("kept", 4);
  PortResourceAnchor_t::Release(false);
  EXPECT_EQ(Get("owned.bin"), "kept");
}

TEST_F(FileStream, FailuresNameTheFile) {
  Put("f.bin", "0123456789");
  ASSERT_EQ(mkdir(Path("sub").c_str(), 0700), 0);
  PortFileStream_t opener;
  EXPECT_EQ(RaisedText([&] { opener.WriteOpen(Path("no/x.bin").c_str()); }),
            Path("no/x.bin") + " could't create.");
  EXPECT_EQ(RaisedText([&] { opener.ReadOpen(Path("none").c_str()); }),
            Path("none") + " could't open.");
  EXPECT_EQ(RaisedText([&] { opener.ReadOpen(Path("sub").c_str()); }),
            Path("sub") + " could't open.");

  // The stream is never opened, open for reading f.bin or open for writing w.bin.
  enum Opened { kNever, kReading, kWriting };
  struct Case {
    Opened opened;
    void (*action)(PortFileStream_t&);
    const char* text;  // after the file's name
  };
  static char byte;
  const Case cases[] = {
      {kNever, [](PortFileStream_t& s) { s.Write("a", 1); }, " could't write."},
      {kReading, [](PortFileStream_t& s) { s.Write("a", 1); }, " could't write."},
      {kWriting, [](PortFileStream_t& s) { s.Read(&byte, 1); }, " could't read."},
      {kNever, [](PortFileStream_t& s) { s.Seek(0, 0); }, " file operation invalid."},
      {kNever, [](PortFileStream_t& s) { s.GetPosition(); }, " file operation invalid."},
      {kNever, [](PortFileStream_t& s) { s.GetLength(); }, " file operation invalid."},
      {kReading, [](PortFileStream_t& s) { s.Seek(-1, 0); }, " file operation fail."},
      {kWriting, [](PortFileStream_t& s) { s.Write("a", -1); }, " illegal parameter."},
      {kReading, [](PortFileStream_t& s) { s.Read(&byte, -1); }, " illegal parameter."},
  };
  const std::string names[] = {"<no filename>", Path("f.bin"), Path("w.bin")};
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.opened << c.text);
    PortFileStream_t stream;
    if (c.opened == kReading) stream.ReadOpen(names[kReading].c_str());
    if (c.opened == kWriting) stream.WriteOpen(names[kWriting].c_str());
    EXPECT_EQ(RaisedText([&] { c.action(stream); }), names[c.opened] + c.text);
  }
}

TEST_F(FileStream, FailedOpenLeavesAClosedStreamNamingTheFile) {
  PortFileStream_t stream;
  stream.WriteOpen(Path("open.bin").c_str());
  const std::string backslashed = dir + "\\no\\x.bin";
  EXPECT_EQ(RaisedText([&] { stream.WriteOpen(backslashed.c_str()); }),
            dir + "/no/x.bin could't create.");
  EXPECT_FALSE(stream.CanRead());
  EXPECT_EQ(RaisedText([&] { stream.Write("a", 1); }), dir + "/no/x.bin could't write.");
  stream.Close();  // nothing open: the name stays
  EXPECT_EQ(RaisedText([&] { stream.Seek(0, 0); }), dir + "/no/x.bin file operation invalid.");
  // After closing an open file the stream is unnamed again.
  stream.ReadOpen(Path("open.bin").c_str());
  stream.Close();
  stream.Close();
  EXPECT_EQ(RaisedText([&] { stream.Write("a", 1); }), "<no filename> could't write.");
}

TEST_F(FileStream, SeekOriginsAndLengthKeepingThePosition) {
  Put("s.bin", "abcdefghij");
  PortFileStream_t stream;
  stream.ReadOpen(Path("s.bin").c_str());
  char buffer[4];
  stream.ReadBuffer(buffer, 4);
  EXPECT_EQ(stream.GetLength(), 10);
  EXPECT_EQ(stream.GetPosition(), 4);

  // {offset, origin, position}; origin 2 adds the offset to the end, as fseek does.
  const int cases[][3] = {{2, 0, 2}, {3, 1, 5}, {-2, 1, 3}, {-3, 2, 7}, {0, 2, 10}, {5, 2, 15}};
  for (const auto& c : cases) {
    stream.Seek(c[0], c[1]);
    EXPECT_EQ(stream.GetPosition(), c[2]) << c[0] << "," << c[1];
  }
  stream.Seek(-3, 2);
  stream.ReadBuffer(buffer, 3);
  EXPECT_EQ(std::string(buffer, 3), "hij");
}

TEST_F(FileStream, PositionsBeyond32BitsAreRefused) {
  const std::string name = Path("sparse.bin");
  const std::string refused = name + " file operation invalid.";
  for (int64_t size : {int64_t{INT32_MAX}, int64_t{INT32_MAX} + 1, int64_t{3} << 30}) {
    SCOPED_TRACE(size);
    Put("sparse.bin", "");
    ASSERT_EQ(truncate(name.c_str(), size), 0);  // sparse: costs no disk
    PortFileStream_t stream;
    stream.ReadOpen(name.c_str());
    stream.Seek(100, 0);
    if (size == INT32_MAX) {
      EXPECT_EQ(stream.GetLength(), INT32_MAX);
    } else {
      EXPECT_EQ(RaisedText([&] { stream.GetLength(); }), refused);
    }
    EXPECT_EQ(stream.GetPosition(), 100);  // restored even when the length was refused
  }
  // Walking past the last representable position.
  PortFileStream_t stream;
  stream.ReadOpen(name.c_str());
  stream.Seek(INT32_MAX, 0);
  EXPECT_EQ(stream.GetPosition(), INT32_MAX);
  stream.Seek(1, 1);
  EXPECT_EQ(RaisedText([&] { stream.GetPosition(); }), refused);
}

TEST_F(FileStream, DeviceErrorsRaiseWriteAndReadErrors) {
  PortFileStream_t stream;
  stream.WriteOpen("/dev/full");
  // A small write only fills the buffer; the failing flush is reported by Close.
  stream.WriteBuffer("0123456789", 10);
  EXPECT_EQ(RaisedText([&] { stream.Close(); }), "/dev/full write error.");
  EXPECT_FALSE(stream.CanWrite());

  stream.WriteOpen("/dev/full");
  const std::string big(1 << 16, 'z');
  EXPECT_EQ(RaisedText([&] { stream.WriteBuffer(big.data(), 1 << 16); }),
            "/dev/full write error.");
  // The error indicator stays set: later writes fail too.
  EXPECT_EQ(RaisedText([&] { stream.Write("a", 1); }), "/dev/full write error.");

  // Reading the process's own memory at address 0 fails with EIO.
  PortFileStream_t memory;
  memory.ReadOpen("/proc/self/mem");
  char byte;
  EXPECT_EQ(RaisedText([&] { memory.Read(&byte, 1); }), "/proc/self/mem read error.");
}

}  // namespace
