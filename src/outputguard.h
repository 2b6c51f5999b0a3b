// Keeps the tool's output from harming other files: tells whether a name is the archive being
// written, and removes an archive that a failed run left incomplete. Only a regular file is
// ever removed, never a device, FIFO or symbolic link that the output name happened to be.
#ifndef QOR_OUTPUTGUARD_H
#define QOR_OUTPUTGUARD_H

#include <sys/types.h>

#include "port/src/string.h"

// A file's device and inode, taken when constructed; names are followed through symbolic links.
class qorFileIdentity_t {
 public:
  qorFileIdentity_t() : known(false), device(0), inode(0) {}
  explicit qorFileIdentity_t(const PortString_t& aName);  // unknown when the name is no file
  // True when `aName` is this very file; never for an unknown identity or name.
  bool IsSameAs(const PortString_t& aName) const;

 private:
  bool known;
  dev_t device;
  ino_t inode;
};

// Declare it before the archive's stream, so that it is destroyed after the stream closed.
// Once armed with the archive's name, destruction removes that file unless Disarm was called.
class qorOutputGuard_t {
 public:
  qorOutputGuard_t() : armed(false) {}
  ~qorOutputGuard_t();
  qorOutputGuard_t(const qorOutputGuard_t&) = delete;
  qorOutputGuard_t& operator=(const qorOutputGuard_t&) = delete;

  void Arm(const PortString_t& aName);  // call once the archive has been created
  void Disarm() { armed = false; }      // call once the archive is complete and closed

 private:
  PortString_t name;
  bool armed;
};

#endif
