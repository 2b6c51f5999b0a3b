// PortStringToken_t: splits one line into words separated by blanks, tabs, CR and LF.
// Up to four comment characters end the line's words wherever they stand, also inside a
// word. No quoting, no escapes.
#ifndef PORT_STRINGTOKEN_H
#define PORT_STRINGTOKEN_H

#include <vector>

#include "port/src/string.h"

class PortStringToken_t {
 public:
  typedef std::vector<PortString_t> tokenList_t;

  PortStringToken_t();
  ~PortStringToken_t();

  void setCommentChar(const PORT_char_t* chars);  // first four characters; null or "" clears
  int parse(const PortString_t& str);             // replaces the words, returns their count
  int count() const { return static_cast<int>(tokenList_.size()); }
  const PortString_t& get(int i) const { return tokenList_[i]; }  // no range test
  // Removes word i; outside the list it throws the const char*
  // "Error : PortStringToken_t::erase   out of index." and changes nothing.
  void erase(int i);
  void clear() { tokenList_.clear(); }

 private:
  bool isSpace(PORT_char_t c) const;
  bool isCommentChar(PORT_char_t c) const;
  const PORT_char_t* skipSpace(const PORT_char_t* p) const;
  const PORT_char_t* skipNonSpace(const PORT_char_t* p) const;

  tokenList_t tokenList_;
  PORT_char_t commentCharList_[4];
};

#endif
