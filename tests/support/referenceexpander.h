// ReferenceExpand: the payload format read byte by byte, every rule checked at the byte it
// concerns. The expander must give the same verdict and the same bytes on any payload.
#ifndef TESTS_SUPPORT_REFERENCEEXPANDER_H
#define TESTS_SUPPORT_REFERENCEEXPANDER_H

#include <string>

// The expansion of `aPayload` to `aRealSize` bytes into `aOut`, or false for a malformed one.
bool ReferenceExpand(const std::string& aPayload, int aRealSize, std::string& aOut);

#endif
