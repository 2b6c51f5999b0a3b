#include "port/src/stringreader.h"

#include <algorithm>
#include <climits>
#include <new>

namespace {
const int kInitialBufferSize = 1024;
const int kReadErrorCode = 9;
const PORT_char_t kLineFeed = 10;
const PORT_char_t kCarriageReturn = 13;
}  // namespace

PortStringReader_t::PortStringReader_t(PortStream_t* stream)
    : stream_(stream),
      streamLeft_(stream->GetLength() - stream->GetPosition()),
      bufferSize_(kInitialBufferSize),
      buffer_(new PORT_char_t[kInitialBufferSize]),
      dataTop_(0),
      activeSize_(0) {}

PortStringReader_t::~PortStringReader_t() { delete[] buffer_; }

void PortStringReader_t::ReadStream(int index, int size) {
  const int l = size < streamLeft_ ? size : streamLeft_;
  if (l <= 0) return;
  int got = stream_->Read(buffer_ + index, l);
  // The length measured at construction promised l bytes. Whatever did arrive is kept and
  // accounted, so the reader stays in step with the stream's position; a shortfall (a file
  // shrinking under us) is the stream's read error rather than bytes that never came.
  if (got < 0) got = 0;
  if (got > l) got = l;
  streamLeft_ -= got;
  activeSize_ += got;
  if (got != l) stream_->Error(kReadErrorCode);
}

void PortStringReader_t::ExpandBuffer() {
  // Doubling past INT_MAX is as impossible as a failed allocation, and reported as one.
  if (bufferSize_ > INT_MAX / 2) throw std::bad_alloc();
  PORT_char_t* grown = new PORT_char_t[bufferSize_ * 2];
  const int fore = GetForeSize();
  std::copy(buffer_ + dataTop_, buffer_ + dataTop_ + fore, grown);
  std::copy(buffer_, buffer_ + (activeSize_ - fore), grown + fore);
  delete[] buffer_;
  buffer_ = grown;
  bufferSize_ *= 2;
  dataTop_ = 0;
}

void PortStringReader_t::FillBuffer() {
  if (EndOfStream()) return;
  int free_space = bufferSize_ - activeSize_;
  if (free_space == 0) {
    ExpandBuffer();
    free_space = bufferSize_ - activeSize_;
  }
  // New bytes go behind the unconsumed ones, wrapping to the front, so nothing buffered moves.
  const int write_index = RingBufferOffset(dataTop_ + activeSize_);
  int overlap = free_space + write_index - bufferSize_;
  if (overlap < 0) overlap = 0;
  ReadStream(write_index, free_space - overlap);
  if (overlap > 0 && !EndOfStream()) ReadStream(0, overlap);
}

PortString_t PortStringReader_t::gets() {
  int count = 0;
  for (;;) {
    if (count == activeSize_) {
      FillBuffer();
      if (count == activeSize_) break;
    }
    if (GetChar(count++) == kLineFeed) break;
  }

  int length = count;
  while (length > 0) {
    const PORT_char_t last = GetChar(length - 1);
    if (last != kLineFeed && last != kCarriageReturn) break;
    --length;
  }

  const int fore = GetForeSize() < length ? GetForeSize() : length;
  PortString_t line(buffer_ + dataTop_, fore);
  if (length > fore) line += PortString_t(buffer_, length - fore);

  activeSize_ -= count;
  dataTop_ = RingBufferOffset(dataTop_ + count);
  return line;
}
