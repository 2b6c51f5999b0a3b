#include "src/linkrun.h"

#include "port/src/error.h"
#include "port/src/filename.h"
#include "port/src/filestream.h"
#include "port/src/stringreader.h"
#include "port/src/stringtoken.h"
#include "src/entrywriter.h"
#include "src/outputguard.h"
#include "src/responsefile.h"

namespace {

const int kErrCreate = 6;

void DeriveNames(const char* resp_name_p, const char* dst_name_p, PortFilename_t& resp_name,
                 PortFilename_t& dst_name) {
  resp_name.Set(resp_name_p);
  resp_name.DefaultExt(".ls");
  if (dst_name_p != nullptr) {
    dst_name.Set(dst_name_p);
    dst_name.DefaultExt(".LB");
  } else {
    dst_name.Set(resp_name.GetBaseFileName());
    dst_name.ChangeExt(".LB");
  }
}

// Creating the archive truncates it, so an archive that is the response file would destroy
// the list before it is read.
void RefuseOutputOverInput(const PortFilename_t& resp_name, const PortFilename_t& dst_name) {
  if (!qorFileIdentity_t(resp_name.GetFilename()).IsSameAs(dst_name.GetFilename())) return;
  PortString_t& text = PortErrorGetStr();
  text = dst_name.GetFilename() + PortErrorGetMsg(kErrCreate);
  PortErrorThrow(text);
}

}  // namespace

void LinkRun(const char* resp_name_p, const char* dst_name_p) {
  PortFilename_t resp_name;
  PortFilename_t dst_name;
  DeriveNames(resp_name_p, dst_name_p, resp_name, dst_name);

  PortFileStream_t resp_strm;
  resp_strm.ReadOpen(resp_name.GetFilename());
  PortStringReader_t reader(&resp_strm);
  PortStringToken_t token;
  token.setCommentChar("#;");

  RefuseOutputOverInput(resp_name, dst_name);
  qorOutputGuard_t dst_guard;
  PortFileStream_t dst_strm;
  dst_strm.WriteOpen(dst_name.GetFilename());
  dst_guard.Arm(dst_name.GetFilename());

  qorDirectiveState_t state;
  ReadResponseFile(reader, token, dst_strm, resp_name_p,
                   qorFileIdentity_t(dst_name.GetFilename()), state);
  if (!state.no_end_rec) WriteEndRecord(dst_strm);
  // Closing flushes the last buffered bytes, which may still fail (a full disk).
  dst_strm.Close();
  dst_guard.Disarm();
}
