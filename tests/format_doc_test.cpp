// Runs every worked example of docs/format.md: payloads are compressed and expanded, bad
// payloads must be refused, and archives are linked by the built qorLink from the response
// file and files given beside them, then walked by the archive reader.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"
#include "src/archivereader.h"
#include "tests/support/linkfixture.h"

namespace {

// A fenced block opened by "```KIND ROLE LABEL [ARG]", e.g. "```hex payload mixed".
struct DocBlock_t {
  std::string kind, role, label, arg;
  std::string text;   // the lines between the fences
  std::string bytes;  // for hex blocks: the bytes the text spells; '|' separators ignored
};

std::string HexBytes(const std::string& aText) {
  std::istringstream words(aText);
  std::string bytes, word;
  while (words >> word) {
    if (word == "|") continue;
    EXPECT_EQ(word.size(), 2u) << word;
    bytes += static_cast<char>(std::stoi(word, nullptr, 16));
  }
  return bytes;
}

std::vector<DocBlock_t> ReadDocBlocks() {
  std::ifstream doc(std::string(QOR_SOURCE_DIR) + "/docs/format.md");
  EXPECT_TRUE(doc.good());
  std::vector<DocBlock_t> blocks;
  std::string line;
  while (std::getline(doc, line)) {
    if (line.compare(0, 3, "```") != 0 || line.size() == 3) continue;
    DocBlock_t block;
    std::istringstream(line.substr(3)) >> block.kind >> block.role >> block.label >> block.arg;
    while (std::getline(doc, line) && line != "```") block.text += line + "\n";
    if (block.kind == "hex") block.bytes = HexBytes(block.text);
    blocks.push_back(block);
  }
  return blocks;
}

const DocBlock_t* Find(const std::vector<DocBlock_t>& aBlocks, const std::string& aRole,
                       const std::string& aLabel) {
  for (const DocBlock_t& b : aBlocks) {
    if (b.role == aRole && b.label == aLabel) return &b;
  }
  return nullptr;
}

std::string Drain(PortMemoryStream_t& aStream) {
  std::string bytes(static_cast<size_t>(aStream.GetLength()), '\0');
  aStream.Seek(0, 0);
  if (!bytes.empty()) aStream.ReadBuffer(&bytes[0], static_cast<int>(bytes.size()));
  return bytes;
}

std::string Compress(const std::string& aInput) {
  PortMemoryStream_t src, dst;
  src.WriteBuffer(aInput.data(), static_cast<int>(aInput.size()));
  src.Seek(0, 0);
  qorCompressor_t().compress(dst, src, static_cast<int>(aInput.size()));
  return Drain(dst);
}

// The expanded bytes, or "refused" when the expander rejects the payload.
std::string ExpandOrRefuse(const std::string& aPayload, int aRealSize) {
  PortMemoryStream_t src, dst;
  src.WriteBuffer(aPayload.data(), static_cast<int>(aPayload.size()));
  src.Seek(0, 0);
  try {
    qorExpander_t().expand(dst, src, static_cast<int>(aPayload.size()), aRealSize);
  } catch (const char* text) {
    return std::string("refused:") + text;
  }
  return Drain(dst);
}

TEST(FormatDoc, PayloadExamplesCompressAndExpand) {
  const std::vector<DocBlock_t> blocks = ReadDocBlocks();
  int checked = 0;
  for (const DocBlock_t& input : blocks) {
    if (input.role != "payload-input") continue;
    SCOPED_TRACE(input.label);
    const DocBlock_t* payload = Find(blocks, "payload", input.label);
    ASSERT_NE(payload, nullptr);
    EXPECT_EQ(Compress(input.bytes), payload->bytes);
    EXPECT_EQ(ExpandOrRefuse(payload->bytes, static_cast<int>(input.bytes.size())), input.bytes);
    ++checked;
  }
  EXPECT_EQ(checked, 5);
}

TEST(FormatDoc, MalformedPayloadsAreRefused) {
  int checked = 0;
  for (const DocBlock_t& bad : ReadDocBlocks()) {
    if (bad.role != "bad-payload") continue;
    SCOPED_TRACE(bad.label);
    EXPECT_EQ(ExpandOrRefuse(bad.bytes, std::stoi(bad.arg)), "refused: invalid file format.");
    ++checked;
  }
  EXPECT_EQ(checked, 7);
}

TEST(FormatDoc, ArchiveExamplesAreWhatQorLinkWrites) {
  const std::vector<DocBlock_t> blocks = ReadDocBlocks();
  int checked = 0;
  for (const DocBlock_t& archive : blocks) {
    if (archive.role != "archive") continue;
    SCOPED_TRACE(archive.label);
    LinkTempDir_t dir;
    const DocBlock_t* resp = Find(blocks, "response", archive.label);
    ASSERT_NE(resp, nullptr);
    dir.Put("doc.ls", resp->text);
    for (const DocBlock_t& file : blocks) {
      if (file.role == "file" && file.label == archive.label) dir.Put(file.arg, file.bytes);
    }
    ToolRun_t run = RunTool(QOR_LINK_BIN, {"doc.ls"}, dir.Path());
    ASSERT_EQ(run.status, 0) << run.err;
    EXPECT_EQ(ReadBytes(dir / "doc.LB"), archive.bytes);

    qorArchiveReader_t reader((dir / "doc.LB").c_str());
    while (reader.Next()) EXPECT_TRUE(reader.CheckPadding());
    EXPECT_EQ(reader.State(), kQorWalkEndRecord);
    EXPECT_TRUE(reader.Problems().empty());
    ++checked;
  }
  EXPECT_EQ(checked, 3);
}

}  // namespace
