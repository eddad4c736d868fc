// The start-up every fuzz target shares, linked into each target and its
// corpus replay test.
#include "fuzz/fuzz_support.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
  UseMemoryTempDir();
  return 0;
}
