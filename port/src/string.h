// PortString_t: the one string type. An object is a single pointer to a shared,
// reference-counted body (copy on write); every empty string shares one static body
// that is never written nor freed. A body made for n characters has room for
// 16 * (n / 16 rounded up + 1) characters: 16 to 31 spare, linear growth, no doubling.
#ifndef PORT_STRING_H
#define PORT_STRING_H

#include <cstdint>

typedef char PORT_char_t;
typedef int32_t PORT_s32_t;
typedef uint32_t PORT_u32_t;

class PortSerializeWriter_t;
class PortSerializeReader_t;

// The body: counters and characters in one allocation of at least allocLength + 1 characters.
struct PortStringData_t {
  PORT_s32_t refCount;
  PORT_s32_t length;
  PORT_s32_t allocLength;
  PORT_char_t p[1];

  void Attach() { ++refCount; }
  void Detach();  // frees the body when the count reaches 0, never the shared empty body
};

class PortString_t {
 public:
  PortString_t();
  PortString_t(const PortString_t& aStr);
  PortString_t(const PORT_char_t* aStr);               // aStr must not be null
  PortString_t(const PORT_char_t* aStr, int aLeng);    // null or aLeng <= 0: empty
  PortString_t(char aCh, int aRepLeng);                // aRepLeng <= 0 raises code 3
  ~PortString_t();

  void Clear();

  int GetLength() const { return data->length; }
  int size() const { return data->length; }
  const PORT_char_t* GetCharPtr() const { return data->p; }
  const PORT_char_t* c_str() const { return data->p; }
  operator const PORT_char_t*() const { return data->p; }
  PORT_char_t operator[](int i) const { return data->p[i]; }

  const PortString_t& operator=(const PortString_t& aStr);
  const PortString_t& operator=(const PORT_char_t* aStr);  // may point into this string
  const PortString_t& operator=(char aCh);
  const PortString_t& operator+=(const PortString_t& aStr);
  const PortString_t& operator+=(const PORT_char_t* aStr);  // null: no change
  const PortString_t& operator+=(char aCh);

  bool operator==(const PortString_t& aStr) const;
  bool operator==(const PORT_char_t* aStr) const;
  bool operator!=(const PortString_t& aStr) const;
  bool operator!=(const PORT_char_t* aStr) const;

  // Searches. ReverseFind(aCh, aLimit) returns a value below max(aLimit, 0) when nothing
  // is found at or above it: callers test "result >= limit", never "result != -1".
  int Find(char aCh) const;
  int Find(char aCh, int aLimit) const;
  int ReverseFind(char aCh) const;
  int ReverseFind(char aCh, int aLimit) const;
  int Replace(char aFrom, char aTo);  // copies a shared body once, only if something matches
  PortString_t Substr(int aFrom, int aLength) const;
  PortString_t LabelString() const;

  // Whole-text conversions with base 0 and 32-bit ranges ("-1" gives 4294967295 as unsigned).
  // The flag is set on failure and cleared on success; a null flag pointer turns a failure
  // into a thrown const char* ("ERROR : PortString_t::ToInt" / "ERROR : PortString_t::ToFloat").
  int ToInt(bool* aErrorFlagPtr) const;
  unsigned int ToUint(bool* aErrorFlagPtr) const;
  double ToFloat(bool* aErrorFlagPtr) const;

  // printf-style. Raises code 3 when the formatter fails for a reason other than room
  // (an argument the locale cannot encode, such as a wide character under "C").
  static PortString_t Format(const PORT_char_t* aStr, ...)
      __attribute__((format(printf, 1, 2)));

  // Serialized as a 4-byte length, then a text record (4-byte count and the characters).
  void Write(PortSerializeWriter_t& aWriter);
  void Read(PortSerializeReader_t& aReader);

 protected:
  void Alloc(int aLength);
  void Realloc(int aLength);
  void Individualize();
  void NewString(const PORT_char_t* aStr, int aLength);
  void NewString2(const PORT_char_t* aStr1, int aLeng1, const PORT_char_t* aStr2, int aLeng2);
  void Append(const PORT_char_t* aStr, int aLength);

  PortStringData_t* data;

 private:
  friend struct PortStringInspector_t;  // test-only view of the body
  friend PortString_t operator+(const PortString_t&, const PortString_t&);
  friend PortString_t operator+(const PortString_t&, const PORT_char_t*);
  friend PortString_t operator+(const PORT_char_t*, const PortString_t&);
  friend PortString_t operator+(const PortString_t&, char);
  friend PortString_t operator+(char, const PortString_t&);
};

PortString_t operator+(const PortString_t& aStr1, const PortString_t& aStr2);
PortString_t operator+(const PortString_t& aStr1, const PORT_char_t* aStr2);
PortString_t operator+(const PORT_char_t* aStr1, const PortString_t& aStr2);
PortString_t operator+(const PortString_t& aStr, char aCh);
PortString_t operator+(char aCh, const PortString_t& aStr);

// strcmp-style results; texts end at their first NUL whatever their length says.
int Compare(const PortString_t& aStr1, const PortString_t& aStr2);
int Compare(const PortString_t& aStr1, const PortString_t& aStr2, int aLimit);
int CaseCompare(const PortString_t& aStr1, const PortString_t& aStr2);
int CaseCompare(const PortString_t& aStr1, const PortString_t& aStr2, int aLimit);

#endif
