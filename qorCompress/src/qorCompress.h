// qorCompressor_t and qorExpander_t: the encoder and decoder of the compressed payload.
// A payload is a sequence of directives (normal, zero, rle, near/far sd copy, word) closed by
// one end mark 0xFF; an empty input has an empty payload. See docs/format.md for the grammar.
#ifndef QOR_COMPRESS_H
#define QOR_COMPRESS_H

#include "port/src/stream.h"

class qorMatchFinder_t;

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

 private:
  qorCompressor_t(const qorCompressor_t&) = delete;
  qorCompressor_t& operator=(const qorCompressor_t&) = delete;

  void refill(PortStream_t& srcStrm);
  void step();
  void sdStep();
  int runLeng();      // bytes equal to the current one, from it on; the measures share it
  int longRunLeng();
  int getZeroLeng(int run);
  int getRleLeng(int run);
  int getSdLeng(int run, int minLeng);  // only matches of at least minLeng bytes count
  int getWordLeng();
  int wordWalk();
  void putData(unsigned char d);
  void putDirective(unsigned char directive, int leng);
  void putSd(int leng);
  void putSdStep(int leng);
  void putBuff(const void* buff, int leng);
  void flushDstBuff();
  void flushNormalData();

  unsigned char dstBuffer_[4096];
  int dstIndex_;
  PortStream_t* dstStrm_;
  unsigned char* buffer_;
  int srcIndex_;
  int srcLimit_;
  int srcRemain_;
  int normalIndex_;
  int sdOffset_;
  // What the fast search adds. Source offsets are absolute: window position + srcBase_.
  qorMatchFinder_t* finder_;
  int srcBase_;     // source bytes dropped from the window's front so far
  int runFrom_;     // [runFrom_, runEnd_): bytes known equal
  int runEnd_;
  bool runOpen_;    // the run may go on past runEnd_
  int wordFrom_;    // start of the last word walk; its stop is wordEnd_
  int wordEnd_;
  int wordLimit_;   // the window's end, absolute, when the walk stopped there; else -1
};

class qorExpander_t {
 public:
  // Reads `payloadLength` bytes of payload from srcStrm's position and writes exactly
  // `realSize` expanded bytes to dstStrm, in blocks of about 256 KB. Any malformed payload
  // (a directive byte 0xC0-0xFE, a length of 0, an sd offset of 0, above 1024 or before the
  // start of the output, a payload ending before its end mark or with bytes after it, an
  // expanded size other than realSize) raises the const char* " invalid file format."
  // (code 15); blocks already written stay written. An empty payload is valid for realSize 0
  // only. Never reads or writes outside its buffers, whatever the payload. Stream errors
  // pass out unchanged.
  void expand(PortStream_t& dstStrm, PortStream_t& srcStrm, int payloadLength, int realSize);
};

#endif
