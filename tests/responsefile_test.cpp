#include "src/responsefile.h"

#include "gtest/gtest.h"
#include "src/entrywriter.h"

namespace {

TEST(ResponseFile, MergeModeByExtensionIgnoringCase) {
  struct Case {
    const char* ext;
    int merge_mode;
  } cases[] = {
      {".PB", kQorMergeArchive},  {".pb", kQorMergeArchive},   {".MB", kQorMergeOwnHeader},
      {".aB", kQorMergeOwnHeader}, {".tmx", kQorMergeOwnHeader}, {".TB", kQorMergeRaw},
      {".tm", kQorMergePlain},    {".TMXA", kQorMergePlain},   {".P", kQorMergePlain},
      {"", kQorMergePlain},       {".", kQorMergePlain},       {"PB", kQorMergePlain},
  };
  for (const Case& c : cases) EXPECT_EQ(MergeModeOf(c.ext), c.merge_mode) << c.ext;
}

}  // namespace
