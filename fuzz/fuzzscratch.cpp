#include "fuzz/fuzzscratch.h"

#include <ftw.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <vector>

void FuzzRequire(bool aHolds, const char* aWhat) {
  if (aHolds) return;
  fprintf(stderr, "fuzz property failed: %s\n", aWhat);
  abort();
}

FILE* FuzzNullOutput() {
  static FILE* sink = fopen("/dev/null", "w");
  FuzzRequire(sink != nullptr, "/dev/null cannot be opened");
  return sink;
}

FuzzScratch_t::FuzzScratch_t() {
  const char* base = getenv("TMPDIR");
  std::string pattern = std::string(base != nullptr && *base != '\0' ? base : "/tmp") +
                        "/qorfuzz-XXXXXX";
  std::vector<char> buffer(pattern.begin(), pattern.end());
  buffer.push_back('\0');
  FuzzRequire(mkdtemp(buffer.data()) != nullptr, "mkdtemp");
  path = buffer.data();
}

FuzzScratch_t::~FuzzScratch_t() {
  Clear();
  rmdir(path.c_str());
}

namespace {

// nftw callbacks take no context; the walks run one at a time in one thread.
std::set<std::string>* listing_out = nullptr;
size_t listing_prefix = 0;

int RemoveOne(const char* aName, const struct stat*, int aFlag, struct FTW* aWhere) {
  if (aWhere->level == 0) return 0;
  if (aFlag == FTW_DP) return rmdir(aName) == 0 ? 0 : -1;
  return unlink(aName) == 0 ? 0 : -1;
}

// A directory a test made unreadable cannot be walked; opening it up first lets nftw enter.
int OpenUp(const char* aName, const struct stat* aInfo, int aFlag, struct FTW*) {
  if (aFlag == FTW_D || aFlag == FTW_DNR) chmod(aName, (aInfo->st_mode & 07777) | 0700);
  return 0;
}

int ListOne(const char* aName, const struct stat*, int aFlag, struct FTW* aWhere) {
  if (aWhere->level == 0) return 0;
  std::string name = std::string(aName).substr(listing_prefix);
  if (aFlag == FTW_D || aFlag == FTW_DNR) name += "/";
  listing_out->insert(name);
  return 0;
}

}  // namespace

void FuzzScratch_t::Clear() const {
  nftw(path.c_str(), OpenUp, 16, FTW_PHYS);
  FuzzRequire(nftw(path.c_str(), RemoveOne, 16, FTW_DEPTH | FTW_PHYS) == 0,
              "scratch directory could not be cleared");
}

std::set<std::string> FuzzScratch_t::Listing() const {
  std::set<std::string> names;
  listing_out = &names;
  listing_prefix = path.size() + 1;
  nftw(path.c_str(), ListOne, 16, FTW_PHYS);
  listing_out = nullptr;
  return names;
}

std::string FuzzReadFile(const std::string& aPath) {
  std::ifstream in(aPath, std::ios::binary);
  return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}

void FuzzWriteFile(const std::string& aPath, const std::string& aBytes) {
  std::ofstream out(aPath, std::ios::binary | std::ios::trunc);
  out.write(aBytes.data(), static_cast<std::streamsize>(aBytes.size()));
  FuzzRequire(static_cast<bool>(out), "scratch file could not be written");
}
