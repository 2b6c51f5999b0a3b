// Property: list, test and extract on any bytes fail only with a message, extract writes only in
// its directory, and an archive that test accepts extracts and relinks to the same bytes.
#include <unistd.h>

#include <climits>
#include <cstddef>
#include <cstdint>
#include <exception>
#include <set>
#include <string>

#include "fuzz/fuzzscratch.h"
#include "port/src/string.h"
#include "src/linkrun.h"
#include "src/unpackextract.h"
#include "src/unpacklist.h"
#include "src/unpacktest.h"

namespace {

// Runs one command; returns the text it failed with, or "" when it completed.
template <typename Command>
std::string Failure(Command aCommand) {
  try {
    aCommand();
  } catch (const std::exception& e) {
    return std::string("std::exception ") + e.what();
  } catch (const PortString_t& text) {
    return text.GetLength() > 0 ? text.c_str() : "<empty PortString_t>";
  } catch (const char* text) {
    return *text != '\0' ? text : "<empty text>";
  }
  return "";
}

bool OnlyInside(const std::set<std::string>& aListing, const std::string& aArchive) {
  for (const std::string& name : aListing) {
    if (name != aArchive && name.compare(0, 2, "x/") != 0) return false;
  }
  return true;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* aData, size_t aSize) {
  static FuzzScratch_t dir;
  dir.Clear();
  const std::string archive = dir / "in.LB";
  FuzzWriteFile(archive, std::string(reinterpret_cast<const char*>(aData), aSize));

  Failure([&] { UnpackList(archive.c_str(), FuzzNullOutput()); });
  int problems = -1;
  const std::string test_failure =
      Failure([&] { problems = UnpackTest(archive.c_str(), FuzzNullOutput()); });
  FuzzRequire(test_failure.empty(), "test raised instead of reporting the problems");
  const std::string extract_failure =
      Failure([&] { UnpackExtract(archive.c_str(), (dir / "x").c_str(), qorExtractOptions_t()); });
  FuzzRequire(extract_failure.compare(0, 14, "std::exception") != 0, extract_failure.c_str());
  FuzzRequire(OnlyInside(dir.Listing(), "in.LB"), "extract wrote outside its directory");
  if (problems != 0) return 0;
  FuzzRequire(extract_failure.empty(), "extract refused an archive that test accepts");

  char cwd[PATH_MAX];
  FuzzRequire(getcwd(cwd, sizeof cwd) != nullptr && chdir((dir / "x").c_str()) == 0, "chdir");
  const std::string link_failure = Failure([] { LinkRun("in.ls", "in.LB"); });
  FuzzRequire(chdir(cwd) == 0, "chdir back");
  FuzzRequire(link_failure.empty(), "the extracted response file does not link");
  FuzzRequire(FuzzReadFile(dir / "x/in.LB") == FuzzReadFile(archive),
              "the relinked archive differs");
  return 0;
}
