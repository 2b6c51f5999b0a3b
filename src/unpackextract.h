// `qorUnpack extract`: writes every entry of an archive into a directory, together with the
// response file NAME.ls (NAME: the archive's base name) from which `qorLink NAME.ls -o NAME.LB`,
// run in that directory, rebuilds the archive byte for byte.
#ifndef QOR_UNPACKEXTRACT_H
#define QOR_UNPACKEXTRACT_H

#include "port/src/string.h"

struct qorExtractOptions_t {
  bool force = false;   // replace existing files
  bool verify = true;   // recompress every compressed body to prove the relink exact
};

// Extracts aArchive into aDir (created when missing). A damaged structure is raised before
// anything is written; a malformed compressed body is raised when it is met, leaving the
// files before it in place and no response file. Without verify, compressed bodies are taken
// to be qorLink's own: the relink then differs where another encoder wrote a payload.
void UnpackExtract(const PortString_t& aArchive, const PortString_t& aDir,
                   const qorExtractOptions_t& aOptions);

#endif
