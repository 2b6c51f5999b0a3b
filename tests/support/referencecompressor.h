// ReferenceCompressor: the compressor's greedy algorithm transcribed plainly, with the
// exhaustive sd search (every start of the last 1024 bytes). The compressor's payload must
// equal its output byte for byte; the benchmark times it for comparison.
#ifndef TESTS_SUPPORT_REFERENCECOMPRESSOR_H
#define TESTS_SUPPORT_REFERENCECOMPRESSOR_H

#include <string>
#include <vector>

class ReferenceCompressor {
 public:
  std::string Compress(const std::string& aInput);

 private:
  void Read(int aAt, int aCount);
  void Refill();
  int ZeroLeng() const;
  int RleLeng() const;
  int SdLeng();
  int WordLeng() const;
  void Step();
  void Directive(int aCode, int aLeng);
  void FlushNormal();

  const std::string* input_ = nullptr;
  int read_ = 0;
  std::vector<unsigned char> window_;
  int cur_ = 0;
  int limit_ = 0;
  int remain_ = 0;
  int normal_ = 0;
  int sdOffset_ = 0;
  std::string out_;
};

#endif
