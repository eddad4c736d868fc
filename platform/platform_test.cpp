// Contract tests of the platform layer. The same file runs against the POSIX
// implementation and, cross-compiled, against the Windows one, so the
// host-neutral cases speak only through platform.h.
#include "platform/platform.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cwctype>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "tests/host_env.h"

#ifdef _WIN32
#define WIN32_LEAN_AND_MEAN
#ifndef NOMINMAX
#define NOMINMAX
#endif
#include <windows.h>
// The Windows headers turn these names into macros of their own.
#undef GetFileAttributes
#undef SetFileAttributes
#else
// POSIX host only: processes, the prefix, extended attributes.
#include <sys/xattr.h>

#include "tests/run_program.h"
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
    wchar_t long_temp[MAX_PATH + 1];  // the long form, as module paths are shown
    if (GetLongPathNameW(temp, long_temp, MAX_PATH + 1) != 0) wcscpy(temp, long_temp);
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
    std::ofstream(fs::path(platform::ToHostPath(Path(relative))), std::ios::binary) << bytes;
  }

 private:
#ifndef _WIN32
  TempPrefix prefix_;  // first: the scratch directory lives on its drive D:
#endif
  std::wstring root_;
};

// The first process whose module is the file `windows_path`; 0 when none.
platform::ProcessId FindProcessOf(const std::wstring& windows_path) {
  const auto same = [](wchar_t x, wchar_t y) { return towlower(x) == towlower(y); };
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return 0;
  std::wstring base_name, file_name;
  for (platform::ProcessId id : ids) {
    if (platform::QueryProcessModule(id, &base_name, &file_name) &&
        std::equal(file_name.begin(), file_name.end(), windows_path.begin(), windows_path.end(),
                   same)) {
      return id;
    }
  }
  return 0;
}

TEST(PathTest, RemoveFileSpecActsLikeTheShell) {
  const struct {
    const wchar_t* path;
    const wchar_t* result;
    bool removed;
  } cases[] = {
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
  for (const auto& c : cases) {
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
  // A directory cannot be created through a file.
  EXPECT_FALSE(platform::CreateDirectories(scratch.Path(L"a\\f.txt\\d")));
  const struct {
    const wchar_t* path;
    bool file;
    bool directory;
  } cases[] = {
      {L"a\\b\\c", false, true},  {L"a\\f.txt", true, false}, {L"missing", false, false},
      {L"A\\F.TXT", true, false}, {L"A/B/c", false, true},  // names that differ only in case
  };
  for (const auto& c : cases) {
    EXPECT_EQ(platform::FileExists(scratch.Path(c.path)), c.file) << c.path;
    EXPECT_EQ(platform::DirectoryExists(scratch.Path(c.path)), c.directory) << c.path;
  }
}

TEST(FileTest, AttributesRoundTrip) {
  Scratch scratch;
  const std::wstring dir = scratch.Path(L"[_KYR_HotFolder_]");
  const std::wstring file = scratch.Path(L"folder.cfg");
  ASSERT_TRUE(platform::CreateDirectories(dir));
  scratch.Write(L"folder.cfg", "<x/>");
  constexpr std::uint32_t R = platform::kAttributeReadOnly, H = platform::kAttributeHidden,
                          S = platform::kAttributeSystem, D = platform::kAttributeDirectory,
                          A = platform::kAttributeArchive;
  const struct {
    const std::wstring* path;
    std::uint32_t set;
    std::uint32_t read;
  } cases[] = {
#ifdef _WIN32
      // Wine keeps no read-only bit on a directory, and always reports ARCHIVE
      // on a file; the file carries the read-only case here.
      {&file, R | H | S | A, R | H | S | A},
      {&dir, H | S, H | S | D},
#else
      {&dir, R | H | S, R | H | S | D},
#endif
      {&dir, H, H | D},
      {&file, H | A | D, H | A},  // DIRECTORY ignored
  };
  std::uint32_t bits = 0;
  for (const auto& c : cases) {
    ASSERT_TRUE(platform::SetFileAttributes(*c.path, c.set)) << c.set;
    ASSERT_TRUE(platform::GetFileAttributes(*c.path, &bits));
    EXPECT_EQ(bits, c.read) << c.set;
  }
  EXPECT_FALSE(platform::GetFileAttributes(scratch.Path(L"missing"), &bits));
  EXPECT_FALSE(platform::SetFileAttributes(scratch.Path(L"missing"), H));
#ifndef _WIN32
  // POSIX host: stored as Wine stores them, and a missing attribute reads as
  // no bits.
  char text[16] = {};
  const HostPath host_dir = platform::ToHostPath(dir);
  ASSERT_EQ(getxattr(host_dir.c_str(), "user.DOSATTRIB", text, sizeof text), 3);
  EXPECT_STREQ(text, "0x2");
  ASSERT_EQ(removexattr(host_dir.c_str(), "user.DOSATTRIB"), 0);
  ASSERT_TRUE(platform::GetFileAttributes(dir, &bits));
  EXPECT_EQ(bits, D);
#endif
}

TEST(FileTest, MoveNeverReplacesAnExistingDirectory) {
  Scratch scratch;
  for (const wchar_t* dir : {L"old", L"taken", L"empty"}) {
    ASSERT_TRUE(platform::CreateDirectories(scratch.Path(dir)));
  }
  scratch.Write(L"old\\folder.cfg", "old");
  scratch.Write(L"taken\\keep.txt", "taken");
  for (const wchar_t* target : {L"taken", L"TAKEN", L"empty"}) {
    EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(target))) << target;
  }
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"taken\\keep.txt")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"taken\\folder.cfg")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"empty\\folder.cfg")));

  EXPECT_TRUE(platform::MoveDirectory(scratch.Path(L"old"), scratch.Path(L"new")));
  EXPECT_FALSE(platform::DirectoryExists(scratch.Path(L"old")));
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"new\\folder.cfg")));
  EXPECT_FALSE(platform::MoveDirectory(scratch.Path(L"missing"), scratch.Path(L"other")));
}

// The run record's file services: a whole new file or none, no replacing
// rename, removal that leaves nothing, and synced directories.
TEST(FileTest, DurableFilesRenamesAndRemovals) {
  Scratch scratch;
  const std::wstring file = scratch.Path(L"run"), aside = scratch.Path(L"run.aside");
  const auto read = [](const std::wstring& path) {
    std::ifstream in(fs::path(platform::ToHostPath(path)), std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
  };
  ASSERT_TRUE(platform::ReplaceFileDurably(file, "first"));
  ASSERT_TRUE(platform::ReplaceFileDurably(file, "second"));
  EXPECT_FALSE(platform::FileExists(file + L".new"));
  scratch.Write(L"taken", "taken");
  EXPECT_FALSE(platform::RenameFile(file, scratch.Path(L"taken")));
  EXPECT_TRUE(platform::RenameFile(file, aside));
  EXPECT_EQ(read(aside) + read(scratch.Path(L"taken")), "secondtaken");
  EXPECT_TRUE(platform::RemoveFile(aside));
  EXPECT_TRUE(platform::RemoveFile(aside));  // none left is what was asked
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"dir")));
  EXPECT_FALSE(platform::RemoveFile(scratch.Path(L"dir")));
  EXPECT_TRUE(platform::SyncDirectory(scratch.Path(L"dir")));
  EXPECT_FALSE(platform::SyncDirectory(scratch.Path(L"missing")));
  EXPECT_FALSE(platform::ReplaceFileDurably(scratch.Path(L"missing\\run"), "x"));
}

// The stand-in holds the server's mutex while it runs, so no other process
// can. It is started by bare name from a private copy, so that only the
// process started here has that path.
TEST(ProcessTest, ServerIsLaunchedHoldsItsMutexIsFoundAndTerminated) {
  Scratch scratch;  // on a POSIX host this is also a prefix of our own
  const HostPath program = (fs::path(Environment("HF_BIN_DIR")) / "hotfolder.exe").native();
  ASSERT_TRUE(fs::exists(program)) << "HF_BIN_DIR must name the directory of hotfolder.exe";
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"bin")));
  const std::wstring copy = scratch.Path(L"bin\\hotfolder.exe");
  fs::copy_file(fs::path(program), fs::path(platform::ToHostPath(copy)));
  // Canonical: a POSIX search path cannot hold the colon of "dosdevices/d:".
  const HostPath search_path = Environment("PATH");
  SetEnvironment("PATH",
                 fs::canonical(fs::path(platform::ToHostPath(scratch.Path(L"bin")))).native() +
                     kSearchPathSeparator + search_path);
  const std::wstring mutex = L"KYR Dirorodiv - Server";

  EXPECT_FALSE(platform::NamedMutexExists(mutex));
  EXPECT_FALSE(platform::LaunchDetached(L"hf-no-such-program.exe"));
  ASSERT_TRUE(platform::LaunchDetached(L"hotfolder.exe"));
  SetEnvironment("PATH", search_path);
  ASSERT_TRUE(Eventually([&] { return platform::NamedMutexExists(mutex); }));
  EXPECT_FALSE(platform::NamedMutexExists(mutex + L"2"));
  // Taken by no probe: only the server holds it, and it goes with the server.
  EXPECT_FALSE(platform::HoldNamedMutex(mutex));

  platform::ProcessId id = 0;
  ASSERT_TRUE(Eventually([&] { return (id = FindProcessOf(copy)) != 0; }));
  std::wstring base_name;
  ASSERT_TRUE(platform::QueryProcessModule(id, &base_name, nullptr));
  EXPECT_EQ(base_name, L"hotfolder.exe");
  std::vector<platform::ProcessId> ids;
  ASSERT_TRUE(platform::EnumerateProcesses(&ids));
  EXPECT_LE(ids.size(), platform::kMaxProcesses);
#ifndef _WIN32
  EXPECT_TRUE(std::is_sorted(ids.begin(), ids.end()));  // POSIX host: ascending ids
#endif

  ASSERT_TRUE(platform::TerminateProcess(id));
  EXPECT_TRUE(Eventually([&] { return !platform::NamedMutexExists(mutex); }));
  EXPECT_TRUE(Eventually([&] { return FindProcessOf(copy) == 0; }));
  EXPECT_FALSE(platform::QueryProcessModule(0, &base_name, nullptr));
  EXPECT_FALSE(platform::QueryProcessModule(0xFFFFFFFFu, &base_name, nullptr));

  // A mutex of this process's own, under a name no server uses.
  const std::wstring own = L"Local\\hf platform/test \u00fc " + std::to_wstring(__LINE__);
  EXPECT_FALSE(platform::NamedMutexExists(own));
  ASSERT_TRUE(platform::HoldNamedMutex(own));
  EXPECT_TRUE(platform::HoldNamedMutex(own));  // ours already
  EXPECT_TRUE(platform::NamedMutexExists(own));
  EXPECT_FALSE(platform::NamedMutexExists(L""));
  EXPECT_FALSE(platform::HoldNamedMutex(L""));
}

TEST(NetworkTest, ResolvesTheLocalHost) {
  ASSERT_TRUE(platform::StartSockets());
  std::string name, official, reverse, kept = "kept";
  EXPECT_TRUE(platform::LocalHostName(&name) && !name.empty());
  EXPECT_TRUE(platform::HostByName("localhost", &official) && !official.empty());
  EXPECT_TRUE(platform::HostByIPv4Address("127.0.0.1", &reverse) && !reverse.empty());
  EXPECT_FALSE(platform::HostByIPv4Address("not an address", &kept));
  EXPECT_FALSE(platform::HostByIPv4Address("255.255.255.255", &kept));  // the "no address" value
  EXPECT_EQ(kept, "kept");
}

#ifndef _WIN32
// POSIX host: the Wine-style prefix mapping.
TEST(PrefixTest, MapsWindowsPathsBothWaysAndNeverCreatesADrive) {
  TempPrefix prefix;
  for (const char* dir : {"Jobs/Brochures", "Jobs/bin", "Twice/Mixed", "Twice/MIXED"}) {
    fs::create_directories(prefix.Drive('d') / dir);
  }
  const std::string devices = prefix.root().string() + "/dosdevices";
  const struct {
    const wchar_t* windows;
    std::string host;  // after the prefix's dosdevices when it starts with '/', else whole
  } cases[] = {
      {L"D:\\Jobs\\Brochures", "/d:/Jobs/Brochures"},
      {L"d:\\jobs\\BROCHURES\\New.txt", "/d:/Jobs/Brochures/New.txt"},
      {L"D:\\Twice\\mixed", "/d:/Twice/mixed"},  // two candidates: none chosen
      {L"Q:\\Jobs", "/q:/Jobs"},                 // no such drive
      {L"\\\\Server\\Share\\a\\b", "/unc/Server/Share/a/b"},
      {L"\\\\Server\\Share\\..\\..\\x", "/unc/Server/Share/x"},
      {L"D:\\..\\..\\Jobs", "/d:/Jobs"},
      {L"D:/Jobs/./Brochures/../Brochures/", "/d:/Jobs/Brochures"},
      {L"D:\\", "/d:"},
      {L"rel\\x.cfg", ""},  // relative, from a directory outside every drive
      {L"a\\..\\..\\b", ""},
      {L"", ""},
      {L"\\rooted\\without\\drive", ""},
      {L"\\\\server-only", ""},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(platform::ToHostPath(c.windows), (c.host[0] == '/' ? devices : "") + c.host)
        << c.windows;
  }

  // Back through the drive whose target holds it, the longest.
  fs::create_directory_symlink("../drive_d/Jobs", prefix.root() / "dosdevices" / "e:");
  const struct {
    std::string host;
    std::wstring windows;
  } back[] = {
      {(prefix.Drive('d') / "hotfolder.exe").string(), L"D:\\hotfolder.exe"},
      {(prefix.Drive('d') / "Jobs" / "bin" / "hotfolder.exe").string(), L"E:\\bin\\hotfolder.exe"},
      {prefix.Drive('c').string(), L"C:\\"},
      {"/nowhere/hotfolder.exe", L"/nowhere/hotfolder.exe"},
  };
  for (const auto& c : back) EXPECT_EQ(platform::FromHostPath(c.host), c.windows) << c.host;
  // A Windows path survives the trip out and back.
  EXPECT_EQ(platform::FromHostPath(platform::ToHostPath(L"d:\\JOBS\\Bin")), L"E:\\bin");

  // A drive is never created, and the all-users folder is on C:.
  EXPECT_FALSE(platform::CreateDirectories(L"Q:\\Jobs"));
  EXPECT_FALSE(fs::exists(prefix.root() / "dosdevices" / "q:"));
  EXPECT_EQ(platform::CommonAppDataFolder(), L"C:\\ProgramData");
  EXPECT_TRUE(platform::CreateDirectories(L"C:\\ProgramData\\KYR\\Dirorodiv"));
  EXPECT_TRUE(fs::is_directory(prefix.Drive('c') / "ProgramData" / "KYR" / "Dirorodiv"));

  // Without WINEPREFIX the prefix is ~/.wine.
  const std::string home = getenv("HOME") ? getenv("HOME") : "";
  setenv("HOME", prefix.root().c_str(), 1);
  unsetenv("WINEPREFIX");
  EXPECT_EQ(platform::ToHostPath(L"C:\\x"), prefix.root().string() + "/.wine/dosdevices/c:/x");
  setenv("HOME", home.c_str(), 1);
  setenv("WINEPREFIX", prefix.root().c_str(), 1);
}

// POSIX host: kill() reads 0 as "my process group"; such ids are refused. The
// check runs in a child with a group of its own, so a failure ends only that.
TEST(ProcessTest, TerminateRefusesProcessGroupIds) {
  const pid_t child = fork();
  if (child == 0) {
    setpgid(0, 0);
    _exit(platform::TerminateProcess(0) ? 2 : 0);
  }
  EXPECT_EQ(WaitProgram(child), 0);
}

// POSIX host: HKEY_LOCAL_MACHINE is the prefix's system.reg.
TEST(RegistryTest, ReadsTheWineSystemHive) {
  TempPrefix prefix;
  const std::wstring product = L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3.0";
  EXPECT_FALSE(platform::HklmKeyOpensForRead(product));  // no hive at all
  prefix.WriteFile(prefix.root() / "system.reg",
                   "WINE REGISTRY Version 2\n"
                   ";; All keys relative to \\\\Machine\n\n#arch=win64\n\n"
                   "[Software\\\\Wow6432Node\\\\Tessaly Systems\\\\Corvane_app\\\\3.0\\\\Paths] "
                   "1700000000\n#time=1d9a0b2c3d4e5f6\n\"Dir\"=\"C:\\\\x\"\n\n"
                   "[Software\\\\Vendor\\\\App\\\\3.01] 1700000000\n"
                   "[Software\\\\Vendor\\\\Other\\\\3.0x] 1700000000\n"
                   "[Software\\\\Vendor\\\\Br\\[ack\\]et\\x00fc] 1700000000\n"
                   "[Software\\\\Unclosed\n");
  struct Case {
    std::wstring key;
    bool opens;
  };
  const Case cases[] = {
      {product, true},  // a parent of a section
      {L"software\\wow6432node\\TESSALY SYSTEMS\\corvane_app\\3.0\\paths", true},
      {L"SOFTWARE", true},
      {L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3", false},
      {L"SOFTWARE\\Vendor\\App\\3.0", false},  // only a sibling "3.01"
      {L"SOFTWARE\\Vendor\\Other\\3.0", false},
      {L"SOFTWARE\\Vendor\\App\\3.01\\Below", false},
      {L"SOFTWARE\\Vendor\\Br[ack]et\u00dc", true},  // escapes, and case beyond ASCII
      {L"SOFTWARE\\Unclosed", false},
      {L"SOFTWARE\\Missing", false},
  };
  for (const Case& c : cases) EXPECT_EQ(platform::HklmKeyOpensForRead(c.key), c.opens) << c.key;
}
#endif

}  // namespace
