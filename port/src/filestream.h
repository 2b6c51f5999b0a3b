// PortFileStream_t: a stream over one file, opened either for reading or for writing,
// never both. Every failure names the file (its slash form); positions beyond the signed
// 32-bit stream range raise " file operation invalid." rather than being truncated.
#ifndef PORT_FILESTREAM_H
#define PORT_FILESTREAM_H

#include <cstdio>

#include "port/src/filename.h"
#include "port/src/stream.h"

class PortFileStream_t : public PortStream_t {
 public:
  PortFileStream_t();
  virtual ~PortFileStream_t();

  // Both first Close() the open file. A failed open leaves the stream closed but naming the
  // file, so later failures still say which file it was.
  void WriteOpen(const PortString_t& aFilename);  // "wb+": creates or truncates; code 6
  void ReadOpen(const PortString_t& aFilename);   // "rb"; code 7, also for a directory
  // Harmless when nothing is open. When the final flush of a file open for writing fails,
  // raises code 8 (the stream is closed but keeps naming the file); destruction closes silently.
  void Close();

  int Write(const void* aPtr, int aLength) override;  // code 10 / 8; negative length: code 3
  int Read(void* aPtr, int aLength) override;         // code 11 / 9; negative length: code 3
  void Seek(PortStreamUnit_t aPos, int aWherence) override;  // code 12 closed, 13 failed
  PortStreamUnit_t GetPosition() override;                   // code 12
  PortStreamUnit_t GetLength() override;                     // keeps the position

 protected:
  const PortString_t& GetDescription() const override;  // the name, or "<no filename>"

 private:
  bool CloseHandle();  // true when fclose reported no failure

  FILE* fileHandle;
  PortFilename_t filename;
};

#endif
