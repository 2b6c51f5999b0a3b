#include "port/src/stringtoken.h"

namespace {
const int kCommentCharMax = 4;
}  // namespace

PortStringToken_t::PortStringToken_t() { commentCharList_[0] = 0; }

PortStringToken_t::~PortStringToken_t() {}

void PortStringToken_t::setCommentChar(const PORT_char_t* chars) {
  int n = 0;
  if (chars != nullptr) {
    for (; n < kCommentCharMax && chars[n] != 0; ++n) commentCharList_[n] = chars[n];
  }
  if (n < kCommentCharMax) commentCharList_[n] = 0;
}

int PortStringToken_t::parse(const PortString_t& str) {
  clear();
  const PORT_char_t* p = str.c_str();
  for (;;) {
    p = skipSpace(p);
    if (*p == 0 || isCommentChar(*p)) break;
    const PORT_char_t* word_end = skipNonSpace(p);
    tokenList_.push_back(PortString_t(p, static_cast<int>(word_end - p)));
    p = word_end;
  }
  return count();
}

void PortStringToken_t::erase(int i) {
  // Negative indexes fall through the same test: unsigned they lie past every list.
  if (static_cast<unsigned>(i) >= tokenList_.size()) {
    throw "Error : PortStringToken_t::erase   out of index.";
  }
  tokenList_.erase(tokenList_.begin() + i);
}

bool PortStringToken_t::isSpace(PORT_char_t c) const {
  return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

bool PortStringToken_t::isCommentChar(PORT_char_t c) const {
  for (int n = 0; n < kCommentCharMax && commentCharList_[n] != 0; ++n) {
    if (commentCharList_[n] == c) return true;
  }
  return false;
}

const PORT_char_t* PortStringToken_t::skipSpace(const PORT_char_t* p) const {
  while (isSpace(*p)) ++p;
  return p;
}

const PORT_char_t* PortStringToken_t::skipNonSpace(const PORT_char_t* p) const {
  while (*p != 0 && !isSpace(*p) && !isCommentChar(*p)) ++p;
  return p;
}
