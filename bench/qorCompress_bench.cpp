// Throughput of qorCompressor_t and qorExpander_t in MB/s of original bytes, on the corpus
// files and on synthetic input classes, and of the exhaustive search on a slice of
// freedoom2.wad for comparison. Streams are flat buffers, so the codec alone is timed.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/referencecompressor.h"

namespace {

// Reads from a fixed buffer; keeps what is written in a buffer reused across iterations.
class FlatStream_t : public PortStream_t {
 public:
  explicit FlatStream_t(const std::string& aContent = std::string()) : data(aContent) {
    SetReadable();
    SetWritable();
  }
  void Restart() {
    pos = 0;
    written = 0;
  }
  int Write(const void* aPtr, int aLength) override {
    if (written + static_cast<size_t>(aLength) > data.size()) data.resize(2 * (written + aLength));
    std::memcpy(&data[written], aPtr, aLength);
    written += aLength;
    return aLength;
  }
  int Read(void* aPtr, int aLength) override {
    const int count = std::min<int>(aLength, static_cast<int>(data.size()) - pos);
    std::memcpy(aPtr, data.data() + pos, count);
    pos += count;
    return count;
  }
  void Seek(PortStreamUnit_t aPos, int) override { pos = aPos; }
  PortStreamUnit_t GetPosition() override { return pos; }
  PortStreamUnit_t GetLength() override { return static_cast<PortStreamUnit_t>(data.size()); }
  std::string Written() const { return data.substr(0, written); }

 private:
  std::string data;
  int pos = 0;
  size_t written = 0;
};

std::string LoadCorpusFile(const char* aName) {
  const char* dir = std::getenv("QOR_CORPUS");
  const std::string path = std::string(dir != nullptr ? dir : QOR_DEFAULT_CORPUS) + "/" + aName;
  std::string data;
  if (FILE* f = std::fopen(path.c_str(), "rb")) {
    char block[65536];
    size_t n;
    while ((n = std::fread(block, 1, sizeof block, f)) > 0) data.append(block, n);
    std::fclose(f);
  }
  if (data.empty()) {
    std::fprintf(stderr, "%s: missing; build it with make-corpus.sh or set QOR_CORPUS\n",
                 path.c_str());
    std::exit(1);
  }
  return data;
}

const int kSynthetic = 8 << 20;

std::string Synthetic(int aKind) {
  std::mt19937 rng(42);
  std::string data(kSynthetic, '\0');
  switch (aKind) {
    case 0:  // random bytes
      for (char& c : data) c = static_cast<char>(rng());
      break;
    case 1:  // zeros
      break;
    case 2:  // bytes drawn from {1, 2}
      for (char& c : data) c = static_cast<char>(1 + (rng() & 1));
      break;
    case 3:  // short runs of one byte followed by another
      for (size_t i = 0; i < data.size();) {
        const size_t leng = 1 + rng() % 6;
        const char b = static_cast<char>(rng() % 4);
        for (size_t k = 0; k < leng && i < data.size(); ++k) data[i++] = b;
      }
      break;
    default: {  // a period of 700 random bytes
      std::string pattern;
      for (int i = 0; i < 700; ++i) pattern += static_cast<char>(rng());
      for (size_t i = 0; i < data.size(); ++i) data[i] = pattern[i % 700];
    }
  }
  return data;
}

// The inputs, made on first use so that a filtered run builds only what it needs.
struct Input_t {
  const char* name;
  int kind;  // -1, -2: corpus files; -3: the slice of freedoom2.wad; 0..4: Synthetic
  std::string data;
  const std::string& Get() {
    if (data.empty()) {
      if (kind == -1) data = LoadCorpusFile("freedoom2.wad");
      if (kind == -2) data = LoadCorpusFile("utf16.txt");
      if (kind == -3) data = LoadCorpusFile("freedoom2.wad").substr(0, 2 << 20);
      if (kind >= 0) data = Synthetic(kind);
    }
    return data;
  }
};

void SetMBps(benchmark::State& aState, size_t aBytes) {
  aState.SetBytesProcessed(static_cast<int64_t>(aBytes) * aState.iterations());
}

void Compress(benchmark::State& aState, Input_t* aSource) {
  const std::string* aInput = &aSource->Get();
  FlatStream_t src(*aInput);
  FlatStream_t dst;
  qorCompressor_t compressor;
  for (auto _ : aState) {
    src.Restart();
    dst.Restart();
    compressor.compress(dst, src, static_cast<int>(aInput->size()));
  }
  SetMBps(aState, aInput->size());
  aState.counters["ratio"] = static_cast<double>(aInput->size()) / dst.Written().size();
}

void Expand(benchmark::State& aState, Input_t* aSource) {
  const std::string* aInput = &aSource->Get();
  FlatStream_t src(*aInput);
  FlatStream_t payload_strm;
  qorCompressor_t().compress(payload_strm, src, static_cast<int>(aInput->size()));
  FlatStream_t payload(payload_strm.Written());
  FlatStream_t dst;
  qorExpander_t expander;
  for (auto _ : aState) {
    payload.Restart();
    dst.Restart();
    expander.expand(dst, payload, payload.GetLength(), static_cast<int>(aInput->size()));
  }
  if (dst.Written() != *aInput) aState.SkipWithError("expansion differs from the input");
  SetMBps(aState, aInput->size());
}

void Exhaustive(benchmark::State& aState, Input_t* aSource) {
  const std::string* aInput = &aSource->Get();
  ReferenceCompressor reference;
  for (auto _ : aState) benchmark::DoNotOptimize(reference.Compress(*aInput));
  SetMBps(aState, aInput->size());
}

}  // namespace

int main(int argc, char** argv) {
  static Input_t inputs[] = {
      {"freedoom2.wad", -1, {}}, {"utf16.txt", -2, {}},  {"random", 0, {}},
      {"zeros", 1, {}},          {"alphabet12", 2, {}},  {"shortruns", 3, {}},
      {"period700", 4, {}},      {"freedoom2.wad[0:2MB]", -3, {}}};
  for (Input_t& input : inputs) {
    benchmark::RegisterBenchmark((std::string("compress/") + input.name).c_str(), Compress, &input)
        ->Unit(benchmark::kMillisecond)->UseRealTime();
    benchmark::RegisterBenchmark((std::string("expand/") + input.name).c_str(), Expand, &input)
        ->Unit(benchmark::kMillisecond)->UseRealTime();
  }
  for (int i : {7, 0}) {
    benchmark::RegisterBenchmark((std::string("exhaustive/") + inputs[i].name).c_str(), Exhaustive,
                                 &inputs[i])
        ->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(1);
  }
  benchmark::Initialize(&argc, argv);
  benchmark::RunSpecifiedBenchmarks();
  benchmark::Shutdown();
  return 0;
}
