// qorLink: links the data files listed in a response file into one archive.
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <exception>

#include "port/src/string.h"
#include "src/linkrun.h"

namespace {

// A failed link exits like a command-line error, so that a calling build stops.
const int kExitSuccess = 0;
const int kExitFailure = 1;

}  // namespace

void usage() {
  fputs("\n  usage: qorLink [options] respfile.ext<cr>\n\n  options:\n"
        "    -o or --output, <file> : set output filename <file>.\n\n",
        stderr);
}

void ErrorPrintf(const char* fmt, ...) {
  va_list args;
  va_start(args, fmt);
  vfprintf(stdout, fmt, args);
  va_end(args);
  putc('\n', stdout);
}

int main(int argc, char** argv) {
  char* resp_name_p = nullptr;
  char* dst_name_p = nullptr;
  for (int i = 1; i < argc; ++i) {
    char* arg_p = argv[i];
    if (arg_p[0] == '-') {
      ++arg_p;
      if (strcmp(arg_p, "o") == 0 || strcmp(arg_p, "-output") == 0) {
        if (i + 1 >= argc) {
          fprintf(stderr, "\nError : too few arguments.\n");
          return kExitFailure;
        }
        dst_name_p = argv[++i];
      } else if (strcmp(arg_p, "-version") == 0) {
        puts("\nqorLink version 0.01");
        return kExitFailure;
      } else {
        fprintf(stderr, "\nError : unknown option.[%s]\n", arg_p);
        usage();
        return kExitFailure;
      }
    } else if (resp_name_p != nullptr) {
      usage();
      return kExitFailure;
    } else {
      resp_name_p = arg_p;
    }
  }
  if (resp_name_p == nullptr) {
    fprintf(stderr, "\nError : no response file name.\n");
    return kExitFailure;
  }

  try {
    LinkRun(resp_name_p, dst_name_p);
  } catch (std::exception& e) {
    fprintf(stderr, "Exception : %s\n", e.what());
    return kExitFailure;
  } catch (PortString_t& message) {
    fprintf(stderr, "Exception : %s\n", message.c_str());
    return kExitFailure;
  } catch (const char* message) {
    fprintf(stderr, "Exception : %s\n", message);
    return kExitFailure;
  }
  return kExitSuccess;
}
