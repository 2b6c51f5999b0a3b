// The option parsers of a file line. Each reads the tokenizer's word list (the words after
// the file name), removes the words it recognises and leaves every other word in place.
// Failures are raised before anything of the entry has been written.
#ifndef QOR_LINKOPTIONS_H
#define QOR_LINKOPTIONS_H

#include "port/src/stringtoken.h"

// The first word starting with "id=" (any case) sets `id` to the rest read as a strtol base-0
// number ("" gives 0) and is removed; later ones stay. Returns false and leaves `id` alone
// without such a word. A rest that is no 32-bit number throws the PortString_t
// "Error : option <word>\n".
bool CheckOptUserId(PortStringToken_t& token, int& id);

// "compress"/"comp" give true, "nocompress"/"nocomp" false, any case; `comp` without one.
// A second such word on the line throws "Error : duplicate compress-options.".
bool CheckOptCompress(PortStringToken_t& token, bool comp);

// "setfilename" gives true, "nosetfilename" false, any case; `opt_value` without one.
// A second such word throws "Error : duplicate setfilename-options.".
bool CheckOptSetFileName(PortStringToken_t& token, bool opt_value);

#endif
