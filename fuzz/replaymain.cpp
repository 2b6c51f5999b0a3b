// Runs a fuzz target without libFuzzer: every file named on the command line, and every file
// of every directory named, is given to LLVMFuzzerTestOneInput once. A finding aborts (a failed
// property) or is reported by the sanitizers of the build, so exit status 0 means all passed.
#include <dirent.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize);

namespace {

// The files to replay for one argument, in name order so runs are repeatable.
std::vector<std::string> InputsOf(const std::string& aPath) {
  struct stat info;
  if (stat(aPath.c_str(), &info) != 0) return {};
  if (!S_ISDIR(info.st_mode)) return {aPath};
  std::vector<std::string> files;
  if (DIR* dir = opendir(aPath.c_str())) {
    while (dirent* item = readdir(dir)) {
      std::string name = item->d_name;
      if (name != "." && name != "..") files.push_back(aPath + "/" + name);
    }
    closedir(dir);
  }
  std::sort(files.begin(), files.end());
  return files;
}

}  // namespace

int main(int argc, char** argv) {
  int replayed = 0;
  for (int i = 1; i < argc; ++i) {
    std::vector<std::string> files = InputsOf(argv[i]);
    if (files.empty()) {
      fprintf(stderr, "replay: nothing to replay in %s\n", argv[i]);
      return 2;
    }
    for (const std::string& file : files) {
      std::ifstream in(file, std::ios::binary);
      std::vector<uint8_t> bytes((std::istreambuf_iterator<char>(in)),
                                 std::istreambuf_iterator<char>());
      LLVMFuzzerTestOneInput(bytes.data(), bytes.size());
      ++replayed;
    }
  }
  fprintf(stderr, "replay: %d inputs passed\n", replayed);
  return 0;
}
