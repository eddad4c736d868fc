// Realistic legacy folder.cfg documents for benchmarks, drawn from a seeded
// generator so that two runs over the same seed see the same installation.
#ifndef HF_BENCH_LEGACY_CONFIG_H_
#define HF_BENCH_LEGACY_CONFIG_H_

#include <cstdint>
#include <string>

namespace bench {

// splitmix64: the same numbers on every compiler and library, which the
// standard distributions do not promise.
class Random {
 public:
  explicit Random(std::uint64_t seed) : state_(seed) {}
  std::uint64_t Next();
  // Uniform in [0, n).
  std::uint32_t Below(std::uint32_t n) { return static_cast<std::uint32_t>(Next() % n); }
  // True with the given chance in percent.
  bool Percent(std::uint32_t chance) { return Below(100) < chance; }

 private:
  std::uint64_t state_;
};

// One folder.cfg; `work_folder` is the folder's own Windows path, from
// which its work folder setting is derived.
std::string MakeFolderConfig(Random& random, const std::string& folder_path);

}  // namespace bench

#endif  // HF_BENCH_LEGACY_CONFIG_H_
