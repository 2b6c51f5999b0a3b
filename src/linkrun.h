// One link: derives the response-file and archive names, reads the response file, writes
// every listed file into the archive and closes it with the end record. Either the run
// returns with a complete archive, or it throws and no incomplete archive is left behind.
#ifndef QOR_LINKRUN_H
#define QOR_LINKRUN_H

// `resp_name_p`: the response file as typed; ".ls" is added when it has no extension.
// `dst_name_p`: the archive, or null for the response file's base name with ".LB" in the
// current directory; ".LB" is added when it has no extension.
// Throws const char* (file and stream failures), PortString_t (unknown directive, bad "id=")
// or std::exception. The archive is not created when the response file cannot be opened or
// is the output itself, and is removed again (if a regular file) when a later step fails.
void LinkRun(const char* resp_name_p, const char* dst_name_p);

#endif
