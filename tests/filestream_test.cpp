#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <climits>
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

TEST_F(FileStream, WrittenBytesReadBack) {
  PortFileStream_t stream;
  stream.WriteOpen(Path("a.bin").c_str());
  EXPECT_TRUE(stream.CanWrite());
  EXPECT_FALSE(stream.CanRead());
  stream.WriteBuffer("hello, world", 12);
  EXPECT_EQ(stream.GetPosition(), 12);
  // Reopening for reading closes (and so flushes) the written file first.
  stream.ReadOpen(Path("a.bin").c_str());
  EXPECT_FALSE(stream.CanWrite());
  EXPECT_TRUE(stream.CanRead());
  char buffer[16];
  stream.ReadBuffer(buffer, 12);
  EXPECT_EQ(std::string(buffer, 12), "hello, world");
  EXPECT_EQ(stream.Read(buffer, 1), 0);  // end of file: a short count, no error
  EXPECT_EQ(RaisedText([&] { stream.ReadBuffer(buffer, 1); }), Path("a.bin") + " read error.");
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
  const std::string file = Path("f.bin");
  struct Case {
    const char* what;
    void (*action)(PortFileStream_t&, const std::string&);
    std::string text;
  };
  const Case cases[] = {
      {"create in a missing directory",
       [](PortFileStream_t& s, const std::string& d) { s.WriteOpen((d + "/no/x.bin").c_str()); },
       dir + "/no/x.bin could't create."},
      {"open a missing file",
       [](PortFileStream_t& s, const std::string& d) { s.ReadOpen((d + "/none").c_str()); },
       dir + "/none could't open."},
      {"open a directory",
       [](PortFileStream_t& s, const std::string& d) { s.ReadOpen((d + "/sub").c_str()); },
       dir + "/sub could't open."},
      {"write a never-opened stream",
       [](PortFileStream_t& s, const std::string&) { s.Write("a", 1); },
       "<no filename> could't write."},
      {"write a stream open for reading",
       [](PortFileStream_t& s, const std::string& d) {
         s.ReadOpen((d + "/f.bin").c_str());
         s.Write("a", 1);
       },
       file + " could't write."},
      {"read a stream open for writing",
       [](PortFileStream_t& s, const std::string& d) {
         char byte;
         s.WriteOpen((d + "/w.bin").c_str());
         s.Read(&byte, 1);
       },
       dir + "/w.bin could't read."},
      {"seek a closed stream",
       [](PortFileStream_t& s, const std::string&) { s.Seek(0, 0); },
       "<no filename> file operation invalid."},
      {"ask a closed stream its position",
       [](PortFileStream_t& s, const std::string&) { s.GetPosition(); },
       "<no filename> file operation invalid."},
      {"ask a closed stream its length",
       [](PortFileStream_t& s, const std::string&) { s.GetLength(); },
       "<no filename> file operation invalid."},
      {"seek before the start",
       [](PortFileStream_t& s, const std::string& d) {
         s.ReadOpen((d + "/f.bin").c_str());
         s.Seek(-1, 0);
       },
       file + " file operation fail."},
      {"write a negative length",
       [](PortFileStream_t& s, const std::string& d) {
         s.WriteOpen((d + "/w.bin").c_str());
         s.Write("a", -1);
       },
       dir + "/w.bin illegal parameter."},
      {"read a negative length",
       [](PortFileStream_t& s, const std::string& d) {
         char byte;
         s.ReadOpen((d + "/f.bin").c_str());
         s.Read(&byte, -1);
       },
       file + " illegal parameter."},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    PortFileStream_t stream;
    EXPECT_EQ(RaisedText([&] { c.action(stream, dir); }), c.text);
  }
}

TEST_F(FileStream, FailedOpenLeavesAClosedStreamNamingTheFile) {
  PortFileStream_t stream;
  stream.WriteOpen(Path("open.bin").c_str());
  const std::string backslashed = dir + "\\no\\x.bin";
  EXPECT_EQ(RaisedText([&] { stream.WriteOpen(backslashed.c_str()); }),
            dir + "/no/x.bin could't create.");
  EXPECT_FALSE(stream.CanWrite());
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

TEST_F(FileStream, BackslashesOpenAsSlashes) {
  ASSERT_EQ(mkdir(Path("a").c_str(), 0700), 0);
  PortFileStream_t stream;
  stream.WriteOpen((dir + "\\a\\b.dat").c_str());
  stream.WriteBuffer("xy", 2);
  stream.Close();
  EXPECT_EQ(Get("a/b.dat"), "xy");
}

TEST_F(FileStream, SeekOriginsAndLengthKeepingThePosition) {
  Put("s.bin", "abcdefghij");
  PortFileStream_t stream;
  stream.ReadOpen(Path("s.bin").c_str());
  char buffer[4];
  stream.ReadBuffer(buffer, 4);
  EXPECT_EQ(stream.GetLength(), 10);
  EXPECT_EQ(stream.GetPosition(), 4);
  stream.ReadBuffer(buffer, 1);
  EXPECT_EQ(buffer[0], 'e');

  struct Case {
    PortStreamUnit_t offset;
    int origin;
    PortStreamUnit_t position;
  };
  // Origin 2 adds the offset to the end, as fseek does.
  const Case cases[] = {{2, 0, 2}, {3, 1, 5}, {-2, 1, 3}, {-3, 2, 7}, {0, 2, 10}, {5, 2, 15}};
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << c.offset << "," << c.origin);
    stream.Seek(c.offset, c.origin);
    EXPECT_EQ(stream.GetPosition(), c.position);
  }
  stream.Seek(-3, 2);
  stream.ReadBuffer(buffer, 3);
  EXPECT_EQ(std::string(buffer, 3), "hij");
}

TEST_F(FileStream, PositionsBeyond32BitsAreRefused) {
  const std::string name = Path("sparse.bin");
  const std::string refused = name + " file operation invalid.";
  struct Case {
    int64_t size;
    bool fits;
  };
  const Case cases[] = {{INT32_MAX, true}, {int64_t{INT32_MAX} + 1, false}, {int64_t{3} << 30, false}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.size);
    Put("sparse.bin", "");
    ASSERT_EQ(truncate(name.c_str(), c.size), 0);  // sparse: costs no disk
    PortFileStream_t stream;
    stream.ReadOpen(name.c_str());
    stream.Seek(100, 0);
    if (c.fits) {
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
