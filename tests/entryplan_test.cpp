// How extract plans each entry: the names it may use, and which entries it keeps raw.
#include "src/entryplan.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace {

TEST(EntryPlan, SafeNamesAreSingleResponseFileWords) {
  for (const char* name : {"a.dat", "0001_THINGS.map", "x", ".profile", "caf\xC3\xA9.txt"}) {
    EXPECT_TRUE(IsSafeEntryName(name)) << name;
  }
  for (const char* name : {"", ".", "..", "a..b", "a/b", "a\\b", "a b", "a#b", "a;b", "%x", "a\x1b",
                           "a\x7f"}) {
    EXPECT_FALSE(IsSafeEntryName(name)) << name;
  }
}

uint32_t Magic(const char* aText) {
  unsigned char bytes[4] = {0, 0, 0, 0};
  memcpy(bytes, aText, strnlen(aText, 4));
  return bytes[0] | bytes[1] << 8 | bytes[2] << 16 | static_cast<uint32_t>(bytes[3]) << 24;
}

TEST(EntryPlan, DefaultNamesCarryTheMagicCodeLowerCased) {
  EXPECT_STREQ(DefaultEntryName(7, Magic("DAT")).c_str(), "0007.dat");
  EXPECT_STREQ(DefaultEntryName(12345, Magic("TEX2")).c_str(), "12345.tex2");
  EXPECT_STREQ(DefaultEntryName(0, 0).c_str(), "0000");
  EXPECT_STREQ(DefaultEntryName(3, Magic("A\0B")).c_str(), "0003.a");
}

qorArchiveEntry_t MakeEntry(uint8_t aType, uint8_t aCompression, const std::string& aBlock,
                            uint32_t aMagic, uint32_t aRealSize) {
  qorArchiveEntry_t e{};
  e.index = 5;
  e.header.fileType = aType;
  e.header.compression = aCompression;
  e.header.fileSize = static_cast<uint32_t>(16 + aBlock.size() + 10);
  e.header.magicCode = aMagic;
  e.header.realSize = aRealSize;
  memcpy(e.nameBlock, aBlock.data(), aBlock.size());
  return e;
}

std::string Block(const std::string& aName, size_t aSize) {
  return aName + std::string(aSize - aName.size(), '\0');
}

TEST(EntryPlan, OnlyEntriesQorLinkWouldWriteAgainArePlain) {
  const uint32_t dat = Magic("DAT");
  const struct {
    qorArchiveEntry_t entry;
    const char* name;
    bool compressed;
    bool set_file_name;
  } plain[] = {
      {MakeEntry(1, 0, "", dat, 0), "0005.dat", false, false},
      {MakeEntry(1, 0x11, Block("a.dat", 16), dat, 99), "a.dat", true, true},
      {MakeEntry(1, 0x30, Block(std::string(43, 'n') + ".dat", 48), dat, 0),
       "nnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnnn.dat", false, true},
  };
  for (const auto& c : plain) {
    SCOPED_TRACE(c.name);
    qorEntryPlan_t plan = PlanEntry(c.entry, true);
    EXPECT_TRUE(plan.plain);
    EXPECT_STREQ(plan.name.c_str(), c.name);
    EXPECT_EQ(plan.compressed, c.compressed);
    EXPECT_EQ(plan.setFileName, c.set_file_name);
  }
  // Another fileType, non-zero padding and unsafe names go raw as well: the extract tests
  // relink such archives byte for byte.
  const struct {
    const char* what;
    qorArchiveEntry_t entry;
  } raw[] = {
      {"stored with a realSize", MakeEntry(1, 0, "", dat, 4)},
      {"unknown method", MakeEntry(1, 2, "", dat, 0)},
      {"lower-case magic", MakeEntry(1, 0, "", Magic("dat"), 0)},
      {"magic with a dot", MakeEntry(1, 0, "", Magic("A.B"), 0)},
      {"magic of an archive", MakeEntry(1, 0, "", Magic("PB"), 0)},
      {"name gives another magic", MakeEntry(1, 0x10, Block("a.txt", 16), dat, 0)},
      {"name of a raw file", MakeEntry(1, 0x10, Block("a.tb", 16), Magic("TB"), 0)},
      {"block too long for the name", MakeEntry(1, 0x20, Block("a.dat", 32), dat, 0)},
      {"bytes after the name", MakeEntry(1, 0x10, Block("a.dat", 15) + "x", dat, 0)},
      {"unterminated block", MakeEntry(1, 0x10, "0123456789abcdef", 0, 0)},
  };
  for (const auto& c : raw) {
    SCOPED_TRACE(c.what);
    qorEntryPlan_t plan = PlanEntry(c.entry, true);
    EXPECT_FALSE(plan.plain);
    EXPECT_STREQ(plan.name.c_str(), "0005.TB");
    EXPECT_FALSE(plan.compressed || plan.setFileName);
  }
}

}  // namespace
