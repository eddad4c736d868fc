// A Wine-style prefix in a fresh temporary directory, for tests.
//
//   <root>/drive_c, <root>/drive_d            the drives' contents
//   <root>/dosdevices/c: -> ../drive_c        as Wine lays them out
//   <root>/dosdevices/d: -> ../drive_d
//
// While it lives, WINEPREFIX names it (the previous value comes back when it
// is destroyed), so the platform layer and the executables it starts map
// Windows paths into it. The whole tree is removed afterwards.
#ifndef HF_TESTS_TEMP_PREFIX_H_
#define HF_TESTS_TEMP_PREFIX_H_

#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <string>
#include <system_error>

class TempPrefix {
 public:
  TempPrefix() {
    std::string pattern = (std::filesystem::temp_directory_path() / "hfprefix.XXXXXX").string();
    root_ = mkdtemp(pattern.data());
    std::filesystem::create_directories(root_ / "drive_c");
    std::filesystem::create_directories(root_ / "drive_d");
    std::filesystem::create_directories(root_ / "dosdevices");
    std::filesystem::create_directory_symlink("../drive_c", root_ / "dosdevices" / "c:");
    std::filesystem::create_directory_symlink("../drive_d", root_ / "dosdevices" / "d:");
    if (const char* old = getenv("WINEPREFIX")) previous_ = old;
    setenv("WINEPREFIX", root_.c_str(), 1);
  }

  ~TempPrefix() {
    if (previous_) {
      setenv("WINEPREFIX", previous_->c_str(), 1);
    } else {
      unsetenv("WINEPREFIX");
    }
    std::error_code ignored;
    // Tests may leave read-only directories behind; make them removable.
    for (auto it = std::filesystem::recursive_directory_iterator(root_, ignored);
         it != std::filesystem::recursive_directory_iterator(); it.increment(ignored)) {
      if (!it->is_symlink(ignored) && it->is_directory(ignored)) {
        std::filesystem::permissions(it->path(), std::filesystem::perms::owner_all,
                                     std::filesystem::perm_options::add, ignored);
      }
    }
    std::filesystem::remove_all(root_, ignored);
  }

  TempPrefix(const TempPrefix&) = delete;
  TempPrefix& operator=(const TempPrefix&) = delete;

  const std::filesystem::path& root() const { return root_; }

  // Host path of a drive's root, such as Drive('d') for D:\.
  std::filesystem::path Drive(char letter) const {
    return root_ / (std::string("drive_") + letter);
  }

  // Writes a file (and its missing parent directories) under the prefix.
  void WriteFile(const std::filesystem::path& host_path, const std::string& bytes) const {
    std::filesystem::create_directories(host_path.parent_path());
    std::ofstream out(host_path, std::ios::binary | std::ios::trunc);
    out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  }

  // The whole content of a regular file; empty for anything else, which
  // might not end (a FIFO) or not read at all (a directory).
  static std::string ReadFile(const std::filesystem::path& host_path) {
    std::error_code ignored;
    if (!std::filesystem::is_regular_file(host_path, ignored)) return std::string();
    std::ifstream in(host_path, std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), {});
  }

 private:
  std::filesystem::path root_;
  std::optional<std::string> previous_;
};

#endif  // HF_TESTS_TEMP_PREFIX_H_
