// RaisedText: runs a callable and returns the const char* text it raised, the way the
// foundation reports failures, or "<nothing raised>" when it returned normally.
#ifndef TESTS_SUPPORT_RAISEDTEXT_H
#define TESTS_SUPPORT_RAISEDTEXT_H

#include <string>

template <typename Callable>
std::string RaisedText(Callable aCall) {
  try {
    aCall();
  } catch (const char* text) {
    return text;
  }
  return "<nothing raised>";
}

#endif
