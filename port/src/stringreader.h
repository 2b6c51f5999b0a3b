// PortStringReader_t: reads a stream one line at a time through a ring buffer of 1024
// bytes that doubles only when a single line does not fit. Only a line feed ends a line;
// the carriage returns and line feeds at a line's end are removed. Reads from the stream's
// position at construction to its length measured then.
#ifndef PORT_STRINGREADER_H
#define PORT_STRINGREADER_H

#include "port/src/stream.h"
#include "port/src/string.h"

class PortStringReader_t {
 public:
  explicit PortStringReader_t(PortStream_t* stream);  // the stream must outlive the reader
  ~PortStringReader_t();
  PortStringReader_t(const PortStringReader_t&) = delete;
  PortStringReader_t& operator=(const PortStringReader_t&) = delete;

  // The next line without its terminator; empty past the end. Errors of the stream's Read
  // pass through. A stream that delivers fewer bytes than its measured length promised
  // raises its " read error." (code 9); the bytes that did arrive stay buffered, so a later
  // call carries on where the stream stands.
  PortString_t gets();
  bool eof() const { return EndOfStream() && activeSize_ == 0; }

 private:
  int RingBufferOffset(int ofs) const { return ofs >= bufferSize_ ? ofs - bufferSize_ : ofs; }
  PORT_char_t GetChar(int index) const { return buffer_[RingBufferOffset(dataTop_ + index)]; }
  int GetForeSize() const {
    return bufferSize_ - dataTop_ < activeSize_ ? bufferSize_ - dataTop_ : activeSize_;
  }
  bool EndOfStream() const { return streamLeft_ <= 0; }
  void ReadStream(int index, int size);  // into buffer_ at index, counted in activeSize_
  void ExpandBuffer();
  void FillBuffer();

  PortStream_t* stream_;
  int streamLeft_;
  int bufferSize_;
  PORT_char_t* buffer_;
  int dataTop_;
  int activeSize_;
};

#endif
