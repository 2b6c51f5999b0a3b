// The guard that removes a failed run's archive: only a regular file, only while armed.
// File identity is checked through the built qorLink (QorLinkCli.FailureTextsAndArchiveRemoval).
#include "src/outputguard.h"

#include <sys/stat.h>
#include <unistd.h>

#include "gtest/gtest.h"
#include "tests/support/linkfixture.h"

namespace {

TEST(OutputGuard, RemovesOnlyAnArmedRegularFile) {
  LinkTempDir_t dir;
  dir.Put("armed.LB", "partial");
  dir.Put("done.LB", "complete");
  dir.Put("target.LB", "kept");
  ASSERT_EQ(mkfifo((dir / "fifo.LB").c_str(), 0600), 0);
  ASSERT_EQ(symlink("target.LB", (dir / "link.LB").c_str()), 0);
  for (const char* name : {"armed.LB", "fifo.LB", "link.LB", "missing.LB"}) {
    qorOutputGuard_t guard;
    guard.Arm((dir / name).c_str());
  }
  {
    qorOutputGuard_t guard;
    guard.Arm((dir / "done.LB").c_str());
    guard.Disarm();
  }
  EXPECT_FALSE(FileExists(dir / "armed.LB"));
  EXPECT_TRUE(FileExists(dir / "fifo.LB"));
  EXPECT_TRUE(FileExists(dir / "link.LB"));
  EXPECT_EQ(ReadBytes(dir / "target.LB"), "kept");
  EXPECT_EQ(ReadBytes(dir / "done.LB"), "complete");
}

}  // namespace
