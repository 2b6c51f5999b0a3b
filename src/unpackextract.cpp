#include "src/unpackextract.h"

#include "port/src/filename.h"
#include "port/src/memorystream.h"
#include "src/archivereader.h"
#include "src/entrybody.h"
#include "src/entryplan.h"
#include "src/extractdir.h"
#include "src/unpacklist.h"

namespace {

// The response file as it is built: qorLink's directive state is followed so that a
// directive line appears only where the next entry needs another setting.
class qorResponseText_t {
 public:
  qorResponseText_t() : comp(true), setFileName(false) {}

  void Comment(const PortString_t& aText) { text << "; " << aText << "\n"; }
  void Directive(const char* aWord) { text << "%" << aWord << "\n"; }
  void Entry(const qorEntryPlan_t& aPlan, const PortString_t& aPath, uint16_t aUserId) {
    if (aPlan.plain && aPlan.compressed != comp) {
      comp = aPlan.compressed;
      Directive(comp ? "compress" : "nocompress");
    }
    if (aPlan.plain && aPlan.setFileName != setFileName) {
      setFileName = aPlan.setFileName;
      Directive(setFileName ? "setfilename" : "nosetfilename");
    }
    text << aPath;
    if (aPlan.plain && aUserId != 0) text << PortString_t::Format(" id=%u", aUserId);
    text << "\n";
  }
  PortMemoryStream_t& Stream() { return text; }

 private:
  PortMemoryStream_t text;
  bool comp;
  bool setFileName;
};

// Writes the current entry's file as the plan says; `expanded` holds a compressed plain
// entry's data.
void WriteEntryFile(qorArchiveReader_t& reader, const qorEntryPlan_t& plan,
                    PortMemoryStream_t& expanded, PortFileStream_t& out) {
  const qorArchiveEntry_t& e = reader.Entry();
  if (!plan.plain) {
    reader.Stream().Seek(e.offset, 0);
    out.CopyFrom(reader.Stream(), static_cast<PortStreamUnit_t>(e.header.fileSize + e.PadSize()));
  } else if (plan.compressed) {
    expanded.Seek(0, 0);
    out.CopyFrom(expanded, static_cast<PortStreamUnit_t>(e.header.realSize));
  } else {
    reader.Stream().Seek(e.BodyOffset(), 0);
    out.CopyFrom(reader.Stream(), e.BodySize());
  }
}

PortString_t ArchiveStem(const PortString_t& aArchive) {
  PortString_t stem = PortFilename_t(aArchive).GetBaseName();
  return stem.GetLength() > 0 ? stem : PortString_t("archive");
}

}  // namespace

void UnpackExtract(const PortString_t& aArchive, const PortString_t& aDir,
                   const qorExtractOptions_t& aOptions) {
  qorArchiveReader_t reader(aArchive);
  // The structure is checked whole first, so that a damaged archive writes nothing at all.
  while (reader.Next()) {
  }
  reader.ThrowFirstProblem();
  const bool has_end_record = reader.State() == kQorWalkEndRecord;
  reader.Rewind();

  const PortString_t stem = ArchiveStem(aArchive);
  const PortString_t resp_name = stem + ".ls";
  qorExtractDir_t out_dir(aDir, aOptions.force);
  out_dir.Protect(aArchive);
  out_dir.Reserve(resp_name);
  out_dir.Reserve(stem + ".LB");  // qorLink truncates it first: no entry may be read from it

  qorResponseText_t resp;
  const PortString_t stem_text =
      EscapedText(reinterpret_cast<const unsigned char*>(stem.c_str()), stem.GetLength());
  resp.Comment("extracted by qorUnpack; to rebuild the archive, run in this directory:");
  resp.Comment("  qorLink " + stem_text + ".ls -o " + stem_text + ".LB");
  if (!has_end_record) resp.Directive("noendrecord");

  PortMemoryStream_t expanded;
  while (reader.Next()) {
    const qorArchiveEntry_t& e = reader.Entry();
    qorEntryPlan_t plan = PlanEntry(e, reader.CheckPadding());
    if (plan.plain && plan.compressed) {
      expanded.Seek(0, 0);
      if (!ExpandEntryBody(reader, expanded)) {
        throw reader.Describe(BadBodyProblem(e));
      }
      // A payload from another encoder expands fine but would not come back from qorLink.
      if (aOptions.verify && !RecompressesToBody(reader, expanded)) plan = RawPlan(e.index);
    }
    const PortString_t path = out_dir.Place(e.index, plan.name);
    PortFileStream_t out;
    out_dir.Create(out, path);
    WriteEntryFile(reader, plan, expanded, out);
    out.Close();
    resp.Entry(plan, path, e.header.userId);
  }

  PortFileStream_t resp_strm;
  out_dir.Create(resp_strm, resp_name);
  resp.Stream().Seek(0, 0);
  resp_strm.CopyFrom(resp.Stream());
}
