// What the fuzz targets share around the code under test: a failed property that stops the
// run, a private scratch directory per process whose contents are cleared between inputs, and
// whole-file reads and writes. The scratch directory is the only place the targets write.
#ifndef FUZZ_FUZZSCRATCH_H
#define FUZZ_FUZZSCRATCH_H

#include <cstdio>
#include <set>
#include <string>

// Aborts with `aWhat` on standard error when `aHolds` is false, so libFuzzer keeps the input.
void FuzzRequire(bool aHolds, const char* aWhat);

// Where the programs' reports go in a fuzz run: /dev/null, opened once.
FILE* FuzzNullOutput();

class FuzzScratch_t {
 public:
  FuzzScratch_t();  // mkdtemp under $TMPDIR or /tmp
  ~FuzzScratch_t();
  FuzzScratch_t(const FuzzScratch_t&) = delete;
  FuzzScratch_t& operator=(const FuzzScratch_t&) = delete;

  const std::string& Path() const { return path; }
  std::string operator/(const std::string& aName) const { return path + "/" + aName; }
  void Clear() const;  // removes everything inside, making the directory writable again
  // Every path below the directory, relative, directories with a trailing '/'.
  std::set<std::string> Listing() const;

 private:
  std::string path;
};

std::string FuzzReadFile(const std::string& aPath);  // empty when missing
void FuzzWriteFile(const std::string& aPath, const std::string& aBytes);

#endif
