#include "src/responsefile.h"

#include "port/src/filename.h"
#include "port/src/filestream.h"
#include "src/entrywriter.h"

namespace {

const int kErrOpen = 7;

void ApplyDirective(const PortString_t& first_word, const char* resp_name_p,
                    qorDirectiveState_t& state) {
  PortString_t word(first_word.c_str() + 1);
  if (CaseCompare(word, "compress") == 0 || CaseCompare(word, "comp") == 0) {
    state.comp_default = true;
  } else if (CaseCompare(word, "nocompress") == 0 || CaseCompare(word, "nocomp") == 0) {
    state.comp_default = false;
  } else if (CaseCompare(word, "setfilename") == 0) {
    state.fname_default = true;
  } else if (CaseCompare(word, "nosetfilename") == 0) {
    state.fname_default = false;
  } else if (CaseCompare(word, "noendrecord") == 0) {
    state.no_end_rec = true;
  } else {
    throw PortString_t::Format("%s:%d: unknow directive %s.", resp_name_p, state.line_num,
                               first_word.c_str());
  }
}

void LinkFile(PortStringToken_t& token, PortStream_t& dst_strm,
              const qorFileIdentity_t& archive, const qorDirectiveState_t& state) {
  PortFilename_t src_name;
  src_name.Set(token.get(0));
  PortString_t ext = src_name.GetExtName();
  PortFileStream_t src_strm;
  src_strm.ReadOpen(src_name.GetFilename());
  // Copying the archive into itself would read what this very run is writing.
  if (archive.IsSameAs(src_name.GetFilename())) src_strm.Error(kErrOpen);
  token.erase(0);
  WriteEntry(dst_strm, src_strm, src_name, QorMergeModeOfExt(ext), token, state.comp_default,
             state.fname_default);
}

}  // namespace

void ReadResponseFile(PortStringReader_t& reader, PortStringToken_t& token,
                      PortStream_t& dst_strm, const char* resp_name_p,
                      const qorFileIdentity_t& archive, qorDirectiveState_t& state) {
  while (!reader.eof()) {
    ++state.line_num;
    PortString_t line = reader.gets();
    if (token.parse(line) == 0) continue;
    if (token.get(0)[0] == '%') {
      ApplyDirective(token.get(0), resp_name_p, state);
    } else {
      LinkFile(token, dst_strm, archive, state);
    }
  }
}
