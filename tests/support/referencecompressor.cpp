#include "tests/support/referencecompressor.h"

#include <algorithm>

std::string ReferenceCompressor::Compress(const std::string& aInput) {
  out_.clear();
  const int length = static_cast<int>(aInput.size());
  if (length <= 0) return out_;
  input_ = &aInput;
  read_ = 0;
  window_.assign(std::min(length, 131072), 0);
  Read(0, static_cast<int>(window_.size()));
  limit_ = static_cast<int>(window_.size());
  cur_ = 0;
  remain_ = length - limit_;
  normal_ = 0;
  for (;;) {
    if (remain_ > 0 && limit_ - cur_ <= 65535) {
      Refill();
      Step();
    } else if (remain_ > 0 || cur_ != limit_) {
      Step();
    } else {
      break;
    }
  }
  FlushNormal();
  out_ += '\xFF';
  return out_;
}

void ReferenceCompressor::Read(int aAt, int aCount) {
  for (int i = 0; i < aCount; ++i) window_[aAt + i] = (*input_)[read_ + i];
  read_ += aCount;
}

void ReferenceCompressor::Refill() {
  const int drop = std::min(cur_ - 8192, normal_);
  for (int i = drop; i < limit_; ++i) window_[i - drop] = window_[i];
  limit_ -= drop;
  cur_ -= drop;
  normal_ -= drop;
  const int count = std::min(131072 - limit_, remain_);
  Read(limit_, count);
  limit_ += count;
  remain_ -= count;
}

int ReferenceCompressor::ZeroLeng() const {
  if (window_[cur_] != 0) return 0;
  int n = 0;
  while (cur_ + n < limit_ && window_[cur_ + n] == 0 && n < 65535) ++n;
  return n < 2 ? 0 : n;
}

int ReferenceCompressor::RleLeng() const {
  const unsigned char d = window_[cur_];
  if (d == 0) return 0;
  int n = 0;
  while (cur_ + n < limit_ && window_[cur_ + n] == d && n < 65535) ++n;
  return n < 3 ? 0 : n;
}

int ReferenceCompressor::SdLeng() {
  const int match_limit = std::min(limit_ - cur_, 2048);
  int best = 0;
  int best_start = 0;
  for (int j = cur_ - 1; j >= std::max(cur_ - 1024, 0); --j) {
    if (window_[j] != window_[cur_]) continue;
    int k = 0;
    while (k < match_limit && window_[j + k] == window_[cur_ + k]) ++k;
    if (k > best) {
      best = k;
      best_start = j;
    }
  }
  if (best < 3) return 0;
  sdOffset_ = cur_ - best_start;
  return best;
}

int ReferenceCompressor::WordLeng() const {
  if (window_[cur_] == 0) return 0;
  int i = cur_;
  while (i + 2 <= limit_ && window_[i + 1] == 0) {
    if (window_[i] == 0 && window_[i - 2] == 0) {
      i -= 2;
      break;
    }
    i += 2;
  }
  const int n = std::min(i - cur_, 131070);
  return n < 3 ? 0 : n;
}

void ReferenceCompressor::Step() {
  int best = 0;
  int kind = 0;
  const int z = ZeroLeng();
  if (z >= 2) {
    best = z <= 31 ? z - 1 : z - 2;
    kind = 1;
  }
  const int r = RleLeng();
  const int r_score = r <= 31 ? r - 2 : r - 3;
  if (r > 0 && r_score > best) {
    best = r_score;
    kind = 2;
  }
  const int s = SdLeng();
  int s_score = s <= 31 ? s - 2 : s - 3;
  if (s > 0 && sdOffset_ > 255) --s_score;
  if (s > 0 && s_score > best) {
    best = s_score;
    kind = 3;
  }
  const int w = WordLeng();
  const int n = w / 2;
  const int w_score = n <= 32 ? n - 1 : n - 2;
  if (w > 0 && w_score > best) kind = 4;

  if (kind == 0) {
    ++cur_;
    if (cur_ - normal_ >= 57344) FlushNormal();
    return;
  }
  FlushNormal();
  const unsigned char at = window_[cur_];
  if (kind == 1) {
    Directive(0x20, z);
    cur_ += z;
  } else if (kind == 2) {
    Directive(0x40, r);
    out_ += static_cast<char>(at);
    cur_ += r;
  } else if (kind == 3) {
    if (sdOffset_ > 255) {
      Directive(0x80, s);
      out_ += static_cast<char>(sdOffset_ & 0xFF);
      out_ += static_cast<char>(sdOffset_ >> 8);
    } else {
      Directive(0x60, s);
      out_ += static_cast<char>(sdOffset_);
    }
    cur_ += s;
  } else {
    Directive(0xA0, n);
    for (int i = 0; i < n; ++i) out_ += static_cast<char>(window_[cur_ + 2 * i]);
    cur_ += w;
  }
  normal_ = cur_;
}

void ReferenceCompressor::Directive(int aCode, int aLeng) {
  if (aLeng <= 31) {
    out_ += static_cast<char>(aCode | aLeng);
  } else {
    out_ += static_cast<char>(aCode);
    out_ += static_cast<char>(aLeng & 0xFF);
    out_ += static_cast<char>(aLeng >> 8);
  }
}

void ReferenceCompressor::FlushNormal() {
  const int leng = cur_ - normal_;
  if (leng <= 0) return;
  Directive(0x00, leng);
  for (int i = normal_; i < cur_; ++i) out_ += static_cast<char>(window_[i]);
  normal_ = cur_;
}
