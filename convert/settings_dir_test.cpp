// A folder's full path and name, which are worked out directly for a plain
// drive path, against wxFileName, which gives them for every other path:
// the two must never differ.
#include "convert/settings_dir.h"

#include <gtest/gtest.h>
#include <wx/filename.h>

#include <random>
#include <vector>

namespace {

TEST(FolderPaths, AsWxFileNameGivesThem) {
  std::vector<wxString> paths = {"D:\\Jobs\\Brochures",
                                 "d:\\a.b.c",
                                 "D:\\Jobs\\.hidden",
                                 "D:\\Jobs\\name.",
                                 "D:\\...",
                                 "D:\\Jobs\\",
                                 "D:\\Jobs\\\\A",
                                 "D:/Jobs/A",
                                 "D:\\.\\A",
                                 "D:\\..\\A",
                                 "D:A",
                                 "\\\\server\\share\\A",
                                 "1:\\A",
                                 "D:\\a:b",
                                 "D:\\",
                                 L"D:\\Caf\u00E9 \U0001F600.x",
                                 wxString(L"D:\\a\0.b", 7)};
  // Random paths from a few characters, most of them starting as a drive
  // path does, so that both ways are taken many times.
  const wchar_t kChars[] = {L'a', L'.', L'\\', L'/', L':', L' ', L'\u00E9', L'?', L'D'};
  std::mt19937 random(7);
  for (int i = 0; i < 20000; ++i) {
    wxString path = i % 4 == 0 ? "" : "D:\\";
    for (int n = random() % 12; n > 0; --n) path += kChars[random() % std::size(kChars)];
    paths.push_back(path);
  }
  for (const wxString& path : paths) {
    const wxFileName expected(path, wxPATH_WIN);
    const FolderPaths made = MakeFolderPaths(path);
    ASSERT_EQ(made.full_path, expected.GetFullPath(wxPATH_WIN)) << path;
    ASSERT_EQ(made.name, expected.GetName()) << path;
    ASSERT_EQ(made.settings, made.full_path + "\\[_KYR_HotFolder_]") << path;
  }
}

}  // namespace
