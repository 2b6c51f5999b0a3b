#include "src/unpacktest.h"

#include <cinttypes>
#include <cstdio>

#include "src/archivereader.h"
#include "src/entrybody.h"

namespace {

void CheckEntry(qorArchiveReader_t& aReader, uint64_t& aExpanded) {
  const qorArchiveEntry_t& e = aReader.Entry();
  PortString_t name;
  if (e.header.NameBlockSize() > 0 && !e.NameText(name)) {
    aReader.AddProblem(e.offset + kQorHeaderSize, e.index,
                       "the name block holds no terminating zero byte");
  }
  aReader.CheckPadding();
  if (e.Method() == 0) {
    aExpanded += static_cast<uint64_t>(e.BodySize());
  } else if (e.Method() == 1) {
    qorDiscardStream_t sink;
    if (ExpandEntryBody(aReader, sink)) {
      aExpanded += e.header.realSize;
    } else {
      const qorArchiveProblem_t problem = BadBodyProblem(e);
      aReader.AddProblem(problem.offset, problem.index, problem.text);
    }
  } else {
    aReader.AddProblem(e.offset, e.index,
                       PortString_t::Format("unknown storage method %d in compression byte 0x%02X",
                                            e.Method(), e.header.compression));
  }
}

}  // namespace

int UnpackTest(const PortString_t& aArchive, FILE* aOut) {
  qorArchiveReader_t reader(aArchive);
  uint64_t expanded = 0;
  while (reader.Next()) CheckEntry(reader, expanded);
  const int problem_count = static_cast<int>(reader.Problems().size());
  for (const qorArchiveProblem_t& problem : reader.Problems()) {
    fprintf(aOut, "%s\n", reader.Describe(problem).c_str());
  }
  if (problem_count > 0) {
    fprintf(aOut, "%s: %d problem%s found\n", aArchive.c_str(), problem_count,
           problem_count == 1 ? "" : "s");
  } else {
    fprintf(aOut, "%s: %d entries, %" PRIu64 " bytes expanded, %s: OK\n", aArchive.c_str(),
           reader.EntryCount(), expanded,
           reader.State() == kQorWalkEndRecord ? "end record present" : "no end record");
  }
  return problem_count;
}
