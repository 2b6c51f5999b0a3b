// Property: a link over generated lists and inputs writes an archive that qorUnpack test accepts
// and whose entries hold the inputs, or fails with a message of the tool's and leaves nothing.
#include <sys/stat.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <set>
#include <string>
#include <vector>

#include "fuzz/archivebytes.h"
#include "fuzz/fuzzbytes.h"
#include "fuzz/fuzzscratch.h"
#include "port/src/string.h"
#include "src/linkrun.h"
#include "src/unpacktest.h"

namespace {

const char* const kDirectives[] = {"%comp", "%nocomp", "%Compress", "%NOCOMPRESS",
                                   "%setfilename", "%nosetfilename", "%noendrecord x"};
const char* const kComments[] = {"", "  \t", "; a comment", "#x.dat id=3"};
const char* const kExtensions[] = {".dat", "", ".tim", ".tex2d", ".MB", ".ab",
                                   ".TMX", ".PB", ".tb"};
enum Kind_t { kPlain, kOwn, kArchive, kRaw };

Kind_t KindOf(int aExtension) {
  if (aExtension >= 4 && aExtension <= 6) return kOwn;
  if (aExtension == 7) return kArchive;
  if (aExtension == 8) return kRaw;
  return kPlain;
}

// Builds the response file and the inputs from the fuzz bytes and records what the archive
// must then hold. `sound` stays true while every input is a well-formed file of its kind;
// `mayFail` turns true with the first line that may make the run fail.
class LinkCase_t {
 public:
  LinkCase_t(FuzzBytes_t& aBytes, const FuzzScratch_t& aDir) : bytes(aBytes), dir(aDir) {}

  void Generate() {
    const std::string eol = bytes.Below(2) == 0 ? "\n" : "\r\n";
    const int lines = bytes.Below(10);
    for (int i = 0; i < lines; ++i) {
      const int kind = bytes.Below(16);
      if (kind == 0) {
        response += kComments[bytes.Below(4)];
      } else if (kind == 1) {
        const int which = bytes.Below(8);
        if (which == 7) {
          response += "%bogus";
          mayFail = true;
        } else {
          response += kDirectives[which];
          if (which == 6) endRecord = false;
        }
      } else {
        FileLine(i);
      }
      response += eol;
    }
    if (bytes.Below(2) == 0 && !response.empty()) response.resize(response.size() - eol.size());
    FuzzWriteFile(dir / "list.ls", response);
  }

  std::string response;
  std::vector<std::string> entries;  // the data each archive entry must hold, in order
  bool sound = true;
  bool mayFail = false;
  bool endRecord = true;

 private:
  void FileLine(int aLine) {
    const int extension = bytes.Below(9);
    const Kind_t kind = KindOf(extension);
    const bool long_name = bytes.Below(16) == 0;
    std::string base = (long_name ? std::string(40 + bytes.Below(16), 'L') : "f") +
                       std::to_string(aLine) + kExtensions[extension];
    const int presence = bytes.Below(16);
    if (presence == 0) {
      mayFail = true;  // listed but missing
    } else if (presence == 1) {
      mkdir((dir / base).c_str(), 0755);
      mayFail = true;  // a directory
    } else {
      FuzzWriteFile(dir / base, Contents(kind));
    }
    if (long_name && (kind == kPlain || kind == kOwn)) mayFail = true;
    response += dir / base;
    Options(kind == kPlain || kind == kOwn);
  }

  // Up to three option words; the ones that may fail are noted for the modes that read them.
  void Options(bool aRead) {
    static const char* const kWords[] = {"id=5", "ID=0x10", "id=", "id=-1", "id=12a",
                                         "comp", "nocomp", "compress", "NOCOMPRESS",
                                         "setfilename", "nosetfilename", "junk"};
    int comp_words = 0;
    int name_words = 0;
    const int words = bytes.Below(4);
    for (int i = 0; i < words; ++i) {
      const int which = bytes.Below(12);
      response += std::string(bytes.Below(2) == 0 ? " " : "\t") + kWords[which];
      if (which == 4) mayFail = mayFail || aRead;
      if (which >= 5 && which <= 8) ++comp_words;
      if (which == 9 || which == 10) ++name_words;
    }
    if (aRead && (comp_words > 1 || name_words > 1)) mayFail = true;
  }

  // An entry as the tools write it, unpadded: a header of any type but the end record's, an
  // optional name block, and the data stored or compressed. Records the data it holds.
  std::string SoundEntry() {
    std::string data = bytes.Sized(4);
    const int name_size = 16 * bytes.Below(4);
    const bool compressed = bytes.Below(2) == 1;
    std::string name_block = bytes.Take(name_size);
    name_block.resize(name_size, 'n');
    if (name_size > 0) name_block.back() = '\0';
    std::string body = compressed ? FuzzCompress(data) : data;
    uint8_t type = bytes.Byte();
    if (type == 0xFF) type = 0x7F;
    const uint32_t real_size = compressed ? static_cast<uint32_t>(data.size()) : bytes.Le32();
    const std::string header =
        FuzzHeader(type, static_cast<uint8_t>(name_size | (compressed ? 1 : 0)), bytes.Byte(),
                   static_cast<uint32_t>(16 + name_size + body.size()), bytes.Le32(), real_size);
    entries.push_back(data);
    return header + name_block + body;
  }

  // Either a well-formed file of its kind or, one time in four, arbitrary bytes.
  std::string Contents(Kind_t aKind) {
    if (aKind == kPlain) {
      std::string data = bytes.Sized(4);
      entries.push_back(data);
      return data;
    }
    if (bytes.Below(4) == 0) {
      sound = false;
      mayFail = true;
      return bytes.Sized(4);
    }
    if (aKind == kOwn) return SoundEntry() + bytes.Take(bytes.Below(8));  // the rest is ignored
    if (aKind == kRaw) return SoundEntry();
    std::string archive;
    for (int n = bytes.Below(4); n > 0; --n) archive += SoundEntry();
    std::string end_record = "\xFF" + bytes.Take(15 + bytes.Below(8));
    end_record.resize(std::max<size_t>(end_record.size(), 16), '\0');
    return archive + end_record;
  }

  FuzzBytes_t& bytes;
  const FuzzScratch_t& dir;
};

// Runs the link; returns the text it failed with, or "" when it completed.
std::string Link(const std::string& aResponse, const std::string& aArchive) {
  try {
    LinkRun(aResponse.c_str(), aArchive.c_str());
  } catch (const std::exception& e) {
    return std::string("std::exception ") + e.what();
  } catch (const PortString_t& text) {
    return text.c_str();
  } catch (const char* text) {
    return text;
  }
  return "";
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  static FuzzScratch_t dir;
  dir.Clear();
  FuzzBytes_t bytes(aData, aSize);
  LinkCase_t link(bytes, dir);
  link.Generate();
  const std::set<std::string> before = dir.Listing();

  const std::string archive = dir / "out.LB";
  const std::string failure = Link(dir / "list.ls", archive);
  if (!failure.empty()) {
    FuzzRequire(link.mayFail && IsLinkFailureText(failure), failure.c_str());
    FuzzRequire(dir.Listing() == before, "a failed link left files behind");
    return 0;
  }
  std::set<std::string> after = before;
  after.insert("out.LB");
  FuzzRequire(dir.Listing() == after, "the link wrote outside its archive");
  const int problems = UnpackTest(archive.c_str(), FuzzNullOutput());
  if (!link.sound) return 0;
  FuzzRequire(problems == 0, "qorUnpack test refuses the archive");
  FuzzArchiveContent_t content;
  FuzzRequire(FuzzReadArchive(archive, content), "the archive cannot be walked");
  FuzzRequire(content.data == link.entries, "the entries do not hold the inputs");
  FuzzRequire(content.endRecord == link.endRecord, "end record present or missing wrongly");
  return 0;
}
