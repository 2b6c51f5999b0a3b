// Numbered error messages raised as exceptions. Every failure of the foundation is thrown
// as a const char* pointing into the last-error string; texts begin with one blank so they
// read on directly after their subject ("list.ls" + " could't open.").
#ifndef PORT_ERROR_H
#define PORT_ERROR_H

#include "port/src/string.h"

// Empties the last-error string and returns it, for composing a longer message.
PortString_t& PortErrorGetStr();
// The table text of a code; codes outside 0..15 give " unknown error.".
PortString_t PortErrorGetMsg(int aErrorNum);
// Throws aCause.c_str() as const char*; aCause must outlive the handler (pass the last-error string).
[[noreturn]] void PortErrorThrow(PortString_t& aCause);
// Throws the table text of a code.
[[noreturn]] void PortErrorThrow(int aErrorNum);

#endif
