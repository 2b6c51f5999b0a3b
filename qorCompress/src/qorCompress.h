// qorCompressor_t and qorExpander_t: the encoder and decoder of the compressed payload.
// A payload is a sequence of directives (normal, zero, rle, near/far sd copy, word) closed by
// one end mark 0xFF; an empty input has an empty payload. See docs/format.md for the grammar.
#ifndef QOR_COMPRESS_H
#define QOR_COMPRESS_H

#include "port/src/stream.h"

class qorCompressor_t {
 public:
  qorCompressor_t();
  ~qorCompressor_t();

  // Reads exactly `length` bytes from srcStrm's position and writes their payload to
  // dstStrm's position, in writes of exactly 4096 bytes and one last shorter write.
  // length <= 0: reads and writes nothing. Stream errors (" read error." when the source
  // ends early, " write error.") pass out unchanged after the window is released; the
  // compressor stays usable.
  void compress(PortStream_t& dstStrm, PortStream_t& srcStrm, int length);

  // (private members are the implementer's; see qorCompress.cpp)
};

class qorExpander_t {
 public:
  // Reads `payloadLength` bytes of payload from srcStrm's position and writes exactly
  // `realSize` expanded bytes to dstStrm. Any malformed payload (a directive byte 0xC0-0xFE,
  // an sd offset before the start of the output, a payload ending before its end mark or
  // with bytes after it, an expanded size other than realSize) raises the const char*
  // " invalid file format." (code 15). Never reads or writes outside its buffers.
  void expand(PortStream_t& dstStrm, PortStream_t& srcStrm, int payloadLength, int realSize);
};

#endif
