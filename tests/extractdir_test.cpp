// The extraction directory in process: where taken names go, and that links and non-directories
// are never written through. Refusing existing files is checked through the built qorUnpack.
#include "src/extractdir.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <string>

#include "tests/support/linkfixture.h"

namespace {

TEST(ExtractDir, TakenNamesGoIntoSubdirectoriesOfTheirOwn) {
  LinkTempDir_t tmp;
  qorExtractDir_t dir((tmp / "out").c_str(), false);
  dir.Reserve("x.ls");
  const struct {
    int index;
    const char* name;
    const char* path;
  } cases[] = {
      {0, "a.dat", "a.dat"},
      {1, "A.DAT", "0001/A.DAT"},     // letter case alone does not make a file distinct
      {2, "a.dat", "0002/a.dat"},
      {3, "0002", "0003/0002"},       // a subdirectory's name is taken as well
      {4, "x.ls", "0004/x.ls"},       // a reserved name
      {5, "0005", "0005"},
      {5, "b", "b"},
      {5, "b", "0005_1/b"},           // the entry index is taken: the next free subdirectory
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    EXPECT_STREQ(dir.Place(c.index, c.name).c_str(), c.path);
  }
  EXPECT_TRUE(FileExists(tmp / "out/0005_1"));
  EXPECT_FALSE(FileExists(tmp / "out/0005/b"));
}

TEST(ExtractDir, NeverWritesThroughLinksOrIntoNonDirectories) {
  LinkTempDir_t tmp;
  tmp.Put("outside/victim", "precious");
  tmp.Put("out/keep", "");
  ASSERT_EQ(symlink((tmp / "outside/victim").c_str(), (tmp / "out/a.dat").c_str()), 0);
  ASSERT_EQ(symlink((tmp / "outside").c_str(), (tmp / "out/0001").c_str()), 0);
  qorExtractDir_t dir((tmp / "out").c_str(), true);
  PortFileStream_t strm;
  dir.Create(strm, "a.dat");
  strm.WriteBuffer("new", 3);
  strm.Close();
  EXPECT_EQ(ReadBytes(tmp / "outside/victim"), "precious");
  EXPECT_EQ(ReadBytes(tmp / "out/a.dat"), "new");

  dir.Place(0, "b");
  EXPECT_EQ(FailureText([&] { dir.Place(1, "b"); }),
            tmp / "out/0001: exists and is not a directory");
  EXPECT_EQ(FailureText([&] { qorExtractDir_t bad((tmp / "out/a.dat").c_str(), false); }),
            tmp / "out/a.dat: not a directory");
}

}  // namespace
