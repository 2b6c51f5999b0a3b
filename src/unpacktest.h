// `qorUnpack test`: checks a whole archive and lists every problem with its offset and entry
// index: the walk's structure and end record, name blocks, padding, and that each compressed
// body expands to exactly realSize bytes with nothing after its end mark.
#ifndef QOR_UNPACKTEST_H
#define QOR_UNPACKTEST_H

#include <cstdio>

#include "port/src/string.h"

// Prints the problems and a verdict line on aOut; returns the number of problems found
// (0: the archive is sound).
int UnpackTest(const PortString_t& aArchive, FILE* aOut);

#endif
