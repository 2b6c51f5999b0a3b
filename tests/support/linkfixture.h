// Helpers for tests of the link tool: a private temporary directory per test, whole-file
// reads and writes, a run of a built program capturing its exit status and both outputs,
// and archive bytes written out independently of the code under test.
#ifndef TESTS_SUPPORT_LINKFIXTURE_H
#define TESTS_SUPPORT_LINKFIXTURE_H

#include <cstdint>
#include <string>
#include <vector>

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
