#include "src/extractdir.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <functional>
#include <string>

#include "tests/support/linkfixture.h"

namespace {

std::string CaughtText(const std::function<void()>& aRun) {
  try {
    aRun();
  } catch (const PortString_t& text) {
    return text.c_str();
  } catch (const char* text) {
    return text;
  }
  return "(nothing thrown)";
}

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

TEST(ExtractDir, ExistingFilesAreReplacedOnlyWhenForced) {
  LinkTempDir_t tmp;
  tmp.Put("out/a.dat", "old");
  qorExtractDir_t keep((tmp / "out").c_str(), false);
  PortFileStream_t strm;
  EXPECT_EQ(CaughtText([&] { keep.Create(strm, "a.dat"); }),
            tmp / "out/a.dat: already exists (-f overwrites)");
  EXPECT_EQ(ReadBytes(tmp / "out/a.dat"), "old");

  qorExtractDir_t force((tmp / "out").c_str(), true);
  force.Create(strm, "a.dat");
  strm.WriteBuffer("new", 3);
  strm.Close();
  EXPECT_EQ(ReadBytes(tmp / "out/a.dat"), "new");

  // Not even forced: the archive being read, reached under another name.
  tmp.Put("out/a.LB", "archive");
  ASSERT_EQ(symlink("a.LB", (tmp / "out/link").c_str()), 0);
  force.Protect((tmp / "out/link").c_str());
  EXPECT_EQ(CaughtText([&] { force.Create(strm, "a.LB"); }),
            tmp / "out/a.LB: is the archive being extracted");
  EXPECT_EQ(ReadBytes(tmp / "out/a.LB"), "archive");
}

TEST(ExtractDir, SymbolicLinksAreNeverFollowed) {
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
  EXPECT_EQ(CaughtText([&] { dir.Place(1, "b"); }),
            tmp / "out/0001: exists and is not a directory");
}

TEST(ExtractDir, TheDirectoryIsMadeWhenMissing) {
  LinkTempDir_t tmp;
  qorExtractDir_t dir((tmp / "new").c_str(), false);
  EXPECT_TRUE(FileExists(tmp / "new"));
  tmp.Put("file", "");
  EXPECT_EQ(CaughtText([&] { qorExtractDir_t bad((tmp / "file").c_str(), false); }),
            tmp / "file: not a directory");
}

}  // namespace
