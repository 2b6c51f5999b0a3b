// Property: the line reader and tokenizer split any text exactly as a plain split at line feeds
// and separators does, also over a stream that delivers short reads and across failed reads.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/stringreader.h"
#include "port/src/stringtoken.h"

namespace {

// Delivers at most `cap` bytes per Read (0: no cap), like a file shrinking under the reader.
class ShortReadStream_t : public PortStream_t {
 public:
  ShortReadStream_t(const std::string& aText, int aCap) : text(aText), pos(0), cap(aCap) {
    SetReadable();
  }
  int Write(const void*, int) override { return 0; }
  int Read(void* aPtr, int aLength) override {
    int n = static_cast<int>(text.size()) - pos;
    if (n > aLength) n = aLength;
    if (cap > 0 && n > cap) n = cap;
    memcpy(aPtr, text.data() + pos, n);
    pos += n;
    return n;
  }
  void Seek(PortStreamUnit_t aPos, int) override { pos = aPos; }
  PortStreamUnit_t GetPosition() override { return pos; }
  PortStreamUnit_t GetLength() override { return static_cast<PortStreamUnit_t>(text.size()); }

 private:
  std::string text;
  PortStreamUnit_t pos;
  int cap;
};

std::vector<std::string> PlainLines(const std::string& aText) {
  std::vector<std::string> lines;
  size_t from = 0;
  while (from < aText.size()) {
    size_t end = aText.find('\n', from);
    size_t next = end == std::string::npos ? aText.size() : end + 1;
    if (end == std::string::npos) end = aText.size();
    std::string line = aText.substr(from, end - from);
    while (!line.empty() && line.back() == '\r') line.pop_back();
    lines.push_back(line);
    from = next;
  }
  return lines;
}

std::vector<std::string> PlainWords(const std::string& aLine, const std::string& aComments) {
  const char* kSeparators = " \t\r\n";
  std::string text = aLine.substr(0, aLine.find('\0'));
  // A separator given as a comment character still only separates.
  for (size_t at = 0; at < text.size(); ++at) {
    if (aComments.find(text[at]) != std::string::npos && !strchr(kSeparators, text[at])) {
      text.resize(at);
    }
  }
  std::vector<std::string> words;
  for (size_t at = text.find_first_not_of(kSeparators); at != std::string::npos;) {
    size_t end = text.find_first_of(kSeparators, at);
    words.push_back(text.substr(at, end - at));
    at = end == std::string::npos ? end : text.find_first_not_of(kSeparators, end);
  }
  return words;
}

std::string Text(const PortString_t& aString) {
  return std::string(aString.c_str(), aString.GetLength());
}

// Parses the line and erases one word (or one index beside the list) chosen by the line.
void CheckWords(PortStringToken_t& aToken, const std::string& aLine,
                const std::string& aComments) {
  std::vector<std::string> words = PlainWords(aLine, aComments);
  const int count = aToken.parse(PortString_t(aLine.data(), static_cast<int>(aLine.size())));
  FuzzRequire(count == static_cast<int>(words.size()) && aToken.count() == count,
              "word count differs from the plain split");
  for (int i = 0; i < count; ++i) {
    FuzzRequire(Text(aToken.get(i)) == words[i], "word differs from the plain split");
  }
  const int victim = static_cast<int>(aLine.size() % (words.size() + 2)) - 1;
  bool refused = false;
  try {
    aToken.erase(victim);
  } catch (const char* text) {
    refused = strcmp(text, "Error : PortStringToken_t::erase   out of index.") == 0;
  }
  const bool inside = victim >= 0 && victim < count;
  FuzzRequire(refused != inside, "erase refused an index inside or took one outside");
  if (inside) words.erase(words.begin() + victim);
  FuzzRequire(aToken.count() == static_cast<int>(words.size()), "erase left a wrong count");
  for (int i = 0; i < aToken.count(); ++i) {
    FuzzRequire(Text(aToken.get(i)) == words[i], "erase moved the wrong words");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  FuzzBytes_t bytes(aData, aSize);
  const int cap = bytes.Below(8) == 0 ? 1 + bytes.Below(64) : 0;
  const std::string comment_arg = bytes.Take(bytes.Below(6));
  const std::string text = bytes.Rest();
  const size_t start = text.empty() ? 0 : aData[0] % (text.size() + 1);

  // setCommentChar takes the text up to its NUL, and at most four characters of it.
  std::string comments = comment_arg.substr(0, comment_arg.find('\0')).substr(0, 4);
  PortStringToken_t token;
  token.setCommentChar(comment_arg.c_str());

  ShortReadStream_t stream(text, cap);
  stream.Seek(static_cast<PortStreamUnit_t>(start), 0);
  PortStringReader_t reader(&stream);
  const std::vector<std::string> lines = PlainLines(text.substr(start));
  size_t next = 0;
  int failed_reads = 0;
  while (!reader.eof()) {
    PortString_t line;
    try {
      line = reader.gets();
    } catch (const char* text_raised) {
      FuzzRequire(cap > 0 && strstr(text_raised, " read error.") != nullptr,
                  "only a short read may fail");
      FuzzRequire(++failed_reads <= static_cast<int>(text.size()), "failed reads make no progress");
      continue;
    }
    FuzzRequire(next < lines.size(), "more lines than the plain split");
    FuzzRequire(Text(line) == lines[next], "line differs from the plain split");
    CheckWords(token, lines[next], comments);
    ++next;
  }
  FuzzRequire(next == lines.size(), "fewer lines than the plain split");
  FuzzRequire(reader.gets().GetLength() == 0, "a line past the end");
  return 0;
}
