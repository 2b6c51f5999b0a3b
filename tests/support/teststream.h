// TestStream_t: a stream for tests, backed by a std::string, that can be made to misbehave:
// access bits set at will, at most N bytes per Read/Write call (short transfers), and a
// raised " read error." / " write error." on the N-th call. It logs every call's asked size.
// Seeks use file semantics (origin 2 adds aPos to the end); targets outside 0..length raise
// " file operation fail." (code 13).
#ifndef TESTS_SUPPORT_TESTSTREAM_H
#define TESTS_SUPPORT_TESTSTREAM_H

#include <string>
#include <vector>

#include "port/src/stream.h"

class TestStream_t : public PortStream_t {
 public:
  // Readable and writable, positioned at 0, without cap or failure.
  explicit TestStream_t(const std::string& aContent = std::string(),
                        const char* aDescription = "<test stream>");

  void SetAccess(bool aReadable, bool aWritable);
  void SetCap(int aMaxPerCall);  // 0 or less: no cap
  // The aCall-th Read (resp. Write) call, counted from 1 since construction, raises code 9
  // (resp. 8) through Error before transferring anything; 0 never fails.
  void FailReadAt(int aCall) { failReadAt = aCall; }
  void FailWriteAt(int aCall) { failWriteAt = aCall; }

  const std::string& Content() const { return content; }
  // The aLength of every Read/Write call in order, including calls that raised.
  const std::vector<int>& ReadSizes() const { return readSizes; }
  const std::vector<int>& WriteSizes() const { return writeSizes; }
  const PortString_t& Description() const { return description; }

  int Write(const void* aPtr, int aLength) override;
  int Read(void* aPtr, int aLength) override;
  void Seek(PortStreamUnit_t aPos, int aWherence) override;
  PortStreamUnit_t GetPosition() override { return pos; }
  PortStreamUnit_t GetLength() override { return static_cast<PortStreamUnit_t>(content.size()); }

 protected:
  const PortString_t& GetDescription() const override { return description; }

 private:
  int Capped(int aLength) const;

  std::string content;
  PortStreamUnit_t pos = 0;
  int cap = 0;
  int failReadAt = 0;
  int failWriteAt = 0;
  std::vector<int> readSizes;
  std::vector<int> writeSizes;
  PortString_t description;
};

#endif
