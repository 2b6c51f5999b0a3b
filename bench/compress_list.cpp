// compress_list LIST: compresses every file that the response file LIST names, each on its
// own into memory as the link tool does, and prints the largest payload. Its run time is the
// compressor's own cost for the bytes of a link, without the archive around them.
#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>

#include "port/src/filestream.h"
#include "port/src/memorystream.h"
#include "qorCompress/src/qorCompress.h"

int main(int argc, char** argv) {
  if (argc != 2) {
    fprintf(stderr, "usage: compress_list LIST\n");
    return 2;
  }
  std::ifstream list(argv[1]);
  std::string line;
  long files = 0;
  long long in_bytes = 0;
  long long out_bytes = 0;
  long largest = 0;
  try {
    while (std::getline(list, line)) {
      std::istringstream words(line);
      std::string name;
      if (!(words >> name) || name[0] == '%' || name[0] == ';' || name[0] == '#') continue;
      PortFileStream_t src;
      src.ReadOpen(name.c_str());
      PortMemoryStream_t payload;
      qorCompressor_t compressor;
      int length = src.GetLength();
      compressor.compress(payload, src, length);
      ++files;
      in_bytes += length;
      out_bytes += payload.GetLength();
      if (payload.GetLength() > largest) largest = payload.GetLength();
    }
  } catch (const char* text) {
    fprintf(stderr, "compress_list: %s\n", text);
    return 1;
  }
  printf("%ld files, %lld -> %lld bytes, largest payload %ld bytes\n", files, in_bytes,
         out_bytes, largest);
  return 0;
}
