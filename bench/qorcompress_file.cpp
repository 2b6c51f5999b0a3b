// qorcompress_file IN OUT: compresses the file IN into the payload file OUT through file
// streams, so that compare.sh can time the compressor as a whole process, as it times gzip.
#include <cstdio>

#include "port/src/filestream.h"
#include "qorCompress/src/qorCompress.h"

int main(int argc, char** argv) {
  if (argc != 3) {
    std::fprintf(stderr, "usage: qorcompress_file IN OUT\n");
    return 1;
  }
  try {
    PortFileStream_t src;
    PortFileStream_t dst;
    src.ReadOpen(argv[1]);
    dst.WriteOpen(argv[2]);
    qorCompressor_t().compress(dst, src, src.GetLength());
    dst.Close();
  } catch (const char* text) {
    std::fprintf(stderr, "%s\n", text);
    return 1;
  }
  return 0;
}
