// Replays a fuzz target's committed corpus as an ordinary test, so that the
// seeds, and every input that once broke a property and was added to the
// corpus, are checked by every test run and not only while fuzzing.
#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <set>
#include <string>

#include "tests/temp_prefix.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

// HF_FUZZ_SUITE names the target, so that each target's corpus is a test of
// its own. A broken property aborts with its message; reaching the end is
// the pass.
TEST(HF_FUZZ_SUITE, EveryInputKeepsTheProperties) {
  // Prefixes are built and removed for every input: in memory where the host has it.
  if (!getenv("TMPDIR") && access("/dev/shm", W_OK) == 0) setenv("TMPDIR", "/dev/shm", 1);
  std::set<std::filesystem::path> files;  // in a fixed order
  for (const auto& entry : std::filesystem::directory_iterator(HF_FUZZ_CORPUS)) {
    if (entry.is_regular_file()) files.insert(entry.path());
  }
  ASSERT_FALSE(files.empty());
  for (const std::filesystem::path& file : files) {
    SCOPED_TRACE(file.string());
    const std::string bytes = TempPrefix::ReadFile(file);
    EXPECT_EQ(
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()),
        0);
  }
}

}  // namespace
