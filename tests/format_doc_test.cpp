// Runs every worked example of docs/format.md: payloads are compressed and expanded, bad
// payloads must be refused, and archives are linked by the built qorLink from the response
// file and files given beside them.
#include <gtest/gtest.h>

#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/linkfixture.h"
#include "tests/support/teststream.h"

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

std::string Compress(const std::string& aInput) {
  TestStream_t src(aInput);
  TestStream_t dst;
  qorCompressor_t().compress(dst, src, static_cast<int>(aInput.size()));
  return dst.Content();
}

// Each input compresses to its payload and expands back; each bad payload is refused.
TEST(FormatDoc, PayloadExamplesCompressExpandOrAreRefused) {
  const std::vector<DocBlock_t> blocks = ReadDocBlocks();
  int inputs = 0;
  int bad = 0;
  for (const DocBlock_t& block : blocks) {
    SCOPED_TRACE(block.label);
    if (block.role == "payload-input") {
      const DocBlock_t* payload = Find(blocks, "payload", block.label);
      ASSERT_NE(payload, nullptr);
      EXPECT_EQ(Compress(block.bytes), payload->bytes);
      EXPECT_EQ(Expand(payload->bytes, static_cast<uint32_t>(block.bytes.size())), block.bytes);
      ++inputs;
    } else if (block.role == "bad-payload") {
      EXPECT_EQ(FailureText([&] { Expand(block.bytes, std::stoi(block.arg)); }),
                " invalid file format.");
      ++bad;
    }
  }
  EXPECT_EQ(inputs, 5);
  EXPECT_EQ(bad, 7);
}

TEST(FormatDoc, ArchiveExamplesAreWhatQorLinkWrites) {
  const std::vector<DocBlock_t> blocks = ReadDocBlocks();
  int checked = 0;
  for (const DocBlock_t& archive : blocks) {
    if (archive.role != "archive") continue;
    SCOPED_TRACE(archive.label);
    const DocBlock_t* resp = Find(blocks, "response", archive.label);
    ASSERT_NE(resp, nullptr);
    FileSet_t files;
    for (const DocBlock_t& file : blocks) {
      if (file.role == "file" && file.label == archive.label) files[file.arg] = file.bytes;
    }
    LinkTempDir_t dir;
    EXPECT_EQ(LinkFiles(dir, files, resp->text), archive.bytes);
    ++checked;
  }
  EXPECT_EQ(checked, 3);
}

}  // namespace
