// Contract tests of the platform layer. The same file runs against the POSIX
// implementation and, cross-compiled, against the Windows one, so the
// host-neutral cases speak only through platform.h. Launching, finding and
// stopping the server are the start-up tests' part, on both hosts.
#include "platform/platform.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <tuple>
#include <vector>

#ifndef _WIN32
// POSIX host only: processes, the prefix, extended attributes.
#include <sys/xattr.h>
#include <unistd.h>

#include "tests/cases.h"
#include "tests/run_program.h"
#include "tests/temp_prefix.h"
#endif

namespace {

namespace fs = std::filesystem;

// A scratch directory named by a Windows path; removed afterwards.
class Scratch {
 public:
  Scratch() {
#ifdef _WIN32
    const auto now = std::chrono::steady_clock::now().time_since_epoch().count();
    root_ = (fs::temp_directory_path() / ("hfplatform." + std::to_string(now))).wstring();
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

  std::string Read(const std::wstring& relative) const {
    std::ifstream in(fs::path(platform::ToHostPath(Path(relative))), std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
  }

 private:
#ifndef _WIN32
  TempPrefix prefix_;  // first: the scratch directory lives on its drive D:
#endif
  std::wstring root_;
};

TEST(PathTest, RemoveFileSpecActsLikeTheShell) {
  const std::tuple<const wchar_t*, const wchar_t*, bool> cases[] = {
      {L"C:\\a\\b.exe", L"C:\\a", true},
      {L"C:\\b.exe", L"C:\\", true},
      {L"C:\\", L"C:\\", false},
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
      {L"/opt/a:b", L"/opt", true},
#endif
  };
  for (const auto& [path, result, removed] : cases) {
    std::wstring changed = path;
    EXPECT_EQ(platform::RemoveFileSpec(&changed), removed) << path;
    EXPECT_EQ(changed, result) << path;
  }
}

// Existence, creation, and a move that never replaces an existing directory,
// not even an empty one.
TEST(FileTest, DirectoriesFilesAndMoves) {
  Scratch scratch;
  for (const wchar_t* dir : {L"old", L"taken", L"empty"})
    ASSERT_TRUE(platform::CreateDirectories(scratch.Path(dir)));
  scratch.Write(L"old\\folder.cfg", "old");
  scratch.Write(L"taken\\keep.txt", "taken");
  EXPECT_FALSE(platform::CreateDirectories(scratch.Path(L"taken\\keep.txt")));  // a file already
  EXPECT_TRUE(platform::FileExists(scratch.Path(L"old\\folder.cfg")) &&
              platform::DirectoryExists(scratch.Path(L"old")));
  EXPECT_FALSE(platform::FileExists(scratch.Path(L"old")) ||
               platform::DirectoryExists(scratch.Path(L"old\\folder.cfg")) ||
               platform::FileExists(scratch.Path(L"missing")));

  using platform::MoveOutcome;
  const auto move = [&](const wchar_t* from, const wchar_t* to) {
    return platform::MoveDirectory(scratch.Path(from), scratch.Path(to));
  };
  for (const wchar_t* target : {L"taken", L"empty"})
    EXPECT_EQ(move(L"old", target), MoveOutcome::kFailed) << target;
  EXPECT_EQ(scratch.Read(L"taken\\keep.txt"), "taken");
  EXPECT_EQ(move(L"old", L"new"), MoveOutcome::kMoved);
  EXPECT_EQ(scratch.Read(L"new\\folder.cfg"), "old");
  EXPECT_EQ(move(L"missing", L"other"), MoveOutcome::kFailed);
#ifndef _WIN32
  // A directory made immutable refuses every rename inside it (EPERM), as
  // Windows refuses one while a handle is held: busy, for the caller.
  const std::string parent = platform::ToHostPath(scratch.Path(L"new"));
  if (system(("chattr +i '" + parent + "' 2>/dev/null").c_str()) == 0) {
    EXPECT_EQ(move(L"new\\folder.cfg", L"new\\renamed"), MoveOutcome::kBusy);
    EXPECT_EQ(system(("chattr -i '" + parent + "'").c_str()), 0);
  }
#endif
}

TEST(FileTest, AttributesRoundTrip) {
  Scratch scratch;
  const std::wstring dir = scratch.Path(L"[_KYR_HotFolder_]"), file = scratch.Path(L"folder.cfg");
  ASSERT_TRUE(platform::CreateDirectories(dir));
  scratch.Write(L"folder.cfg", "<x/>");
  constexpr std::uint32_t R = platform::kAttributeReadOnly, H = platform::kAttributeHidden,
                          S = platform::kAttributeSystem, D = platform::kAttributeDirectory,
                          A = platform::kAttributeArchive;
  // The path, the bits set and the bits then read.
  const std::tuple<const std::wstring*, std::uint32_t, std::uint32_t> cases[] = {
      {&dir, 0, D},  // on a POSIX host: no attribute stored, none to remove
#ifdef _WIN32
      // Wine keeps no read-only bit on a directory, and always reports ARCHIVE
      // on a file; the file carries the read-only case here.
      {&file, R | H | S | A, R | H | S | A},
      {&dir, H | S, H | S | D},
#else
      {&dir, R | H | S, R | H | S | D},
#endif
      {&file, H | A | D, H | A},  // DIRECTORY ignored
      {&dir, H, H | D},
  };
  std::uint32_t bits = 0;
  for (const auto& [path, set, read] : cases) {
    ASSERT_TRUE(platform::SetFileAttributes(*path, set) &&
                platform::GetFileAttributes(*path, &bits));
    EXPECT_EQ(bits, read) << set;
  }
  EXPECT_FALSE(platform::GetFileAttributes(scratch.Path(L"missing"), &bits) ||
               platform::SetFileAttributes(scratch.Path(L"missing"), H));
#ifndef _WIN32
  // POSIX host: stored as Wine stores them.
  char text[16] = {};
  EXPECT_EQ(getxattr(platform::ToHostPath(dir).c_str(), "user.DOSATTRIB", text, sizeof text), 3);
  EXPECT_STREQ(text, "0x2");
#endif
}

// The run record's file services: a whole new file or none, no replacing
// rename, and removal that leaves nothing.
TEST(FileTest, DurableFilesRenamesAndRemovals) {
  Scratch scratch;
  const std::wstring file = scratch.Path(L"run"), aside = scratch.Path(L"run.aside");
  ASSERT_TRUE(platform::ReplaceFileDurably(file, "first"));
  ASSERT_TRUE(platform::ReplaceFileDurably(file, "second"));
  EXPECT_FALSE(platform::FileExists(file + L".new"));
  scratch.Write(L"taken", "taken");
  EXPECT_FALSE(platform::RenameFile(file, scratch.Path(L"taken")));
  EXPECT_TRUE(platform::RenameFile(file, aside));
  EXPECT_EQ(scratch.Read(L"run.aside") + scratch.Read(L"taken"), "secondtaken");
  EXPECT_TRUE(platform::RemoveFile(aside));
  EXPECT_TRUE(platform::RemoveFile(aside));  // none left is what was asked
  ASSERT_TRUE(platform::CreateDirectories(scratch.Path(L"dir")));
  EXPECT_FALSE(platform::RemoveFile(scratch.Path(L"dir")));
  EXPECT_FALSE(platform::ReplaceFileDurably(scratch.Path(L"missing\\run"), "x"));
}

// A mutex of this process's own, under a name no server uses.
TEST(ProcessTest, NamedMutexOfOurOwnAndAFailedLaunch) {
  Scratch scratch;  // on a POSIX host, the prefix that keeps the lock files
  const std::wstring own = L"Local\\hf platform/test \u00fc " + std::to_wstring(__LINE__);
  EXPECT_FALSE(platform::NamedMutexExists(own));
  ASSERT_TRUE(platform::HoldNamedMutex(own));
  EXPECT_TRUE(platform::HoldNamedMutex(own));  // ours already
  EXPECT_TRUE(platform::NamedMutexExists(own));
  EXPECT_FALSE(platform::NamedMutexExists(L"") || platform::HoldNamedMutex(L""));
  EXPECT_FALSE(platform::LaunchDetached(L"hf-no-such-program.exe"));
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
// A table's Windows path, its bytes read as Latin-1.
std::wstring Wide(const std::string& latin1) {
  std::wstring wide;
  for (const unsigned char c : latin1) wide += c;
  return wide;
}

// POSIX host: the Wine-style prefix mapping, the rows of prefix_paths.tsv.
TEST(PrefixTest, MapsWindowsPathsBothWaysAndNeverCreatesADrive) {
  TempPrefix prefix;
  for (const char* dir : {"Jobs/Brochures", "Jobs/bin", "Twice/Mixed", "Twice/MIXED"})
    fs::create_directories(prefix.Drive('d') / dir);
  fs::create_directory_symlink("../drive_d/Jobs", prefix.root() / "dosdevices" / "e:");
  const auto host = [&](const std::string& path) {
    return path.empty() || path[0] == '/' ? path : (prefix.root() / path).string();
  };
  const std::vector<CaseRow> cases = ReadCases("platform/prefix_paths.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases) {
    const std::wstring windows = Wide(c.at(1));
    if (c[0] == "to") {
      EXPECT_EQ(platform::ToHostPath(windows), host(c.at(2))) << c[1];
    } else {
      EXPECT_EQ(platform::FromHostPath(host(c.at(2))), windows) << c[2];
    }
  }

  // A drive is never created, and the all-users folder is on C:.
  EXPECT_FALSE(platform::CreateDirectories(L"Q:\\Jobs"));
  EXPECT_FALSE(fs::exists(prefix.root() / "dosdevices" / "q:"));
  EXPECT_EQ(platform::CommonAppDataFolder(), L"C:\\ProgramData");
  // Without WINEPREFIX the prefix is ~/.wine.
  unsetenv("WINEPREFIX");
  EXPECT_EQ(platform::ToHostPath(L"C:\\hf-none"),
            Environment("HOME") + "/.wine/dosdevices/c:/hf-none");
}

// A folder is reached only through links of root's or the running user's,
// those inside a link's target included, and named with none left in it: the
// rows of trusted_folders.tsv.
TEST(PrefixTest, TrustedFoldersFollowOnlyTrustedLinks) {
  if (geteuid() != 0) GTEST_SKIP() << "planting another user's link needs root";
  TempPrefix prefix;
  const fs::path d = prefix.Drive('d');
  fs::create_directories(d / "real/sub");
  prefix.WriteFile(d / "real/file", "");
  const char* kTrust[] = {"trusted", "missing", "foreign link", "not a directory", "failed"};
  const std::string drive = fs::canonical(d).string() + "/";
  const std::vector<CaseRow> cases = ReadCases("platform/trusted_folders.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases) {
    if (c.at(0) == "link") {
      fs::create_symlink(c.at(2), d / c.at(1));
      ASSERT_EQ(lchown((d / c[1]).c_str(), std::stoi(c.at(3)), std::stoi(c[3])), 0);
      continue;
    }
    const platform::TrustedFolder folder =
        platform::OpenTrustedFolder(Wide(c.at(1)), !c.at(2).empty());
    EXPECT_EQ(kTrust[static_cast<int>(folder.trust)], c.at(3)) << c[1];
    EXPECT_EQ(folder.path, fs::path(drive + c.at(4)).lexically_normal().string()) << c[1];
  }
  EXPECT_FALSE(fs::exists(d / "real/none") || fs::exists(prefix.root() / "dosdevices/q:"));
}

// POSIX host: processes listed in ascending id order. kill() reads 0 as "my
// process group"; such ids are refused. That check runs in a child with a
// group of its own, so a failure ends only that.
TEST(ProcessTest, ListsByIdAndRefusesProcessGroupIds) {
  std::vector<platform::ProcessId> ids;
  ASSERT_TRUE(platform::EnumerateProcesses(&ids));
  EXPECT_TRUE(ids.size() <= platform::kMaxProcesses && std::is_sorted(ids.begin(), ids.end()));
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
  EXPECT_FALSE(platform::HklmKeyOpensForRead(L"SOFTWARE\\Vendor\\App\\3.01"));  // no hive at all
  prefix.WriteFile(prefix.root() / "system.reg",
                   TempPrefix::ReadFile(HF_SOURCE_DIR "/platform/registry_system.reg"));
  const std::vector<CaseRow> cases = ReadCases("platform/registry_cases.tsv");
  ASSERT_FALSE(cases.empty());
  for (const CaseRow& c : cases)
    EXPECT_EQ(platform::HklmKeyOpensForRead(Wide(c.at(0))), c.at(1) == "1") << c[0];
}
#endif

}  // namespace
