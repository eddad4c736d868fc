// Replays a fuzz target's committed corpus as an ordinary test, so that the
// seeds, and every input that once broke a property and was added to the
// corpus, are checked by every test run and not only while fuzzing.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

std::vector<std::filesystem::path> CorpusFiles() {
  std::vector<std::filesystem::path> files;
  for (const auto& entry : std::filesystem::directory_iterator(HF_FUZZ_CORPUS)) {
    if (entry.is_regular_file()) files.push_back(entry.path());
  }
  std::sort(files.begin(), files.end());
  return files;
}

// HF_FUZZ_SUITE names the target, so that each target's corpus is a test of
// its own.
TEST(HF_FUZZ_SUITE, EveryInputKeepsTheProperties) {
  int argc = 0;
  char** argv = nullptr;
  LLVMFuzzerInitialize(&argc, &argv);
  std::vector<std::filesystem::path> files = CorpusFiles();
  ASSERT_FALSE(files.empty());
  for (const std::filesystem::path& file : files) {
    SCOPED_TRACE(file.string());
    std::ifstream in(file, std::ios::binary);
    std::string bytes((std::istreambuf_iterator<char>(in)), {});
    // A broken property aborts with its message; reaching the end is the pass.
    EXPECT_EQ(
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size()),
        0);
  }
}

}  // namespace
