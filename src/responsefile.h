// The response-file loop: reads the response file line by line, applies directive lines
// ('%' first) to the directive state and hands each file line's file, merge mode and option
// words to the entry writer. A directive affects only the lines after it.
#ifndef QOR_RESPONSEFILE_H
#define QOR_RESPONSEFILE_H

#include "port/src/stream.h"
#include "port/src/stringreader.h"
#include "port/src/stringtoken.h"
#include "src/outputguard.h"

// Defaults for the file lines still to come, and the count of lines read so far.
struct qorDirectiveState_t {
  bool comp_default = true;
  bool fname_default = false;
  bool no_end_rec = false;
  int line_num = 0;
};

// Runs until `reader` is at its end. `resp_name_p` is the response-file name as typed, for
// messages; `archive` identifies the archive being written, which cannot be listed. Throws
// "<resp>:<line>: unknow directive <word>." (PortString_t) for an unknown directive and
// "<name> could't open." for a file that cannot be opened or is the archive itself.
void ReadResponseFile(PortStringReader_t& reader, PortStringToken_t& token,
                      PortStream_t& dst_strm, const char* resp_name_p,
                      const qorFileIdentity_t& archive, qorDirectiveState_t& state);

#endif
