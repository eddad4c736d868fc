// What the fuzz targets share: a property check that libFuzzer sees as a
// crash, a temporary directory in memory, and wide text from arbitrary bytes.
#ifndef HF_FUZZ_FUZZ_SUPPORT_H_
#define HF_FUZZ_FUZZ_SUPPORT_H_

#include <stdio.h>
#include <stdlib.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <string>

// A broken property aborts, so libFuzzer keeps the input as a crash.
#define FUZZ_CHECK(condition)                                                          \
  do {                                                                                 \
    if (!(condition)) {                                                                \
      fprintf(stderr, "%s:%d: property broken: %s\n", __FILE__, __LINE__, #condition); \
      abort();                                                                         \
    }                                                                                  \
  } while (0)

// Prefixes are built and removed for every input; in memory that costs no
// disk writes, and the store's durable commits cost no real syncs. An
// explicit TMPDIR (scripts/fuzz.sh sets one) wins.
inline void UseMemoryTempDir() {
  if (getenv("TMPDIR") != nullptr) return;
  if (access("/dev/shm", W_OK) == 0) setenv("TMPDIR", "/dev/shm", 1);
}

// The input as the bytes of a file.
inline std::string InputBytes(const std::uint8_t* data, std::size_t size) {
  return std::string(reinterpret_cast<const char*>(data), size);
}

// Wide text from bytes: UTF-8 where the bytes are UTF-8, and any other byte
// b as the lone surrogate U+DC00+b, so that every input is some text and
// broken code points reach the code under test too.
inline std::wstring WideFromBytes(const std::uint8_t* data, std::size_t size) {
  std::wstring text;
  std::size_t i = 0;
  while (i < size) {
    std::uint8_t lead = data[i];
    int extra = lead < 0x80           ? 0
                : (lead >> 5) == 0x6  ? 1
                : (lead >> 4) == 0xE  ? 2
                : (lead >> 3) == 0x1E ? 3
                                      : -1;
    std::uint32_t code = extra == 0   ? lead
                         : extra == 1 ? lead & 0x1F
                         : extra == 2 ? lead & 0x0F
                                      : lead & 0x07;
    bool valid = extra >= 0 && i + extra < size;
    for (int k = 1; valid && k <= extra; ++k) {
      valid = (data[i + k] & 0xC0) == 0x80;
      code = (code << 6) | (data[i + k] & 0x3F);
    }
    if (!valid) {
      text.push_back(static_cast<wchar_t>(0xDC00 + lead));
      ++i;
      continue;
    }
    text.push_back(static_cast<wchar_t>(code));
    i += extra + 1;
  }
  return text;
}

#endif  // HF_FUZZ_FUZZ_SUPPORT_H_
