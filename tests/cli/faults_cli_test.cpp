// The built qorLink under faults: a full device, missing directories, unopenable and vanishing
// inputs, inputs past the stream range, hostile response files and very long lists. Each case
// checks the exact message and exit status and what is left on disk.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "tests/support/linkfixture.h"

namespace {

const off_t kThreeGiB = off_t(3) << 30;

ToolRun_t Link(const LinkTempDir_t& aDir, const std::vector<std::string>& aArgs) {
  return RunTool(QOR_LINK_BIN, aArgs, aDir.Path());
}

// The entry qorLink writes for a plain file stored as is, without name block.
std::string StoredEntry(const std::string& aData, const char aMagic[4]) {
  const size_t size = 16 + aData.size();
  return EntryHeader(1, 0, 0, static_cast<uint32_t>(size), aMagic, 0) + aData +
         Zeros((64 - size % 64) % 64);
}

bool IsCharDevice(const std::string& aPath) {
  struct stat info;
  return stat(aPath.c_str(), &info) == 0 && S_ISCHR(info.st_mode);
}

void MakeSparse(const std::string& aPath, off_t aSize) {
  int fd = open(aPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
  ASSERT_GE(fd, 0);
  ASSERT_EQ(0, ftruncate(fd, aSize));
  close(fd);
}

// Sets environment variables for the programs the test runs, and restores them afterwards.
class ScopedEnv_t {
 public:
  void Set(const char* aName, const std::string& aValue) {
    const char* old = getenv(aName);
    saved.push_back({aName, old != nullptr, old != nullptr ? old : ""});
    setenv(aName, aValue.c_str(), 1);
  }
  ~ScopedEnv_t() {
    for (auto it = saved.rbegin(); it != saved.rend(); ++it) {
      if (it->existed) setenv(it->name.c_str(), it->value.c_str(), 1);
      else unsetenv(it->name.c_str());
    }
  }

 private:
  struct Saved_t {
    std::string name;
    bool existed;
    std::string value;
  };
  std::vector<Saved_t> saved;
};

TEST(LinkFaults, FullDeviceIsAWriteErrorAndStays) {
  // "-o /dev/full" would name /dev/full.LB (an extension is added), so the device is reached
  // through a link that already has one.
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  dir.Put("list.ls", "a.dat\n");
  ASSERT_EQ(0, symlink("/dev/full", (dir / "full.LB").c_str()));
  ToolRun_t run = Link(dir, {"list.ls", "-o", "full.LB"});
  EXPECT_EQ(1, run.status);
  EXPECT_EQ("Exception : full.LB write error.\n", run.err);
  EXPECT_EQ("", run.out);
  EXPECT_TRUE(IsCharDevice("/dev/full"));
  EXPECT_TRUE(IsCharDevice(dir / "full.LB")) << "the link to the device is kept";
}

TEST(LinkFaults, ArchiveIntoAPipe) {
  // The archive is written strictly front to back, so a FIFO takes it whole.
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  dir.Put("list.ls", "%nocomp\na.dat\n");
  ASSERT_EQ(0, mkfifo((dir / "pipe.LB").c_str(), 0600));
  // The read end is open before qorLink opens the FIFO, so nothing written can be lost
  // (a reader started later may miss it all and wait for ever); reading after the run ends
  // stops at end of file, since no writer is left.
  int reader = open((dir / "pipe.LB").c_str(), O_RDONLY | O_NONBLOCK);
  ASSERT_GE(reader, 0);
  ToolRun_t run = Link(dir, {"list.ls", "-o", "pipe.LB"});
  std::string received;
  char buffer[256];
  for (ssize_t got; (got = read(reader, buffer, sizeof buffer)) > 0;) {
    received.append(buffer, static_cast<size_t>(got));
  }
  close(reader);
  EXPECT_EQ(0, run.status);
  EXPECT_EQ("", run.err);
  EXPECT_EQ(StoredEntry("hello", "DAT") + EndRecord(), received);
}

TEST(LinkFaults, MissingOutputDirectoryCreatesNothing) {
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  dir.Put("list.ls", "a.dat\n");
  ToolRun_t run = Link(dir, {"list.ls", "-o", "nodir/out.LB"});
  EXPECT_EQ(1, run.status);
  EXPECT_EQ("Exception : nodir/out.LB could't create.\n", run.err);
  EXPECT_FALSE(FileExists(dir / "nodir"));
}

TEST(LinkFaults, UnopenableListedNamesRemoveTheArchive) {
  struct Case {
    const char* list;
    const char* err;
  } cases[] = {
      {"a.dat\nsub\n", "Exception : sub could't open.\n"},
      {"a.dat\nsub/\n", "Exception : sub/ could't open.\n"},
      {"a.dat\nnothere.dat\n", "Exception : nothere.dat could't open.\n"},
      {"a.dat\ndangling.dat\n", "Exception : dangling.dat could't open.\n"},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put("a.dat", "hello");
    dir.Put("sub/b.dat", "inside");
    ASSERT_EQ(0, symlink("gone.dat", (dir / "dangling.dat").c_str()));
    dir.Put("list.ls", c.list);
    ToolRun_t run = Link(dir, {"list.ls"});
    EXPECT_EQ(1, run.status) << c.list;
    EXPECT_EQ(c.err, run.err) << c.list;
    EXPECT_FALSE(FileExists(dir / "list.LB")) << c.list;
    EXPECT_EQ("inside", ReadBytes(dir / "sub/b.dat")) << c.list;
  }
}

TEST(LinkFaults, ListedFileVanishingBetweenLines) {
  // The preloaded library removes b.dat the moment a.dat is opened: after line 1 was read,
  // before line 2 is.
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  dir.Put("b.dat", "world");
  dir.Put("list.ls", "a.dat\nb.dat\n");
  ScopedEnv_t env;
  env.Set("QOR_VANISH_AFTER", "a.dat");
  env.Set("QOR_VANISH_FILE", dir / "b.dat");
  const char* asan = getenv("ASAN_OPTIONS");
  env.Set("ASAN_OPTIONS", std::string(asan != nullptr ? asan : "") + ":verify_asan_link_order=0");
  env.Set("LD_PRELOAD", QOR_VANISH_SHIM);
  ToolRun_t run = Link(dir, {"list.ls"});
  EXPECT_EQ(1, run.status);
  EXPECT_EQ("Exception : b.dat could't open.\n", run.err);
  EXPECT_FALSE(FileExists(dir / "b.dat")) << "the file did vanish";
  EXPECT_FALSE(FileExists(dir / "list.LB"));
  EXPECT_EQ("hello", ReadBytes(dir / "a.dat"));
}

TEST(LinkFaults, ListedFileShorterThanItsMeasuredLength) {
  // A sysfs file measures 4096 bytes and holds a few: it reads like a file shrinking under
  // the tool, stored or compressed.
  const std::string kShrinking = "/sys/devices/system/cpu/online";
  struct stat info;
  if (stat(kShrinking.c_str(), &info) != 0 || info.st_size != 4096) {
    GTEST_SKIP() << kShrinking << " is not a 4096-byte sysfs file here";
  }
  for (const char* option : {"nocomp", "comp"}) {
    LinkTempDir_t dir;
    dir.Put("list.ls", kShrinking + " " + option + "\n");
    ToolRun_t run = Link(dir, {"list.ls"});
    EXPECT_EQ(1, run.status) << option;
    EXPECT_EQ("Exception : " + kShrinking + " read error.\n", run.err) << option;
    EXPECT_FALSE(FileExists(dir / "list.LB")) << option;
  }
}

TEST(LinkFaults, InputsPastTheStreamRange) {
  struct Case {
    const char* list;
    const char* err;
  } cases[] = {
      {"a.dat\nbig.dat nocomp\n", "Exception : big.dat file operation invalid.\n"},
      {"a.dat\nbig.dat\n", "Exception : big.dat file operation invalid.\n"},
      {"a.dat\nbig.TB\n", "Exception : big.TB file operation invalid.\n"},
  };
  for (const Case& c : cases) {
    LinkTempDir_t dir;
    dir.Put("a.dat", "hello");
    MakeSparse(dir / "big.dat", kThreeGiB);
    MakeSparse(dir / "big.TB", kThreeGiB);
    dir.Put("list.ls", c.list);
    ToolRun_t run = Link(dir, {"list.ls"});
    EXPECT_EQ(1, run.status) << c.list;
    EXPECT_EQ(c.err, run.err) << c.list;
    EXPECT_FALSE(FileExists(dir / "list.LB")) << c.list;
  }
}

TEST(LinkFaults, ResponseFilePastTheStreamRange) {
  LinkTempDir_t dir;
  MakeSparse(dir / "huge.ls", kThreeGiB);
  ToolRun_t run = Link(dir, {"huge.ls"});
  EXPECT_EQ(1, run.status);
  EXPECT_EQ("Exception : huge.ls file operation invalid.\n", run.err);
  EXPECT_FALSE(FileExists(dir / "huge.LB"));
}

TEST(LinkFaults, ResponseFileWithMegabyteLinesAndNulBytes) {
  const std::string megabyte(1 << 20, 'x');
  LinkTempDir_t dir;
  dir.Put("a.dat", "hello");
  dir.Put("b.dat", "bye");
  // A 1 MB comment, a line cut short by a NUL, a line that begins with one, 1 MB of unknown
  // option words, and a NUL inside a comment.
  std::string list = "%nocomp\n;" + megabyte + "\n";
  list += std::string("a.dat\0 b.dat\n", 13);
  list += std::string("\0b.dat\n", 7);
  list += "b.dat " + megabyte + "\n";
  list += std::string("# \0\n", 4);
  dir.Put("list.ls", list);
  ToolRun_t run = Link(dir, {"list.ls"});
  EXPECT_EQ(0, run.status);
  EXPECT_EQ("", run.err);
  EXPECT_EQ(StoredEntry("hello", "DAT") + StoredEntry("bye", "DAT") + EndRecord(),
            ReadBytes(dir / "list.LB"));
}

TEST(LinkFaults, ResponseFileWithAMegabyteName) {
  LinkTempDir_t dir;
  const std::string name(1 << 20, 'n');
  dir.Put("a.dat", "hello");
  dir.Put("list.ls", "a.dat\n" + name + "\n");
  ToolRun_t run = Link(dir, {"list.ls"});
  EXPECT_EQ(1, run.status);
  EXPECT_EQ("Exception : " + name + " could't open.\n", run.err);
  EXPECT_FALSE(FileExists(dir / "list.LB"));
}

TEST(LinkFaults, TwentyThousandListedFiles) {
  const int kFiles = 20000;
  LinkTempDir_t dir;
  std::string list = "%nocomp\n";
  std::string expected;
  for (int i = 0; i < kFiles; ++i) {
    const std::string name = "f" + std::to_string(i) + ".d";
    WriteBytes(dir / name, std::to_string(i));
    list += name + "\n";
    expected += StoredEntry(std::to_string(i), "D\0\0");
  }
  dir.Put("list.ls", list);
  ToolRun_t run = Link(dir, {"list.ls"});
  EXPECT_EQ(0, run.status);
  EXPECT_EQ("", run.err);
  EXPECT_TRUE(ReadBytes(dir / "list.LB") == expected + EndRecord())
      << "the archive differs; its length is " << ReadBytes(dir / "list.LB").size();
}

}  // namespace
