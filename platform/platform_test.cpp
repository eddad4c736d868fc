// Contract tests of the platform layer. The same file runs against the POSIX
// implementation and, cross-compiled, against the Windows one, so the
// host-neutral cases speak only through platform.h.
#include "platform/platform.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <thread>

#ifdef _WIN32
#define WIN32_LEAN_AND_MEAN
#define NOMINMAX
#include <windows.h>
// The Windows headers turn these names into macros of their own.
#undef GetFileAttributes
#undef SetFileAttributes
#else
// POSIX host only: processes, the prefix, extended attributes.
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <sys/xattr.h>
#include <unistd.h>

#include "tests/temp_prefix.h"
#endif

namespace {

namespace fs = std::filesystem;
using platform::HostPath;

// A scratch directory named by a Windows path; removed afterwards.
class Scratch {
 public:
  Scratch() {
#ifdef _WIN32
    wchar_t temp[MAX_PATH + 1];
    GetTempPathW(MAX_PATH + 1, temp);
    static int count = 0;
    root_ = std::wstring(temp) + L"hfplatform." + std::to_wstring(GetCurrentProcessId()) + L"." +
            std::to_wstring(++count);
#else
    root_ = L"D:\\scratch";
#endif
    EXPECT_TRUE(platform::CreateDirectories(root_));
  }
  ~Scratch() {
    std::error_code ignored;
    fs::remove_all(fs::path(platform::ToHostPath(root_)), ignored);
  }

  std::wstring Path(const std::wstring& relative) const {
    return root_ + L"\\" + relative;
  }

  void Write(const std::wstring& relative, const std::string& bytes) const {
    std::ofstream out(fs::path(platform::ToHostPath(Path(relative))), std::ios::binary);
    out << bytes;
  }

 private:
#ifndef _WIN32
  TempPrefix prefix_;  // first: the scratch directory lives on its drive D:
#endif
  std::wstring root_;
};

TEST(PathTest, RemoveFileSpecActsLikeTheShell) {
  struct Case {
    const wchar_t* path;
    const wchar_t* result;
    bool removed;
  };
  const Case cases[] = {
      {L"C:\\a\\b.exe", L"C:\\a", true},
      {L"C:\\b.exe", L"C:\\", true},
      {L"C:\\", L"C:\\", false},
      {L"C:", L"C:", false},
      {L"C:b.exe", L"C:", true},
      {L"C:\\a\\", L"C:\\a", true},
      {L"\\b.exe", L"\\", true},
      {L"\\\\server\\share\\f.exe", L"\\\\server\\share", true},
      {L"\\\\server\\share", L"\\\\server", true},
      {L"b.exe", L"", true},
      {L"", L"", false},
#ifndef _WIN32
      // POSIX host: a host-form path outside every drive uses slashes.
      {L"/opt/hf/hotfolder.exe", L"/opt/hf", true},
      {L"/hotfolder.exe", L"/", true},
      {L"/", L"/", false},
      {L"/opt/a:b/x", L"/opt/a:b", true},
#endif
  };
  for (const Case& c : cases) {
    std::wstring path = c.path;
    EXPECT_EQ(platform::RemoveFileSpec(&path), c.removed) << c.path;
    EXPECT_EQ(path, c.result) << c.path;
  }
}

TEST(FileTest, ExistenceAndCreation) {
  Scratch scratch;
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"a\\b\\c")));
  EXPECT_TRUE(platform::CreateDirectories(scratch.Path(L"a\\b\\c")));  // already there
  scratch.Write(L"a\\f.txt", "x");
  EXPECT_TRUE(platform::DirectoryExists(scratch.Path(L"a\\b\\c")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"a\\f.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"a\\b")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"a\\f.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"missing")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"missing")));
  // A directory cannot be created through a file.
  EXPECT_FALSE(platform::CreateDirectories(scratch.Path(L"a\\f.txt\\d")));
  // Names differ only in case: the existing entries are found.
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"A\\F.TXT")));
  EXPECT_TRUE(platform::DirectoryExists(scratch.Path(L"A/B/c")));
}

TEST(FileTest, AttributesRoundTrip) {
  Scratch scratch;
  const std::wstring dir = scratch.Path(L"[_KYR_HotFolder_]");
  const std::wstring file = scratch.Path(L"folder.cfg");
  ASSERT_TRUE(platform::CreateDirectories(dir));
  scratch.Write(L"folder.cfg", "<x/>");
  using platform::kAttributeArchive;
  using platform::kAttributeDirectory;
  using platform::kAttributeHidden;
  using platform::kAttributeReadOnly;
  using platform::kAttributeSystem;
  std::uint32_t bits = 0;
  ASSERT_TRUE(platform::GetFileAttributes(dir, &bits));
  EXPECT_EQ(bits & kAttributeDirectory, kAttributeDirectory);
  ASSERT_TRUE(platform::GetFileAttributes(file, &bits));
  EXPECT_EQ(bits & kAttributeDirectory, 0u);

  struct Case {
    const std::wstring* path;
    std::uint32_t set;
    std::uint32_t read;
  };
  const Case cases[] = {
      {&dir, kAttributeReadOnly | kAttributeHidden | kAttributeSystem,
       kAttributeReadOnly | kAttributeHidden | kAttributeSystem | kAttributeDirectory},
      {&dir, kAttributeHidden, kAttributeHidden | kAttributeDirectory},
      {&file, kAttributeHidden | kAttributeArchive | kAttributeDirectory,  // DIRECTORY ignored
       kAttributeHidden | kAttributeArchive},
  };
  for (const Case& c : cases) {
    ASSERT_TRUE(platform::SetFileAttributes(*c.path, c.set)) << c.set;
    ASSERT_TRUE(platform::GetFileAttributes(*c.path, &bits));
    EXPECT_EQ(bits, c.read) << c.set;
  }
  EXPECT_FALSE(platform::GetFileAttributes(scratch.Path(L"missing"), &bits));
  EXPECT_FALSE(platform::SetFileAttributes(scratch.Path(L"missing"), kAttributeHidden));
#ifndef _WIN32
  // POSIX host: stored as Wine stores them, and a missing attribute reads as
  // no bits.
  char text[16] = {};
  const HostPath host_dir = platform::ToHostPath(dir);
  ASSERT_EQ(getxattr(host_dir.c_str(), "user.DOSATTRIB", text, sizeof text), 3);
  EXPECT_STREQ(text, "0x2");
  ASSERT_EQ(removexattr(host_dir.c_str(), "user.DOSATTRIB"), 0);
  ASSERT_TRUE(platform::GetFileAttributes(dir, &bits));
  EXPECT_EQ(bits, kAttributeDirectory);
#endif
}

TEST(FileTest, MoveNeverReplacesAnExistingDirectory) {
  Scratch scratch;
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"old")));
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"taken")));
  scratch.Write(L"old\\folder.cfg", "old");
  scratch.Write(L"taken\\keep.txt", "taken");
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"taken")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"TAKEN")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"taken\\keep.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"taken\\folder.cfg")));

  // An empty target is not replaced either.
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"empty")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"empty")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")));

  EXPECT_TRUE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"new")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"old")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"new\\folder.cfg")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"missing"), scratch.Path(L"other")));
}

#ifndef _WIN32
// POSIX host: the Wine-style prefix mapping.
TEST(PrefixTest, MapsWindowsPathsIntoThePrefix) {
  TempPrefix prefix;
  fs::create_directories(prefix.Drive('d') / "Jobs" / "Brochures");
  fs::create_directories(prefix.Drive('d') / "Twice" / "Mixed");
  fs::create_directories(prefix.Drive('d') / "Twice" / "MIXED");
  const std::string devices = prefix.root().string() + "/dosdevices";
  struct Case {
    const wchar_t* windows;
    std::string host;  // after the prefix's dosdevices, or whole when relative
  };
  const Case cases[] = {
      {L"D:\\Jobs\\Brochures", "/d:/Jobs/Brochures"},
      {L"d:\\jobs\\BROCHURES\\New.txt", "/d:/Jobs/Brochures/New.txt"},
      {L"D:\\Twice\\mixed", "/d:/Twice/mixed"},  // two candidates: none chosen
      {L"Q:\\Jobs", "/q:/Jobs"},                 // no such drive
      {L"\\\\Server\\Share\\a\\b", "/unc/Server/Share/a/b"},
      {L"\\\\Server\\Share\\..\\..\\x", "/unc/Server/Share/x"},
      {L"D:\\..\\..\\Jobs", "/d:/Jobs"},
      {L"D:/Jobs/./Brochures/../Brochures/", "/d:/Jobs/Brochures"},
      {L"D:\\", "/d:"},
  };
  for (const Case& c : cases) {
    EXPECT_EQ(platform::ToHostPath(c.windows), devices + c.host) << c.windows;
  }
  const Case relative[] = {
      {L"rel\\x.cfg", "rel/x.cfg"},      {L"a\\..\\..\\b", "../b"}, {L"", ""},
      {L"\\rooted\\without\\drive", ""}, {L"\\\\server-only", ""},
  };
  for (const Case& c : relative) {
    EXPECT_EQ(platform::ToHostPath(c.windows), c.host) << c.windows;
  }

  // Without WINEPREFIX the prefix is ~/.wine.
  const std::string home = getenv("HOME") ? getenv("HOME") : "";
  setenv("HOME", prefix.root().c_str(), 1);
  unsetenv("WINEPREFIX");
  EXPECT_EQ(platform::ToHostPath(L"C:\\x"), prefix.root().string() + "/.wine/dosdevices/c:/x");
  setenv("HOME", home.c_str(), 1);
  setenv("WINEPREFIX", prefix.root().c_str(), 1);
}

TEST(PrefixTest, MapsHostPathsBackThroughTheLongestDrive) {
  TempPrefix prefix;
  fs::create_directories(prefix.Drive('d') / "Jobs" / "bin");
  fs::create_directory_symlink("../drive_d/Jobs", prefix.root() / "dosdevices" / "e:");
  struct Case {
    std::string host;
    std::wstring windows;
  };
  const Case cases[] = {
      {(prefix.Drive('d') / "hotfolder.exe").string(), L"D:\\hotfolder.exe"},
      {(prefix.Drive('d') / "Jobs" / "bin" / "hotfolder.exe").string(), L"E:\\bin\\hotfolder.exe"},
      {prefix.Drive('c').string(), L"C:\\"},
      {"/nowhere/hotfolder.exe", L"/nowhere/hotfolder.exe"},
  };
  for (const Case& c : cases) EXPECT_EQ(platform::FromHostPath(c.host), c.windows) << c.host;
  // A Windows path survives the trip out and back.
  EXPECT_EQ(platform::FromHostPath(platform::ToHostPath(L"d:\\JOBS\\Bin")), L"E:\\bin");
}

TEST(PrefixTest, NeverCreatesADrive) {
  TempPrefix prefix;
  EXPECT_FALSE(platform::CreateDirectories(L"Q:\\Jobs"));
  EXPECT_FALSE(fs::exists(prefix.root() / "dosdevices" / "q:"));
  EXPECT_EQ(platform::CommonAppDataFolder(), L"C:\\ProgramData");
  EXPECT_TRUE(platform::CreateDirectories(L"C:\\ProgramData\\KYR\\Dirorodiv"));
  EXPECT_TRUE(fs::is_directory(prefix.Drive('c') / "ProgramData" / "KYR" / "Dirorodiv"));
}
#endif

}  // namespace
