#include "src/extractdir.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cctype>
#include <cerrno>
#include <cstring>

namespace {

std::string Folded(const PortString_t& aName) {
  std::string folded(aName.c_str(), aName.GetLength());
  for (char& ch : folded) ch = static_cast<char>(tolower(static_cast<unsigned char>(ch)));
  return folded;
}

[[noreturn]] void Fail(const PortString_t& aPath, const char* aWhat) {
  throw PortString_t::Format("%s: %s", aPath.c_str(), aWhat);
}

}  // namespace

qorExtractDir_t::qorExtractDir_t(const PortString_t& aDir, bool aForce)
    : dir(aDir), force(aForce) {
  struct stat st;
  if (stat(dir.c_str(), &st) != 0) {
    if (mkdir(dir.c_str(), 0777) != 0) Fail(dir, strerror(errno));
  } else if (!S_ISDIR(st.st_mode)) {
    Fail(dir, "not a directory");
  }
}

bool qorExtractDir_t::Take(const PortString_t& aName) { return taken.insert(Folded(aName)).second; }

void qorExtractDir_t::Reserve(const PortString_t& aName) { Take(aName); }

PortString_t qorExtractDir_t::Place(int aIndex, const PortString_t& aName) {
  if (Take(aName)) return aName;
  // The entry index names the subdirectory; a name-block name may already hold that too.
  PortString_t sub = PortString_t::Format("%04d", aIndex);
  for (int n = 1; !Take(sub); ++n) sub = PortString_t::Format("%04d_%d", aIndex, n);
  MakeSubdir(sub);
  return sub + "/" + aName;
}

void qorExtractDir_t::MakeSubdir(const PortString_t& aName) {
  const PortString_t path = FullPath(aName);
  struct stat st;
  // lstat: a symbolic link planted under this name could lead out of the directory.
  if (lstat(path.c_str(), &st) == 0) {
    if (!S_ISDIR(st.st_mode)) Fail(path, "exists and is not a directory");
    return;
  }
  if (mkdir(path.c_str(), 0777) != 0) Fail(path, strerror(errno));
}

void qorExtractDir_t::Create(PortFileStream_t& aStream, const PortString_t& aRelPath) {
  const PortString_t path = FullPath(aRelPath);
  struct stat st;
  if (lstat(path.c_str(), &st) == 0) {
    if (source.IsSameAs(path)) Fail(path, "is the archive being extracted");
    if (!force) Fail(path, "already exists (-f overwrites)");
    if (S_ISDIR(st.st_mode)) Fail(path, "is a directory");
    // Removing the old entry first means a symbolic link is replaced, not written through.
    if (unlink(path.c_str()) != 0) Fail(path, strerror(errno));
  }
  aStream.WriteOpen(path);
}
