// UTF-8 encoding of one code point, shared by the store's text writers.
#ifndef HF_STORE_UTF8_H_
#define HF_STORE_UTF8_H_

#include <cstdint>

// Writes the bytes of `code`, which must be at most U+10FFFF, at `to` (room
// for four) and answers the end of what it wrote; whether a surrogate may be
// written is the caller's decision.
inline char* WriteUtf8(std::uint32_t code, char* to) {
  if (code < 0x80) {
    *to++ = static_cast<char>(code);
    return to;
  }
  if (code < 0x800) {
    *to++ = static_cast<char>(0xC0 | (code >> 6));
  } else if (code < 0x10000) {
    *to++ = static_cast<char>(0xE0 | (code >> 12));
    *to++ = static_cast<char>(0x80 | ((code >> 6) & 0x3F));
  } else {
    *to++ = static_cast<char>(0xF0 | (code >> 18));
    *to++ = static_cast<char>(0x80 | ((code >> 12) & 0x3F));
    *to++ = static_cast<char>(0x80 | ((code >> 6) & 0x3F));
  }
  *to++ = static_cast<char>(0x80 | (code & 0x3F));
  return to;
}

#endif  // HF_STORE_UTF8_H_
