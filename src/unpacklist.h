// `qorUnpack list`: one aligned line per entry of an archive and a total line. Reads headers
// and name blocks only; bodies are neither read nor checked.
#ifndef QOR_UNPACKLIST_H
#define QOR_UNPACKLIST_H

#include <cstdio>

#include "port/src/string.h"

// Bytes as text: printable ASCII as is, a backslash doubled, anything else as "\xHH".
PortString_t EscapedText(const unsigned char* aBytes, int aLength);

// Lists aArchive on aOut. A damaged structure is raised (naming the archive and the offset) after
// the entries before it have been listed.
void UnpackList(const PortString_t& aArchive, FILE* aOut);

#endif
