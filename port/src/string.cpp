#include "port/src/string.h"

#include <cctype>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <new>

#include "port/src/error.h"

namespace {

// Constant-initialised, so it is usable before any dynamic initialiser runs.
PortStringData_t nullString = {0, 0, 1, {0}};

const int MemoryNotEnough = 4;
const int IllegalParameter = 3;

// Room for aLength characters by the capacity rule, refCount 1, empty content. The block is
// sized in 64 bits so that lengths near INT_MAX are refused instead of wrapping around.
PortStringData_t* NewBody(int aLength) {
  const long long capacity = (static_cast<long long>(aLength) + 31) & ~15LL;
  if (aLength < 0 || capacity > INT_MAX) {
    PortErrorThrow(MemoryNotEnough);
  }
  char* block = new (std::nothrow)
      char[offsetof(PortStringData_t, p) + static_cast<size_t>(capacity) + 1];
  if (block == nullptr) {
    PortErrorThrow(MemoryNotEnough);
  }
  PortStringData_t* body = new (block) PortStringData_t;
  body->refCount = 1;
  body->length = 0;
  body->allocLength = static_cast<PORT_s32_t>(capacity);
  body->p[0] = 0;
  return body;
}

bool IsPrivate(const PortStringData_t* aBody) {
  return aBody != &nullString && aBody->refCount == 1;
}

// The length of two runs together; a sum beyond INT_MAX cannot be held by any body.
int SumLength(int aLeng1, int aLeng2) {
  const long long sum = static_cast<long long>(aLeng1) + aLeng2;
  if (sum > INT_MAX) {
    PortErrorThrow(MemoryNotEnough);
  }
  return static_cast<int>(sum);
}

bool LiesInside(const PORT_char_t* aStr, const PortStringData_t* aBody) {
  const std::less_equal<const PORT_char_t*> at_or_before;
  return at_or_before(aBody->p, aStr) && at_or_before(aStr, aBody->p + aBody->allocLength);
}

}  // namespace

void PortStringData_t::Detach() {
  if (--refCount == 0 && this != &nullString) {
    delete[] reinterpret_cast<char*>(this);
  }
}

// ---- primitives ----

void PortString_t::Alloc(int aLength) {
  if (data != nullptr && IsPrivate(data) && data->allocLength >= aLength) {
    data->length = 0;
    data->p[0] = 0;
    return;
  }
  // The new body is made before the old one is let go, so a failed allocation leaves the
  // string as it was and safe to destroy.
  PortStringData_t* body = NewBody(aLength);
  if (data != nullptr) {
    data->Detach();
  }
  data = body;
}

void PortString_t::Realloc(int aLength) {
  if (data == nullptr || data->length == 0) {
    Alloc(aLength);
    return;
  }
  if (IsPrivate(data) && data->allocLength >= aLength) {
    return;
  }
  PortStringData_t* body = NewBody(aLength > data->length ? aLength : data->length);
  memcpy(body->p, data->p, static_cast<size_t>(data->length) + 1);
  body->length = data->length;
  data->Detach();
  data = body;
}

void PortString_t::Individualize() {
  if (data == &nullString || data->refCount <= 1) {
    return;
  }
  PortStringData_t* body = NewBody(data->length);
  memcpy(body->p, data->p, static_cast<size_t>(data->length) + 1);
  body->length = data->length;
  data->Detach();
  data = body;
}

void PortString_t::NewString(const PORT_char_t* aStr, int aLength) {
  if (aStr == nullptr || aLength <= 0) {
    if (data != nullptr) {
      data->Detach();
    }
    data = &nullString;
    data->Attach();
    return;
  }
  if (data != nullptr && LiesInside(aStr, data)) {
    // Alloc may reuse this very body and overwrite the run before it is read.
    *this = PortString_t(aStr, aLength);
    return;
  }
  Alloc(aLength);
  memcpy(data->p, aStr, static_cast<size_t>(aLength));
  data->p[aLength] = 0;
  data->length = aLength;
}

void PortString_t::NewString2(const PORT_char_t* aStr1, int aLeng1, const PORT_char_t* aStr2,
                              int aLeng2) {
  const int total = SumLength(aLeng1, aLeng2);
  Alloc(total);
  memcpy(data->p, aStr1, static_cast<size_t>(aLeng1));
  memcpy(data->p + aLeng1, aStr2, static_cast<size_t>(aLeng2));
  data->p[total] = 0;
  data->length = total;
}

void PortString_t::Append(const PORT_char_t* aStr, int aLength) {
  if (aLength <= 0) {
    return;
  }
  const int old_length = data->length;
  const int new_length = SumLength(old_length, aLength);
  if (LiesInside(aStr, data) && !(IsPrivate(data) && data->allocLength >= new_length)) {
    // Realloc would release the body the run is read from (s += s): append a copy instead.
    const PortString_t run(aStr, aLength);
    Append(run.data->p, aLength);
    return;
  }
  Realloc(new_length);
  memmove(data->p + old_length, aStr, static_cast<size_t>(aLength));
  data->p[new_length] = 0;
  data->length = new_length;
}

// ---- construction ----

PortString_t::PortString_t() : data(&nullString) { data->Attach(); }

PortString_t::PortString_t(const PortString_t& aStr) : data(aStr.data) { data->Attach(); }

PortString_t::PortString_t(const PORT_char_t* aStr) : data(nullptr) {
  NewString(aStr, static_cast<int>(strlen(aStr)));
}

PortString_t::PortString_t(const PORT_char_t* aStr, int aLeng) : data(nullptr) {
  NewString(aStr, aLeng);
}

PortString_t::PortString_t(char aCh, int aRepLeng) : data(nullptr) {
  if (aRepLeng <= 0) {
    PortErrorThrow(IllegalParameter);
  }
  Alloc(aRepLeng);
  memset(data->p, aCh, static_cast<size_t>(aRepLeng));
  data->p[aRepLeng] = 0;
  data->length = aRepLeng;
}

PortString_t::~PortString_t() { data->Detach(); }

void PortString_t::Clear() {
  if (data == &nullString) {
    return;
  }
  data->Detach();
  data = &nullString;
  data->Attach();
}

// ---- assignment ----

const PortString_t& PortString_t::operator=(const PortString_t& aStr) {
  if (data != aStr.data) {
    data->Detach();
    data = aStr.data;
    data->Attach();
  }
  return *this;
}

const PortString_t& PortString_t::operator=(const PORT_char_t* aStr) {
  NewString(aStr, static_cast<int>(strlen(aStr)));
  return *this;
}

const PortString_t& PortString_t::operator=(char aCh) {
  Alloc(1);
  data->p[0] = aCh;
  data->p[1] = 0;
  data->length = 1;
  return *this;
}

const PortString_t& PortString_t::operator+=(const PortString_t& aStr) {
  Append(aStr.data->p, aStr.data->length);
  return *this;
}

const PortString_t& PortString_t::operator+=(const PORT_char_t* aStr) {
  if (aStr != nullptr) {
    Append(aStr, static_cast<int>(strlen(aStr)));
  }
  return *this;
}

const PortString_t& PortString_t::operator+=(char aCh) {
  Append(&aCh, 1);
  return *this;
}

// ---- concatenation ----

PortString_t operator+(const PortString_t& aStr1, const PortString_t& aStr2) {
  if (aStr1.GetLength() <= 0) {
    return aStr2;
  }
  if (aStr2.GetLength() <= 0) {
    return aStr1;
  }
  PortString_t result;
  result.NewString2(aStr1.data->p, aStr1.data->length, aStr2.data->p, aStr2.data->length);
  return result;
}

PortString_t operator+(const PortString_t& aStr1, const PORT_char_t* aStr2) {
  const int length2 = static_cast<int>(strlen(aStr2));
  if (length2 <= 0) {
    return aStr1;
  }
  if (aStr1.GetLength() <= 0) {
    return PortString_t(aStr2, length2);
  }
  PortString_t result;
  result.NewString2(aStr1.data->p, aStr1.data->length, aStr2, length2);
  return result;
}

PortString_t operator+(const PORT_char_t* aStr1, const PortString_t& aStr2) {
  const int length1 = static_cast<int>(strlen(aStr1));
  if (length1 <= 0) {
    return aStr2;
  }
  if (aStr2.GetLength() <= 0) {
    return PortString_t(aStr1, length1);
  }
  PortString_t result;
  result.NewString2(aStr1, length1, aStr2.data->p, aStr2.data->length);
  return result;
}

PortString_t operator+(const PortString_t& aStr, char aCh) {
  PortString_t result;
  if (aStr.GetLength() <= 0) {
    result = aCh;
  } else {
    result.NewString2(aStr.data->p, aStr.data->length, &aCh, 1);
  }
  return result;
}

PortString_t operator+(char aCh, const PortString_t& aStr) {
  PortString_t result;
  if (aStr.GetLength() <= 0) {
    result = aCh;
  } else {
    result.NewString2(&aCh, 1, aStr.data->p, aStr.data->length);
  }
  return result;
}

// ---- comparison ----

int Compare(const PortString_t& aStr1, const PortString_t& aStr2) {
  return strcmp(aStr1.c_str(), aStr2.c_str());
}

int Compare(const PortString_t& aStr1, const PortString_t& aStr2, int aLimit) {
  return aLimit <= 0 ? 0 : strncmp(aStr1.c_str(), aStr2.c_str(), static_cast<size_t>(aLimit));
}

int CaseCompare(const PortString_t& aStr1, const PortString_t& aStr2) {
  return strcasecmp(aStr1.c_str(), aStr2.c_str());
}

int CaseCompare(const PortString_t& aStr1, const PortString_t& aStr2, int aLimit) {
  return aLimit <= 0 ? 0
                     : strncasecmp(aStr1.c_str(), aStr2.c_str(), static_cast<size_t>(aLimit));
}

bool PortString_t::operator==(const PortString_t& aStr) const { return Compare(*this, aStr) == 0; }

bool PortString_t::operator==(const PORT_char_t* aStr) const {
  return strcmp(data->p, aStr) == 0;
}

bool PortString_t::operator!=(const PortString_t& aStr) const { return !(*this == aStr); }

bool PortString_t::operator!=(const PORT_char_t* aStr) const { return !(*this == aStr); }

// ---- search and edit ----

int PortString_t::Find(char aCh) const { return Find(aCh, data->length); }

int PortString_t::Find(char aCh, int aLimit) const {
  const int end = aLimit < data->length ? aLimit : data->length;
  for (int i = 0; i < end; ++i) {
    if (data->p[i] == aCh) {
      return i;
    }
  }
  return -1;
}

int PortString_t::ReverseFind(char aCh) const { return ReverseFind(aCh, 0); }

int PortString_t::ReverseFind(char aCh, int aLimit) const {
  const int lower = aLimit > 0 ? aLimit : 0;
  for (int i = data->length - 1; i >= lower; --i) {
    if (data->p[i] == aCh) {
      return i;
    }
  }
  return (data->length < lower ? data->length : lower) - 1;
}

int PortString_t::Replace(char aFrom, char aTo) {
  int count = 0;
  for (int i = 0; i < data->length; ++i) {
    if (data->p[i] == aFrom) {
      if (count == 0) {
        Individualize();
      }
      data->p[i] = aTo;
      ++count;
    }
  }
  return count;
}

PortString_t PortString_t::Substr(int aFrom, int aLength) const {
  // 64-bit arithmetic: a caller may pass INT_MAX for "the rest of the string".
  long long from = aFrom;
  long long count = aLength;
  if (from < 0) {
    count += from;
    from = 0;
  }
  if (from > data->length) {
    return PortString_t();
  }
  if (from + count > data->length) {
    count = data->length - from;
  }
  if (count <= 0) {
    return PortString_t();
  }
  return PortString_t(data->p + from, static_cast<int>(count));
}

PortString_t PortString_t::LabelString() const {
  PortString_t label;
  if (data->length == 0) {
    return label;
  }
  const unsigned char first = static_cast<unsigned char>(data->p[0]);
  const int prefix = isdigit(first) ? 1 : 0;
  const int length = SumLength(data->length, prefix);
  label.Alloc(length);
  if (prefix != 0) {
    label.data->p[0] = '_';
  }
  for (int i = 0; i < data->length; ++i) {
    const unsigned char ch = static_cast<unsigned char>(data->p[i]);
    label.data->p[prefix + i] = isalnum(ch) ? static_cast<PORT_char_t>(ch) : '_';
  }
  label.data->p[length] = 0;
  label.data->length = length;
  return label;
}

// ---- conversion to numbers ----

namespace {

const char* const IntConversionFailure = "ERROR : PortString_t::ToInt";
const char* const FloatConversionFailure = "ERROR : PortString_t::ToFloat";

// Sets the caller's flag, or throws the fixed literal when there is none to set.
void ReportConversion(bool aFailed, bool* aErrorFlagPtr, const char* aFailureText) {
  if (aErrorFlagPtr != nullptr) {
    *aErrorFlagPtr = aFailed;
  } else if (aFailed) {
    throw aFailureText;
  }
}

bool StartsNegative(const PORT_char_t* aStr) {
  while (isspace(static_cast<unsigned char>(*aStr))) {
    ++aStr;
  }
  return *aStr == '-';
}

}  // namespace

// The whole text must be converted: the end of the converted part has to be the string's
// terminating NUL, not a NUL held inside it.

int PortString_t::ToInt(bool* aErrorFlagPtr) const {
  char* end = nullptr;
  errno = 0;
  const long value = strtol(data->p, &end, 0);
  const bool failed = end != data->p + data->length || errno != 0 || value < INT_MIN ||
                      value > INT_MAX;
  ReportConversion(failed, aErrorFlagPtr, IntConversionFailure);
  return failed ? 0 : static_cast<int>(value);
}

unsigned int PortString_t::ToUint(bool* aErrorFlagPtr) const {
  char* end = nullptr;
  errno = 0;
  const unsigned long value = strtoul(data->p, &end, 0);
  // strtoul negates in unsigned long. A 32-bit conversion accepts a magnitude up to
  // UINT_MAX and negates it modulo 2^32, which is the low half of the 64-bit result.
  const unsigned long magnitude = StartsNegative(data->p) ? 0UL - value : value;
  const bool failed = end != data->p + data->length || errno != 0 || magnitude > UINT_MAX;
  ReportConversion(failed, aErrorFlagPtr, IntConversionFailure);
  return failed ? 0U : static_cast<unsigned int>(value & UINT_MAX);
}

double PortString_t::ToFloat(bool* aErrorFlagPtr) const {
  char* end = nullptr;
  errno = 0;
  const double value = strtod(data->p, &end);
  const bool failed = end != data->p + data->length || errno != 0;
  ReportConversion(failed, aErrorFlagPtr, FloatConversionFailure);
  return failed ? 0.0 : value;
}

// ---- formatting ----

PortString_t PortString_t::Format(const PORT_char_t* aStr, ...) {
  char local_buffer[1024];
  va_list args;
  va_start(args, aStr);
  const int length = vsnprintf(local_buffer, sizeof local_buffer, aStr, args);
  va_end(args);
  if (length < 0) {
    // An encoding error (or a text beyond INT_MAX): no buffer size would help, and growing
    // the buffer on every failure would never end.
    PortErrorThrow(IllegalParameter);
  }
  if (static_cast<size_t>(length) < sizeof local_buffer) {
    return PortString_t(local_buffer, length);
  }
  // The reported length is exact, so the text is formatted once more straight into a body
  // of that size instead of into doubling scratch buffers.
  PortString_t result;
  result.Alloc(length);
  va_start(args, aStr);
  vsnprintf(result.data->p, static_cast<size_t>(length) + 1, aStr, args);
  va_end(args);
  result.data->length = length;
  return result;
}
