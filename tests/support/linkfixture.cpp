#include "tests/support/linkfixture.h"

#include <fcntl.h>
#include <ftw.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <stdexcept>

#include "qorCompress/src/qorCompress.h"
#include "tests/support/teststream.h"

LinkTempDir_t::LinkTempDir_t() {
  const char* base = getenv("TMPDIR");
  std::string pattern = std::string(base != nullptr && *base != '\0' ? base : "/tmp") +
                        "/qorlink-test-XXXXXX";
  std::vector<char> buffer(pattern.begin(), pattern.end());
  buffer.push_back('\0');
  if (mkdtemp(buffer.data()) == nullptr) throw std::runtime_error("mkdtemp failed");
  path = buffer.data();
}

LinkTempDir_t::~LinkTempDir_t() {
  nftw(
      path.c_str(),
      [](const char* aName, const struct stat*, int, struct FTW*) { return remove(aName); },
      16, FTW_DEPTH | FTW_PHYS);
}

void LinkTempDir_t::Put(const std::string& aRelative, const std::string& aBytes) const {
  for (size_t slash = aRelative.find('/'); slash != std::string::npos;
       slash = aRelative.find('/', slash + 1)) {
    mkdir((path + "/" + aRelative.substr(0, slash)).c_str(), 0777);
  }
  WriteBytes(*this / aRelative, aBytes);
}

bool FileExists(const std::string& aPath) {
  struct stat info;
  return lstat(aPath.c_str(), &info) == 0;
}

std::string ReadBytes(const std::string& aPath) {
  std::ifstream in(aPath, std::ios::binary);
  std::ostringstream bytes;
  bytes << in.rdbuf();
  return bytes.str();
}

void WriteBytes(const std::string& aPath, const std::string& aBytes) {
  std::ofstream out(aPath, std::ios::binary | std::ios::trunc);
  out.write(aBytes.data(), static_cast<std::streamsize>(aBytes.size()));
  if (!out) throw std::runtime_error("cannot write " + aPath);
}

ToolRun_t RunTool(const std::string& aProgram, const std::vector<std::string>& aArgs,
                  const std::string& aCwd) {
  LinkTempDir_t capture;
  std::string out_path = capture / "stdout";
  std::string err_path = capture / "stderr";
  std::vector<char*> argv;
  argv.push_back(const_cast<char*>(aProgram.c_str()));
  for (const std::string& arg : aArgs) argv.push_back(const_cast<char*>(arg.c_str()));
  argv.push_back(nullptr);

  fflush(nullptr);
  pid_t child = fork();
  if (child == 0) {
    int in = open("/dev/null", O_RDONLY);
    int out = open(out_path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0666);
    int err = open(err_path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0666);
    if (in < 0 || out < 0 || err < 0 || chdir(aCwd.c_str()) != 0) _exit(126);
    dup2(in, 0);
    dup2(out, 1);
    dup2(err, 2);
    execv(aProgram.c_str(), argv.data());
    _exit(127);
  }
  int wait_status = 0;
  if (child < 0 || waitpid(child, &wait_status, 0) != child) {
    throw std::runtime_error("cannot run " + aProgram);
  }
  ToolRun_t run;
  run.status = WIFEXITED(wait_status) ? WEXITSTATUS(wait_status) : 128 + WTERMSIG(wait_status);
  run.out = ReadBytes(out_path);
  run.err = ReadBytes(err_path);
  return run;
}

namespace {
void PutLe(std::string& aBytes, uint32_t aValue, int aWidth) {
  for (int i = 0; i < aWidth; ++i) aBytes += static_cast<char>((aValue >> (8 * i)) & 0xFF);
}
}  // namespace

std::string EntryHeader(uint8_t aType, uint8_t aCompression, uint16_t aUserId,
                        uint32_t aFileSize, const char aMagic[4], uint32_t aRealSize) {
  std::string bytes;
  PutLe(bytes, aType, 1);
  PutLe(bytes, aCompression, 1);
  PutLe(bytes, aUserId, 2);
  PutLe(bytes, aFileSize, 4);
  bytes.append(aMagic, 4);
  PutLe(bytes, aRealSize, 4);
  return bytes;
}

std::string Zeros(size_t aCount) { return std::string(aCount, '\0'); }

std::string EndRecord() { return EntryHeader(0xFF, 0, 0, 16, "END0", 0) + Zeros(48); }

uint32_t Le32At(const std::string& aBytes, size_t aOffset) {
  uint32_t value = 0;
  for (int i = 3; i >= 0; --i) {
    value = (value << 8) | static_cast<unsigned char>(aBytes.at(aOffset + i));
  }
  return value;
}

std::string Pattern(size_t aLength, unsigned aSeed) {
  std::string bytes;
  unsigned state = aSeed * 2654435761u + 1;
  while (bytes.size() < aLength) {
    state = state * 1103515245u + 12345u;
    unsigned pick = (state >> 16) % 4;
    if (pick == 0) bytes.append("tile ");
    else if (pick == 1) bytes.append(3, '\0');
    else bytes += static_cast<char>(state >> 24);
  }
  bytes.resize(aLength);
  return bytes;
}

std::string Expand(const std::string& aPayload, uint32_t aRealSize) {
  TestStream_t payload(aPayload);
  TestStream_t expanded;
  qorExpander_t().expand(expanded, payload, static_cast<int>(aPayload.size()),
                         static_cast<int>(aRealSize));
  return expanded.Content();
}
