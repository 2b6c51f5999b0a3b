// Archive bytes for the fuzz targets: entries built field by field (little-endian), payloads
// made by the compressor, and the data an archive's entries hold, read back through the
// archive walk. Also the texts the tools may fail with, for telling a failure from a fault.
#ifndef FUZZ_ARCHIVEBYTES_H
#define FUZZ_ARCHIVEBYTES_H

#include <cstdint>
#include <string>
#include <vector>

std::string FuzzHeader(uint8_t aType, uint8_t aCompression, uint16_t aUserId, uint32_t aFileSize,
                       uint32_t aMagic, uint32_t aRealSize);
std::string FuzzCompress(const std::string& aData);

// What the archive walk of `aArchive` found: each entry's data (its body, expanded when it is
// compressed) and header, and whether it ended at an end record. False when the walk or an
// expansion failed.
struct FuzzArchiveContent_t {
  std::vector<std::string> data;
  std::vector<std::string> headers;
  bool endRecord = false;
};
bool FuzzReadArchive(const std::string& aArchive, FuzzArchiveContent_t& aContent);

// Whether a text the link run raised is one of the tool's own failure messages.
bool IsLinkFailureText(const std::string& aText);

#endif
