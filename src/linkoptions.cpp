#include "src/linkoptions.h"

#include "port/src/string.h"

namespace {

const char kUserIdPrefix[] = "id=";
const int kUserIdPrefixLength = 3;

bool IsAnyOf(const PortString_t& word, const char* first, const char* second) {
  return CaseCompare(word, first) == 0 || CaseCompare(word, second) == 0;
}

// The two switches share one rule: at most one of their words per line, whichever it is,
// so that a line never silently says both.
bool CheckOptSwitch(PortStringToken_t& token, bool value, const char* on_word,
                    const char* on_short, const char* off_word, const char* off_short,
                    const char* duplicate_text) {
  bool seen = false;
  int i = 0;
  while (i < token.count()) {
    const PortString_t& word = token.get(i);
    bool is_on = IsAnyOf(word, on_word, on_short);
    if (!is_on && !IsAnyOf(word, off_word, off_short)) {
      ++i;
      continue;
    }
    if (seen) throw duplicate_text;
    seen = true;
    value = is_on;
    token.erase(i);
  }
  return value;
}

}  // namespace

bool CheckOptUserId(PortStringToken_t& token, int& id) {
  for (int i = 0; i < token.count(); ++i) {
    const PortString_t& word = token.get(i);
    if (CaseCompare(word, kUserIdPrefix, kUserIdPrefixLength) != 0) continue;
    bool failed = false;
    int value = PortString_t(word.c_str() + kUserIdPrefixLength).ToInt(&failed);
    if (failed) throw PortString_t::Format("Error : option %s\n", word.c_str());
    token.erase(i);
    id = value;
    return true;
  }
  return false;
}

bool CheckOptCompress(PortStringToken_t& token, bool comp) {
  return CheckOptSwitch(token, comp, "compress", "comp", "nocompress", "nocomp",
                        "Error : duplicate compress-options.");
}

bool CheckOptSetFileName(PortStringToken_t& token, bool opt_value) {
  return CheckOptSwitch(token, opt_value, "setfilename", "setfilename", "nosetfilename",
                        "nosetfilename", "Error : duplicate setfilename-options.");
}
