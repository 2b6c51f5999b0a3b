// The archive writer: puts one listed file into the archive by its merge mode, and closes
// the archive with the end record. The archive is written strictly front to back, never
// sought back: every header is complete before it is written, and every entry is padded
// with zero bytes to a multiple of 64 (layout in src/qorArchive.h).
#ifndef QOR_ENTRYWRITER_H
#define QOR_ENTRYWRITER_H

#include "port/src/filename.h"
#include "port/src/stream.h"
#include "port/src/stringtoken.h"
#include "src/qorArchive.h"

// Writes the file that `src_strm` holds (at position 0) by `merge_mode`. For the own-header
// and plain modes the line's option words in `token` and the directive defaults apply; the
// other modes ignore them. A header whose fileSize is below 16 + its name block raises
// " invalid file format." after the file's name; a file shorter than its headers say raises
// its " read error.".
void WriteEntry(PortStream_t& dst_strm, PortStream_t& src_strm, PortFilename_t& src_name,
                int merge_mode, PortStringToken_t& token, bool comp_default, bool fname_default);

// Writes one entry from `header` and the body `src_strm` holds from its position: applies
// "id=", the name-block and compression options, fills in compression, fileSize and, when it
// compresses, realSize (in `header` itself), then writes header, name block, body, padding.
// A body its header marks compressed is taken over unchanged. A base name of 48 characters
// or more throws "<name>it too long.\n"; an empty one, when a name block is asked for, throws
// "'<name>' illegal filename.".
void NormalWrite(PortStream_t& dst_strm, PortStream_t& src_strm, PortFilename_t& src_name,
                 qorStdFileHeader_t& header, PortStringToken_t& token, bool compDefault,
                 bool fnameDefault);

// The end record and 48 zero bytes: 64 bytes.
void WriteEndRecord(PortStream_t& dst_strm);

#endif
