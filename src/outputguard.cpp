#include "src/outputguard.h"

#include <sys/stat.h>
#include <unistd.h>

qorFileIdentity_t::qorFileIdentity_t(const PortString_t& aName) : qorFileIdentity_t() {
  struct stat info;
  if (stat(aName.c_str(), &info) != 0) return;
  known = true;
  device = info.st_dev;
  inode = info.st_ino;
}

bool qorFileIdentity_t::IsSameAs(const PortString_t& aName) const {
  qorFileIdentity_t other(aName);
  return known && other.known && device == other.device && inode == other.inode;
}

void qorOutputGuard_t::Arm(const PortString_t& aName) {
  name = aName;
  armed = true;
}

// A run that fails leaves an archive without its end record. Removing it keeps a build
// system from taking it for up to date (as linkers and make's .DELETE_ON_ERROR do). The
// name is looked at again now, without following links: whatever it names may have been a
// device such as /dev/full, a FIFO or a link from the start, and those are never removed.
qorOutputGuard_t::~qorOutputGuard_t() {
  if (!armed) return;
  struct stat info;
  if (lstat(name.c_str(), &info) == 0 && S_ISREG(info.st_mode)) unlink(name.c_str());
}
