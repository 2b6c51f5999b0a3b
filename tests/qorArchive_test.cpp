#include "src/qorArchive.h"

#include "gtest/gtest.h"

namespace {

TEST(QorArchive, MergeModeByExtensionIgnoringCase) {
  struct Case {
    const char* ext;
    int merge_mode;
  } cases[] = {
      {".PB", kQorMergeArchive},  {".pb", kQorMergeArchive},   {".MB", kQorMergeOwnHeader},
      {".aB", kQorMergeOwnHeader}, {".tmx", kQorMergeOwnHeader}, {".TB", kQorMergeRaw},
      {".tm", kQorMergePlain},    {".TMXA", kQorMergePlain},   {".P", kQorMergePlain},
      {"", kQorMergePlain},       {".", kQorMergePlain},       {"PB", kQorMergePlain},
  };
  for (const Case& c : cases) EXPECT_EQ(QorMergeModeOfExt(c.ext), c.merge_mode) << c.ext;
}

}  // namespace
