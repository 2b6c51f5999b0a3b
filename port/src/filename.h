// PortFilename_t: a file name kept as set (nakedStr) and with every backslash turned into
// a slash (filenameStr), the form all cuts read and files are opened by. The extension is
// the last component's text from its last dot on, dot included. Pure text: no file access.
#ifndef PORT_FILENAME_H
#define PORT_FILENAME_H

#include "port/src/string.h"

class PortFilename_t {
 public:
  PortFilename_t() {}
  PortFilename_t(const char* aStr) { Set(aStr); }
  PortFilename_t(const PortString_t& aStr) { Set(aStr); }
  PortFilename_t(const PortFilename_t& aName) = default;
  PortFilename_t& operator=(const PortFilename_t& aName) = default;

  void Set(const PortString_t& aStr);
  void Clear();
  const PortString_t& GetFilename() const { return filenameStr; }
  const PortString_t& GetNakedStr() const { return nakedStr; }
  operator const PortString_t&() const { return filenameStr; }

  int GetBaseNameIndex() const;         // just after the last slash, 0 without one
  PortString_t GetBaseFileName() const;  // last component, extension included
  PortString_t GetBaseName() const;      // last component without extension
  PortString_t GetDirName() const;       // text before the base index, trailing slash kept
  PortString_t GetExtName() const;       // extension with its dot, or empty

  void ChangeExt(const PortString_t& aExt);   // replaces or appends; aExt carries its own dot
  void DefaultExt(const PortString_t& aExt);  // appends only when there is no extension

 protected:
  [[noreturn]] void Error();  // raises "'" + nakedStr + "'" + " illegal filename."

 private:
  int GetExtIndex() const;  // index of the extension's dot, -1 without an extension

  PortString_t nakedStr;
  PortString_t filenameStr;
};

#endif
