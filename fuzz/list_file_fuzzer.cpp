// The legacy list file, whatever bytes sit where it belongs. Years of
// service can leave it torn, padded or overwritten; the reader must answer
// with a folder list it can stand behind.
#include <cstddef>
#include <cstdint>
#include <string>

#include "engine/migrator.h"
#include "fuzz/fuzz_support.h"
#include "tests/legacy_fixture.h"
#include "tests/temp_prefix.h"

namespace {

constexpr std::size_t kHeaderSize = 40;
constexpr std::size_t kRecordSize = 264;
constexpr std::size_t kPathSize = 260;

std::size_t WholeRecords(std::size_t size) {
  return size < kHeaderSize ? 0 : (size - kHeaderSize) / kRecordSize;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  static TempPrefix prefix;
  prefix.WriteFile(LegacyListHostPath(prefix), InputBytes(data, size));

  CHFMigrator engine;
  bool read = engine.ReadLegacyList();

  // Folders and flags are parallel lists, and every folder comes from one
  // whole record of its own.
  FUZZ_CHECK(engine.m_Folders.size() == engine.m_EnabledFlags.size());
  FUZZ_CHECK(engine.m_Folders.size() <= WholeRecords(size));
  FUZZ_CHECK(!read || WholeRecords(size) >= 1);
  for (std::size_t i = 0; i < engine.m_Folders.size(); ++i) {
    const wxString& folder = engine.m_Folders[i];
    // Empty exactly where a path did not decode, which keeps its place.
    FUZZ_CHECK(folder.empty() == (engine.m_UndecodedPaths.count(i) != 0));
    FUZZ_CHECK(folder.length() <= kPathSize);
    FUZZ_CHECK(folder.Find(wxUniChar(0)) == wxNOT_FOUND);
    FUZZ_CHECK(engine.m_EnabledFlags[i] == "1" || engine.m_EnabledFlags[i] == "0");
  }
  return 0;
}
