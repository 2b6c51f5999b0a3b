#include "port/src/error.h"

namespace {

const char* const ErrorMessages[16] = {
    " no error.",
    " unknown error.",
    " program error.",
    " illegal parameter.",
    " memory not enough.",
    " not found.",
    " could't create.",
    " could't open.",
    " write error.",
    " read error.",
    " could't write.",
    " could't read.",
    " file operation invalid.",
    " file operation fail.",
    " illegal filename.",
    " invalid file format.",
};

const int UnknownErrorCode = 1;

PortString_t ErrorStr;

// Set while PortErrorThrow(int) fills ErrorStr. Filling it allocates a body, and a failed
// body allocation raises code 4 again; without this guard an exhausted heap would recurse
// until the stack overflows.
bool raisingError = false;

const char* MessageText(int aErrorNum) {
  const unsigned int index = static_cast<unsigned int>(aErrorNum);
  return ErrorMessages[index < 16 ? index : UnknownErrorCode];
}

}  // namespace

PortString_t& PortErrorGetStr() {
  ErrorStr.Clear();
  return ErrorStr;
}

PortString_t PortErrorGetMsg(int aErrorNum) {
  return PortString_t(MessageText(aErrorNum));
}

void PortErrorThrow(PortString_t& aCause) {
  throw aCause.c_str();
}

void PortErrorThrow(int aErrorNum) {
  if (raisingError) {
    // The table literal lives for the whole run, so it is a valid thrown text as well.
    throw MessageText(aErrorNum);
  }
  raisingError = true;
  try {
    ErrorStr = PortErrorGetMsg(aErrorNum);
  } catch (...) {
    raisingError = false;
    throw;
  }
  raisingError = false;
  PortErrorThrow(ErrorStr);
}
