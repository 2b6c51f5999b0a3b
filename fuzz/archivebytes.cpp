#include "fuzz/archivebytes.h"

#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"
#include "src/archivereader.h"
#include "src/entrybody.h"

namespace {

void PutLe(std::string& aOut, uint32_t aValue, int aBytes) {
  for (int i = 0; i < aBytes; ++i) aOut += static_cast<char>(aValue >> (8 * i));
}

std::string StreamText(PortMemoryStream_t& aStream) {
  std::string bytes(static_cast<size_t>(aStream.GetLength()), '\0');
  aStream.Seek(0, 0);
  aStream.ReadBuffer(&bytes[0], aStream.GetLength());
  return bytes;
}

bool EndsWith(const std::string& aText, const std::string& aTail) {
  return aText.size() >= aTail.size() &&
         aText.compare(aText.size() - aTail.size(), aTail.size(), aTail) == 0;
}

}  // namespace

std::string FuzzHeader(uint8_t aType, uint8_t aCompression, uint16_t aUserId, uint32_t aFileSize,
                       uint32_t aMagic, uint32_t aRealSize) {
  std::string header;
  PutLe(header, aType, 1);
  PutLe(header, aCompression, 1);
  PutLe(header, aUserId, 2);
  PutLe(header, aFileSize, 4);
  PutLe(header, aMagic, 4);
  PutLe(header, aRealSize, 4);
  return header;
}

std::string FuzzCompress(const std::string& aData) {
  PortMemoryStream_t source;
  source.WriteBuffer(aData.data(), static_cast<int>(aData.size()));
  source.Seek(0, 0);
  PortMemoryStream_t payload;
  qorCompressor_t().compress(payload, source, static_cast<int>(aData.size()));
  return StreamText(payload);
}

bool FuzzReadArchive(const std::string& aArchive, FuzzArchiveContent_t& aContent) {
  qorArchiveReader_t reader(aArchive.c_str());
  while (reader.Next()) {
    const qorArchiveEntry_t& entry = reader.Entry();
    PortMemoryStream_t data;
    if (entry.Method() == 1) {
      if (!ExpandEntryBody(reader, data)) return false;
    } else {
      reader.Stream().Seek(entry.BodyOffset(), 0);
      data.CopyFrom(reader.Stream(), entry.BodySize());
    }
    aContent.data.push_back(StreamText(data));
    unsigned char header[kQorHeaderSize];
    entry.header.Store(header);
    aContent.headers.push_back(std::string(reinterpret_cast<char*>(header), kQorHeaderSize));
  }
  aContent.endRecord = reader.State() == kQorWalkEndRecord;
  return reader.State() != kQorWalkBroken;
}

bool IsLinkFailureText(const std::string& aText) {
  static const char* const kTails[] = {
      " could't open.", " read error.", " invalid file format.", "it too long.\n",
      " illegal filename.", "Error : duplicate compress-options.",
      "Error : duplicate setfilename-options."};
  for (const char* tail : kTails) {
    if (EndsWith(aText, tail)) return true;
  }
  return aText.compare(0, 15, "Error : option ") == 0 ||
         aText.find(": unknow directive %") != std::string::npos;
}
