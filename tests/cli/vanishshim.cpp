// An LD_PRELOAD library for the fault-injection tests: once the program opens the file named
// by QOR_VANISH_AFTER, the file named by QOR_VANISH_FILE is removed, so a listed file
// disappears between two lines of a response file at an exactly known point.
#include <dlfcn.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace {

typedef FILE* (*OpenFn_t)(const char*, const char*);

FILE* OpenThenVanish(const char* aSymbol, const char* aPath, const char* aMode) {
  OpenFn_t real = reinterpret_cast<OpenFn_t>(dlsym(RTLD_NEXT, aSymbol));
  FILE* file = real(aPath, aMode);
  const char* after = getenv("QOR_VANISH_AFTER");
  const char* victim = getenv("QOR_VANISH_FILE");
  if (file != nullptr && after != nullptr && victim != nullptr && strcmp(aPath, after) == 0) {
    unlink(victim);
  }
  return file;
}

}  // namespace

extern "C" FILE* fopen(const char* aPath, const char* aMode) {
  return OpenThenVanish("fopen", aPath, aMode);
}

extern "C" FILE* fopen64(const char* aPath, const char* aMode) {
  return OpenThenVanish("fopen64", aPath, aMode);
}
