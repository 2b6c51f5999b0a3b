#include "port/src/filestream.h"

#include <sys/stat.h>
#include <sys/types.h>

#include <cstdint>

PortFileStream_t::PortFileStream_t() : fileHandle(nullptr) {}

PortFileStream_t::~PortFileStream_t() {
  // A destructor may run while another failure unwinds: a failed final flush cannot be
  // reported here. Writers that must know call Close() themselves.
  if (fileHandle != nullptr) CloseHandle();
}

void PortFileStream_t::WriteOpen(const PortString_t& aFilename) {
  Close();
  filename.Set(aFilename);
  fileHandle = std::fopen(filename.GetFilename().c_str(), "wb+");
  if (fileHandle == nullptr) Error(6);
  SetWritable();
}

void PortFileStream_t::ReadOpen(const PortString_t& aFilename) {
  Close();
  filename.Set(aFilename);
  fileHandle = std::fopen(filename.GetFilename().c_str(), "rb");
  if (fileHandle == nullptr) Error(7);
  // Linux opens a directory for reading; its reads would only fail later, without saying why.
  struct stat info;
  if (fstat(fileno(fileHandle), &info) != 0 || S_ISDIR(info.st_mode)) {
    CloseHandle();
    Error(7);
  }
  SetReadable();
}

bool PortFileStream_t::CloseHandle() {
  const int result = std::fclose(fileHandle);
  fileHandle = nullptr;
  ResetWritable();
  ResetReadable();
  return result == 0;
}

void PortFileStream_t::Close() {
  if (fileHandle == nullptr) return;
  const bool writing = CanWrite();
  // fclose flushes the last buffered bytes; losing them silently would pass a truncated
  // file off as complete.
  if (!CloseHandle() && writing) Error(8);
  filename.Clear();
}

const PortString_t& PortFileStream_t::GetDescription() const {
  static const PortString_t unnamed("<no filename>");
  const PortString_t& name = filename.GetFilename();
  return name.GetLength() > 0 ? name : unnamed;
}

int PortFileStream_t::Write(const void* aPtr, int aLength) {
  CheckWritable();
  if (aLength < 0) Error(3);
  // A file written past the signed 32-bit unit could not be measured or read back by any
  // stream, so the write that would cross it is refused like a position beyond it. A pipe
  // has no position (ftello fails) and nothing to read back; it takes any amount.
  const off_t position = ftello(fileHandle);
  if (position > INT32_MAX - static_cast<off_t>(aLength)) Error(12);
  const size_t written = std::fwrite(aPtr, 1, static_cast<size_t>(aLength), fileHandle);
  if (std::ferror(fileHandle)) Error(8);
  return static_cast<int>(written);
}

int PortFileStream_t::Read(void* aPtr, int aLength) {
  CheckReadable();
  if (aLength < 0) Error(3);
  const size_t got = std::fread(aPtr, 1, static_cast<size_t>(aLength), fileHandle);
  if (std::ferror(fileHandle)) Error(9);
  return static_cast<int>(got);
}

void PortFileStream_t::Seek(PortStreamUnit_t aPos, int aWherence) {
  if (fileHandle == nullptr) Error(12);
  if (fseeko(fileHandle, aPos, aWherence) != 0) Error(13);
}

PortStreamUnit_t PortFileStream_t::GetPosition() {
  if (fileHandle == nullptr) Error(12);
  // Beyond the signed 32-bit unit a position would come back truncated, so it is refused
  // the same way as a failed ftell.
  const off_t position = ftello(fileHandle);
  if (position < 0 || position > INT32_MAX) Error(12);
  return static_cast<PortStreamUnit_t>(position);
}

PortStreamUnit_t PortFileStream_t::GetLength() {
  const PortStreamUnit_t here = GetPosition();
  Seek(0, 2);
  const off_t end = ftello(fileHandle);
  // The position is restored before a too-large length is refused, so the stream stays usable.
  Seek(here, 0);
  if (end < 0 || end > INT32_MAX) Error(12);
  return static_cast<PortStreamUnit_t>(end);
}
