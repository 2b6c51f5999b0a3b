// Helpers for tests of the link tool: a private temporary directory per test, whole-file
// reads and writes, a run of a built program capturing its exit status and both outputs,
// and archive bytes written out independently of the code under test.
#ifndef TESTS_SUPPORT_LINKFIXTURE_H
#define TESTS_SUPPORT_LINKFIXTURE_H

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "gtest/gtest.h"
#include "port/src/string.h"

// A fresh directory from mkdtemp, removed with everything in it on destruction.
class LinkTempDir_t {
 public:
  LinkTempDir_t();
  ~LinkTempDir_t();
  LinkTempDir_t(const LinkTempDir_t&) = delete;
  LinkTempDir_t& operator=(const LinkTempDir_t&) = delete;

  const std::string& Path() const { return path; }
  std::string operator/(const std::string& aRelative) const { return path + "/" + aRelative; }
  // Writes `aBytes` to the relative name, creating the directories on the way.
  void Put(const std::string& aRelative, const std::string& aBytes) const;

 private:
  std::string path;
};

bool FileExists(const std::string& aPath);  // lstat: a dangling link exists too
std::string ReadBytes(const std::string& aPath);
void WriteBytes(const std::string& aPath, const std::string& aBytes);

struct ToolRun_t {
  int status;  // exit status, or 128 + signal
  std::string out;
  std::string err;
};

// Runs `aProgram` with `aArgs` in the directory `aCwd`, standard input empty.
ToolRun_t RunTool(const std::string& aProgram, const std::vector<std::string>& aArgs,
                  const std::string& aCwd);

// Relative name -> contents.
typedef std::map<std::string, std::string> FileSet_t;

#ifdef QOR_LINK_BIN  // only test executables know where qorLink was built
// Puts `aFiles` and the response file a.ls into `aDir`, runs the built qorLink on it and
// returns the bytes of a.LB.
inline std::string LinkFiles(const LinkTempDir_t& aDir, const FileSet_t& aFiles,
                             const std::string& aList) {
  for (const auto& file : aFiles) aDir.Put(file.first, file.second);
  aDir.Put("a.ls", aList);
  ToolRun_t run = RunTool(QOR_LINK_BIN, {"a.ls"}, aDir.Path());
  EXPECT_EQ(run.status, 0) << run.err;
  return ReadBytes(aDir / "a.LB");
}
#endif

// Runs a callable and returns the text it raised (const char* or PortString_t), or
// "<nothing raised>".
template <typename Callable>
std::string FailureText(Callable aCall) {
  try {
    aCall();
  } catch (const PortString_t& text) {
    return text.c_str();
  } catch (const char* text) {
    return text;
  }
  return "<nothing raised>";
}

// Archive bytes, little-endian, built field by field.
std::string EntryHeader(uint8_t aType, uint8_t aCompression, uint16_t aUserId,
                        uint32_t aFileSize, const char aMagic[4], uint32_t aRealSize);
std::string Zeros(size_t aCount);
std::string EndRecord();  // FF 00 0000 10000000 "END0" 00000000 and 48 zero bytes
uint32_t Le32At(const std::string& aBytes, size_t aOffset);
std::string Pattern(size_t aLength, unsigned aSeed);  // compressible, but not trivially
// The payload expanded by qorExpander_t, which checks it ends exactly at its end mark.
std::string Expand(const std::string& aPayload, uint32_t aRealSize);

#endif
