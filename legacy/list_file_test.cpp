#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "app/migrator.h"
#include "tests/temp_prefix.h"

namespace {

const char kListFile[] = "ProgramData/KYR/ZerOvurova/KYR ZerOvurova Preferences/KYR ZerOvurova DB";

std::string Header(const std::string& magic = "KYR ZerOvurova Database", char version = 1) {
  std::string header(40, '\0');
  header.replace(0, magic.size(), magic);
  header[24] = version;
  return header;
}

std::string Record(std::uint16_t state, const std::string& path) {
  std::string record(264, '\0');
  record[0] = '\x5A';  // reserved bytes are not examined
  record[2] = static_cast<char>(state & 0xFF);
  record[3] = static_cast<char>(state >> 8);
  record.replace(4, path.size(), path);
  return record;
}

struct ListCase {
  const char* name;
  std::string bytes;  // file contents; "<none>" for no file at all
  bool result;
  std::vector<std::wstring> folders;
  std::vector<std::wstring> flags;
};

TEST(ReadLegacyList, FileLayouts) {
  const std::string full_path(260, 'p');
  const ListCase cases[] = {
      {"header only", Header(), false, {}, {}},
      {"wrong magic", Header("KYR ZerOvurova Databasf") + Record(2, "D:\\a"), false, {}, {}},
      {"magic in other case",
       Header("KYR ZEROVUROVA DATABASE") + Record(2, "D:\\a"),
       false,
       {},
       {}},
      {"magic with more text",
       Header("KYR ZerOvurova Database!") + Record(2, "D:\\a"),
       false,
       {},
       {}},
      {"version 2", Header("KYR ZerOvurova Database", 2) + Record(2, "D:\\a"), false, {}, {}},
      {"shorter than a header", Header().substr(0, 39), false, {}, {}},
      {"empty file", "", false, {}, {}},
      {"no file", "<none>", false, {}, {}},
      {"only an empty path", Header() + Record(2, ""), true, {}, {}},
      {"empty path among others",
       Header() + Record(2, "D:\\a") + Record(2, "") + Record(0, "D:\\c"),
       true,
       {L"D:\\a", L"D:\\c"},
       {L"1", L"0"}},
      {"states",
       Header() + Record(0, "D:\\s0") + Record(1, "D:\\s1") + Record(2, "D:\\s2") +
           Record(3, "D:\\s3") + Record(0x0102, "D:\\high"),
       true,
       {L"D:\\s0", L"D:\\s1", L"D:\\s2", L"D:\\s3", L"D:\\high"},
       {L"0", L"0", L"1", L"0", L"0"}},
      {"three records in order",
       Header() + Record(2, "D:\\Jobs\\B") + Record(0, "C:\\A") + Record(2, "\\\\srv\\x\\"),
       true,
       {L"D:\\Jobs\\B", L"C:\\A", L"\\\\srv\\x\\"},
       {L"1", L"0", L"1"}},
      {"260-byte path without terminator",
       Header() + Record(2, full_path) + Record(0, "D:\\next"),
       true,
       {std::wstring(260, L'p'), L"D:\\next"},
       {L"1", L"0"}},
      {"trailing partial record ignored",
       Header() + Record(2, "D:\\a") + Record(2, "D:\\torn").substr(0, 100),
       true,
       {L"D:\\a"},
       {L"1"}},
      {"partial record only", Header() + Record(2, "D:\\torn").substr(0, 263), false, {}, {}},
      {"Windows-1252 path",
       Header() + Record(2, "D:\\\x80 \x81\x8a\x9f\xe9\xff"),
       true,
       {L"D:\\\u20AC \u0081\u0160\u0178\u00E9\u00FF"},
       {L"1"}},
  };
  for (const ListCase& c : cases) {
    SCOPED_TRACE(c.name);
    TempPrefix prefix;
    if (c.bytes != "<none>") prefix.WriteFile(prefix.Drive('c') / kListFile, c.bytes);
    CHFMigrator engine;
    EXPECT_EQ(engine.ReadLegacyList(), c.result);
    std::vector<std::wstring> folders, flags;
    for (const wxString& f : engine.m_Folders) folders.push_back(f.ToStdWstring());
    for (const wxString& f : engine.m_EnabledFlags) flags.push_back(f.ToStdWstring());
    EXPECT_EQ(folders, c.folders);
    EXPECT_EQ(flags, c.flags);
  }
}

}  // namespace
