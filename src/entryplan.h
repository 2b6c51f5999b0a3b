// How extract turns an archive entry into a file that qorLink rebuilds exactly: either the
// entry's data as a plain file with the option words that recreate its header, or its raw
// bytes as a ".TB" file. Names from name blocks are untrusted: only a name that is one safe
// path component and one response-file word is ever used as a file name.
#ifndef QOR_ENTRYPLAN_H
#define QOR_ENTRYPLAN_H

#include "port/src/string.h"
#include "src/archivereader.h"

// A name usable as one path component inside the extract directory and as the first word
// of a response-file line: not empty, no '/', '\\', "..", control byte, blank, '#' or ';',
// not "." and not beginning with '%'.
bool IsSafeEntryName(const PortString_t& aName);

// "0007.dat" for entry 7 with magic code "DAT": the index (at least four digits) and, when
// the magic code holds any, its characters lower-cased as the extension.
PortString_t DefaultEntryName(int aIndex, uint32_t aMagicCode);

struct qorEntryPlan_t {
  bool plain;          // true: write the data, listed by name; false: raw bytes, "NNNN.TB"
  bool compressed;     // plain only: listed with "comp" (still to be proven by recompressing)
  bool setFileName;    // plain only: listed with "setfilename"
  PortString_t name;   // the file's name, a safe single component
};

// The plan for `aEntry`, given whether its padding is all zero. A plain plan with a
// compressed body still needs the recompression check before it is used.
qorEntryPlan_t PlanEntry(const qorArchiveEntry_t& aEntry, bool aPaddingZero);
// The plan for an entry kept byte for byte.
qorEntryPlan_t RawPlan(int aIndex);

#endif
