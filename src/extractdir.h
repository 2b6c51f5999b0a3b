// qorExtractDir_t: the directory that extract writes into. It hands out one distinct path per
// file, always inside the directory: a file's name is one checked component, a name already
// taken puts the file into a subdirectory of its own (so its base name survives), and no
// existing file is replaced unless forced, nor is a symbolic link ever followed there.
#ifndef QOR_EXTRACTDIR_H
#define QOR_EXTRACTDIR_H

#include <set>
#include <string>

#include "port/src/filestream.h"
#include "port/src/string.h"
#include "src/outputguard.h"

class qorExtractDir_t {
 public:
  // Creates aDir when it does not exist; it must then be a directory.
  qorExtractDir_t(const PortString_t& aDir, bool aForce);

  // Keeps a top-level name for the caller's own use (the response file, the rebuilt archive).
  void Reserve(const PortString_t& aName);
  // Create refuses this file (the archive being read) under any name, even when forced.
  void Protect(const PortString_t& aFile) { source = qorFileIdentity_t(aFile); }
  // The path, relative to the directory, for entry aIndex's file named aName (a name that
  // IsSafeEntryName accepts): aName itself, or "NNNN/aName" when aName is taken, the
  // subdirectory then being created. Names are compared ignoring letter case, so that the
  // files stay distinct on a case-insensitive file system too.
  PortString_t Place(int aIndex, const PortString_t& aName);
  // Opens the file at aRelPath (from Place or Reserve) for writing.
  void Create(PortFileStream_t& aStream, const PortString_t& aRelPath);

  PortString_t FullPath(const PortString_t& aRelPath) const { return dir + "/" + aRelPath; }

 private:
  bool Take(const PortString_t& aName);  // false when the name is already taken
  void MakeSubdir(const PortString_t& aName);

  PortString_t dir;
  bool force;
  qorFileIdentity_t source;
  std::set<std::string> taken;  // top-level names, lower-cased
};

#endif
