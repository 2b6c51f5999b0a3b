#include "port/src/filename.h"

#include "port/src/error.h"

namespace {
const int IllegalFilename = 14;
}

void PortFilename_t::Set(const PortString_t& aStr) {
  nakedStr = aStr;
  filenameStr = aStr;
  filenameStr.Replace('\\', '/');
}

void PortFilename_t::Clear() {
  nakedStr.Clear();
  filenameStr.Clear();
}

int PortFilename_t::GetBaseNameIndex() const { return filenameStr.ReverseFind('/') + 1; }

// Searching from the base index keeps a dot of the directory part ("dir.old/list") from
// being taken for the extension; a result below the base index means "not found".
int PortFilename_t::GetExtIndex() const {
  const int base = GetBaseNameIndex();
  const int dot = filenameStr.ReverseFind('.', base);
  return dot >= base ? dot : -1;
}

PortString_t PortFilename_t::GetBaseFileName() const {
  const int base = GetBaseNameIndex();
  return filenameStr.Substr(base, filenameStr.GetLength() - base);
}

PortString_t PortFilename_t::GetBaseName() const {
  const int base = GetBaseNameIndex();
  const int dot = GetExtIndex();
  const int end = dot >= 0 ? dot : filenameStr.GetLength();
  return filenameStr.Substr(base, end - base);
}

PortString_t PortFilename_t::GetDirName() const {
  return filenameStr.Substr(0, GetBaseNameIndex());
}

PortString_t PortFilename_t::GetExtName() const {
  const int dot = GetExtIndex();
  if (dot < 0) {
    return PortString_t();
  }
  return filenameStr.Substr(dot, filenameStr.GetLength() - dot);
}

void PortFilename_t::ChangeExt(const PortString_t& aExt) {
  const int dot = GetExtIndex();
  if (dot < 0) {
    Set(filenameStr + aExt);
  } else {
    Set(filenameStr.Substr(0, dot) + aExt);
  }
}

void PortFilename_t::DefaultExt(const PortString_t& aExt) {
  if (GetExtIndex() < 0) {
    Set(filenameStr + aExt);
  }
}

void PortFilename_t::Error() {
  PortString_t& message = PortErrorGetStr();
  message = "'" + nakedStr + "'" + PortErrorGetMsg(IllegalFilename);
  PortErrorThrow(message);
}
