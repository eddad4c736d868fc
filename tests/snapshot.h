// A picture of a directory tree, to see what a run changed, and the picture
// a run that retires settings directories must leave.
#ifndef HF_TESTS_SNAPSHOT_H_
#define HF_TESTS_SNAPSHOT_H_

#include <filesystem>
#include <map>
#include <string>
#include <system_error>
#include <vector>

#include "tests/temp_prefix.h"

// Every entry below a root (symbolic links not followed), by path relative to
// it: a directory as "d", a link as "l" and its target, a regular file as "f"
// and its bytes, anything else (a FIFO) as "o".
using Tree = std::map<std::string, std::string>;

// False in `*whole` when the walk failed somewhere.
inline Tree Snapshot(const std::filesystem::path& root, bool* whole = nullptr) {
  namespace fs = std::filesystem;
  Tree tree;
  std::error_code ec;
  for (auto it = fs::recursive_directory_iterator(root, ec); !ec && it != fs::end(it);
       it.increment(ec)) {
    const fs::file_type type = it->symlink_status(ec).type();
    std::string& entry = tree[fs::relative(it->path(), root).generic_string()];
    entry = type == fs::file_type::symlink     ? "l" + fs::read_symlink(it->path(), ec).string()
            : type == fs::file_type::directory ? "d"
            : type == fs::file_type::regular   ? "f" + TempPrefix::ReadFile(it->path())
                                               : "o";
  }
  if (whole) *whole = !ec;
  return tree;
}

// The tree once the settings directories `dirs` (names in the tree) are
// retired: renamed to "[_KYR_HotFolder_Old]", their content unchanged.
inline Tree Retired(const Tree& tree, const std::vector<std::string>& dirs) {
  Tree moved;
  for (const auto& [name, entry] : tree) {
    std::string to = name;
    for (const std::string& dir : dirs) {
      if (!name.rfind(dir, 0) && (name.size() == dir.size() || name[dir.size()] == '/'))
        to = dir.substr(0, dir.size() - 1) + "Old]" + name.substr(dir.size());
    }
    moved[to] = entry;
  }
  return moved;
}

// The tree without `dir` and what it holds.
inline Tree Without(Tree tree, const std::string& dir) {
  for (auto it = tree.lower_bound(dir); it != tree.end() && !it->first.rfind(dir, 0);)
    it = tree.erase(it);
  return tree;
}

#endif  // HF_TESTS_SNAPSHOT_H_
