// qorUnpack: lists, tests and extracts the archives that qorLink writes.
#include <cstdio>
#include <cstring>
#include <exception>

#include "port/src/string.h"
#include "src/unpackextract.h"
#include "src/unpacklist.h"
#include "src/unpacktest.h"

namespace {

const int kExitSuccess = 0;
const int kExitFailure = 1;  // a damaged archive, or any failure while working
const int kExitUsage = 2;

const char kUsage[] =
    "usage: qorUnpack list ARCHIVE\n"
    "       qorUnpack test ARCHIVE\n"
    "       qorUnpack extract ARCHIVE [-C DIR] [-f] [--no-verify]\n"
    "       qorUnpack --version\n";

struct qorUnpackArgs_t {
  const char* command = nullptr;
  const char* archive = nullptr;
  const char* dir = ".";
  qorExtractOptions_t extract;
};

int UsageError(const char* aFormat, const char* aArg) {
  fputs("qorUnpack: ", stderr);
  fprintf(stderr, aFormat, aArg);
  fputs("\n", stderr);
  fputs(kUsage, stderr);
  return kExitUsage;
}

// Fills aArgs from the command line; returns kExitSuccess or the usage error's status.
int ParseArgs(int argc, char** argv, qorUnpackArgs_t& aArgs) {
  if (argc < 2) return UsageError("no command given%s", "");
  aArgs.command = argv[1];
  const bool extract = strcmp(aArgs.command, "extract") == 0;
  if (!extract && strcmp(aArgs.command, "list") != 0 && strcmp(aArgs.command, "test") != 0) {
    return UsageError("unknown command '%s'", aArgs.command);
  }
  for (int i = 2; i < argc; ++i) {
    const char* arg = argv[i];
    if (extract && strcmp(arg, "-C") == 0) {
      if (i + 1 >= argc) return UsageError("%s needs a directory", arg);
      aArgs.dir = argv[++i];
    } else if (extract && strcmp(arg, "-f") == 0) {
      aArgs.extract.force = true;
    } else if (extract && strcmp(arg, "--no-verify") == 0) {
      aArgs.extract.verify = false;
    } else if (arg[0] == '-' && arg[1] != '\0') {
      return UsageError("unknown option '%s'", arg);
    } else if (aArgs.archive != nullptr) {
      return UsageError("more than one archive given ('%s')", arg);
    } else {
      aArgs.archive = arg;
    }
  }
  if (aArgs.archive == nullptr) return UsageError("no archive given%s", "");
  return kExitSuccess;
}

int Run(const qorUnpackArgs_t& aArgs) {
  if (strcmp(aArgs.command, "list") == 0) {
    UnpackList(aArgs.archive, stdout);
  } else if (strcmp(aArgs.command, "test") == 0) {
    if (UnpackTest(aArgs.archive, stdout) > 0) return kExitFailure;
  } else {
    UnpackExtract(aArgs.archive, aArgs.dir, aArgs.extract);
  }
  return kExitSuccess;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc == 2 && strcmp(argv[1], "--version") == 0) {
    puts("qorUnpack version 0.01");
    return kExitSuccess;
  }
  if (argc == 2 && (strcmp(argv[1], "--help") == 0 || strcmp(argv[1], "-h") == 0)) {
    fputs(kUsage, stdout);
    return kExitSuccess;
  }
  qorUnpackArgs_t args;
  const int usage_status = ParseArgs(argc, argv, args);
  if (usage_status != kExitSuccess) return usage_status;
  // Files written before a failure stay, as with tar: the message names where it stopped.
  try {
    return Run(args);
  } catch (const std::exception& e) {
    fprintf(stderr, "qorUnpack: %s\n", e.what());
  } catch (const PortString_t& text) {
    fprintf(stderr, "qorUnpack: %s\n", text.c_str());
  } catch (const char* text) {
    fprintf(stderr, "qorUnpack: %s\n", text);
  }
  return kExitFailure;
}
