// What the fuzz targets share: a property check that libFuzzer sees as a
// crash, and file bytes and wide text from arbitrary input.
#ifndef HF_FUZZ_FUZZ_SUPPORT_H_
#define HF_FUZZ_FUZZ_SUPPORT_H_

#include <stdio.h>
#include <stdlib.h>

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

// The input as the bytes of a file.
inline std::string InputBytes(const std::uint8_t* data, std::size_t size) {
  return std::string(reinterpret_cast<const char*>(data), size);
}

// Wide text from bytes: UTF-8 where the bytes are UTF-8, and any other byte
// b as the lone surrogate U+DC00+b, so that every input is some text and
// broken code points reach the code under test too.
inline std::wstring WideFromBytes(const std::uint8_t* data, std::size_t size) {
  std::wstring text;
  for (std::size_t i = 0; i < size;) {
    const std::uint8_t lead = data[i];
    const int extra = lead < 0x80       ? 0
                      : lead >> 5 == 6  ? 1
                      : lead >> 4 == 14 ? 2
                      : lead >> 3 == 30 ? 3
                                        : -1;
    std::uint32_t code = lead & (0x7F >> (extra > 0 ? extra + 1 : 0));  // its payload bits
    bool valid = extra >= 0 && i + extra < size;
    for (int k = 1; valid && k <= extra; ++k) {
      valid = (data[i + k] & 0xC0) == 0x80;
      code = (code << 6) | (data[i + k] & 0x3F);
    }
    text.push_back(static_cast<wchar_t>(valid ? code : 0xDC00 + lead));
    i += valid ? extra + 1 : 1;
  }
  return text;
}

#endif  // HF_FUZZ_FUZZ_SUPPORT_H_
