// Test helpers for the payload codec: hex literals, and the compressor and the expander run
// over strings through TestStream_t.
#ifndef TESTS_SUPPORT_PAYLOADRUN_H
#define TESTS_SUPPORT_PAYLOADRUN_H

#include <cstdint>
#include <string>

// "41 00 ff" -> the three bytes; blanks and '|' are ignored.
std::string Hex(const char* aText);
std::string CompressString(const std::string& aInput);
// Raises what qorExpander_t::expand raises.
std::string ExpandString(const std::string& aPayload, int aRealSize);
// Nonzero bytes, no two neighbours equal, no 3 bytes recurring within 1024 bytes: nothing
// for the compressor to find.
std::string IncompressibleBytes(int aLength, uint32_t aSeed);

#endif
