// Regression tests for what fuzzing and fault injection found, each named after what it guards.
#include <sys/stat.h>

#include <climits>
#include <string>

#include "gtest/gtest.h"
#include "port/src/filestream.h"
#include "tests/support/linkfixture.h"
#include "tests/support/raisedtext.h"

namespace {

// An archive grew past 2 GiB with exit status 0, and no stream could then measure or read it.
TEST(FileStreamLimit, WriteCrossingTheStreamRangeIsRefused) {
  LinkTempDir_t dir;
  const std::string name = dir / "edge.bin";
  PortFileStream_t stream;
  stream.WriteOpen(name.c_str());
  stream.Seek(INT32_MAX - 4, 0);
  stream.WriteBuffer("full", 4);  // ends exactly at the last position the range holds
  EXPECT_EQ(RaisedText([&] { stream.WriteBuffer("x", 1); }), name + " file operation invalid.");
  EXPECT_EQ(RaisedText([&] { stream.FillChar(300, 0); }), name + " file operation invalid.");
  stream.Close();
  struct stat info;
  ASSERT_EQ(0, stat(name.c_str(), &info));
  EXPECT_EQ(static_cast<off_t>(INT32_MAX), info.st_size) << "nothing past the range was written";
}

}  // namespace
