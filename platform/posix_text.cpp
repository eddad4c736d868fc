// Text conversions for the POSIX platform layer. They are written out here
// rather than taken from the C library because the tool sets no locale: the
// host's multibyte functions would otherwise only know ASCII.
#include <cstdint>
#include <iterator>

#include "platform/posix_internal.h"

namespace platform {
namespace posix {
namespace {

constexpr char32_t kReplacement = 0xFFFD;

void AppendUtf8(char32_t c, std::string* out) {
  if ((c >= 0xD800 && c <= 0xDFFF) || c > 0x10FFFF) c = kReplacement;
  if (c < 0x80) {
    out->push_back(static_cast<char>(c));
  } else if (c < 0x800) {
    out->push_back(static_cast<char>(0xC0 | (c >> 6)));
    out->push_back(static_cast<char>(0x80 | (c & 0x3F)));
  } else if (c < 0x10000) {
    out->push_back(static_cast<char>(0xE0 | (c >> 12)));
    out->push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
    out->push_back(static_cast<char>(0x80 | (c & 0x3F)));
  } else {
    out->push_back(static_cast<char>(0xF0 | (c >> 18)));
    out->push_back(static_cast<char>(0x80 | ((c >> 12) & 0x3F)));
    out->push_back(static_cast<char>(0x80 | ((c >> 6) & 0x3F)));
    out->push_back(static_cast<char>(0x80 | (c & 0x3F)));
  }
}

// Decodes one code point at bytes[*pos], advancing *pos past it. Overlong
// forms, surrogates and truncated sequences give U+FFFD for their first byte.
char32_t DecodeUtf8(const std::string& bytes, size_t* pos) {
  const auto byte = [&](size_t i) { return static_cast<unsigned char>(bytes[i]); };
  const unsigned char lead = byte(*pos);
  size_t length = 0;
  char32_t c = 0;
  char32_t minimum = 0;
  if (lead < 0x80) {
    ++*pos;
    return lead;
  } else if ((lead & 0xE0) == 0xC0) {
    length = 2, c = lead & 0x1F, minimum = 0x80;
  } else if ((lead & 0xF0) == 0xE0) {
    length = 3, c = lead & 0x0F, minimum = 0x800;
  } else if ((lead & 0xF8) == 0xF0) {
    length = 4, c = lead & 0x07, minimum = 0x10000;
  } else {
    ++*pos;
    return kReplacement;
  }
  if (*pos + length > bytes.size()) {
    ++*pos;
    return kReplacement;
  }
  for (size_t i = 1; i < length; ++i) {
    if ((byte(*pos + i) & 0xC0) != 0x80) {
      ++*pos;
      return kReplacement;
    }
    c = (c << 6) | (byte(*pos + i) & 0x3F);
  }
  if (c < minimum || c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) {
    ++*pos;
    return kReplacement;
  }
  *pos += length;
  return c;
}

// Upper-case ranges and how they fold. With `alternate`, only every second
// character from `first` on is upper case and folds by `delta` (the
// interleaved pairs of Latin Extended-A).
struct FoldRange {
  char32_t first;
  char32_t last;
  int delta;
  bool alternate;
};

constexpr FoldRange kFoldRanges[] = {
    {0x0041, 0x005A, 32, false},    // A-Z
    {0x00C0, 0x00D6, 32, false},    // Latin-1 letters before the multiplication sign
    {0x00D8, 0x00DE, 32, false},    // Latin-1 letters after it
    {0x0100, 0x012F, 1, true},      // Latin Extended-A pairs
    {0x0132, 0x0137, 1, true},      //
    {0x0139, 0x0148, 1, true},      //
    {0x014A, 0x0177, 1, true},      //
    {0x0178, 0x0178, -121, false},  // Y with diaeresis folds to U+00FF
    {0x0179, 0x017E, 1, true},      //
    {0x0391, 0x03A1, 32, false},    // Greek capitals
    {0x03A3, 0x03AB, 32, false},    //
    {0x0400, 0x040F, 80, false},    // Cyrillic capitals with diacritics
    {0x0410, 0x042F, 32, false},    // Cyrillic capitals
};

// 0x80-0x9F, the only range where Windows-1252 differs from Latin-1. The
// bytes the code page leaves undefined (0x81, 0x8D, 0x8F, 0x90, 0x9D) become
// the control character of the same value, as Windows' own conversion does.
const wchar_t kCp1252High[32] = {
    0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021,  // 80-87
    0x02C6, 0x2030, 0x0160, 0x2039, 0x0152, 0x008D, 0x017D, 0x008F,  // 88-8F
    0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022, 0x2013, 0x2014,  // 90-97
    0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178,  // 98-9F
};

constexpr unsigned kCodePageUtf8 = 65001;

}  // namespace

std::string WideToUtf8(const std::wstring& wide) {
  std::string out;
  out.reserve(wide.size());
  for (wchar_t c : wide) AppendUtf8(static_cast<char32_t>(static_cast<std::uint32_t>(c)), &out);
  return out;
}

std::wstring Utf8ToWide(const std::string& bytes) {
  std::wstring out;
  out.reserve(bytes.size());
  for (size_t pos = 0; pos < bytes.size();)
    out.push_back(static_cast<wchar_t>(DecodeUtf8(bytes, &pos)));
  return out;
}

wchar_t FoldCase(wchar_t c) {
  const char32_t u = static_cast<char32_t>(static_cast<std::uint32_t>(c));
  for (const FoldRange& range : kFoldRanges) {
    if (u < range.first || u > range.last) continue;
    if (range.alternate && (u - range.first) % 2 != 0) return c;
    return static_cast<wchar_t>(static_cast<std::int64_t>(u) + range.delta);
  }
  return c;
}

bool EqualIgnoringCase(const std::wstring& a, const std::wstring& b) {
  if (a.size() != b.size()) return false;
  for (size_t i = 0; i < a.size(); ++i) {
    if (FoldCase(a[i]) != FoldCase(b[i])) return false;
  }
  return true;
}

}  // namespace posix

// The prefix's code page decides, as it would for a Windows program there.
bool DecodeAnsiText(const std::string& bytes, std::wstring* text) {
  if (text == nullptr) return false;
  std::wstring decoded;
  decoded.reserve(bytes.size());
  if (posix::PrefixAnsiCodePage() == posix::kCodePageUtf8) {
    // Strict: U+FFFD only where the bytes spell it.
    for (size_t pos = 0; pos < bytes.size();) {
      const size_t start = pos;
      const char32_t c = posix::DecodeUtf8(bytes, &pos);
      if (c == posix::kReplacement && bytes.compare(start, 3, "\xEF\xBF\xBD") != 0) return false;
      decoded.push_back(static_cast<wchar_t>(c));
    }
  } else {
    for (unsigned char byte : bytes) {
      const bool high = byte >= 0x80 && byte <= 0x9F;
      decoded.push_back(high ? posix::kCp1252High[byte - 0x80] : static_cast<wchar_t>(byte));
    }
  }
  text->swap(decoded);
  return true;
}

}  // namespace platform
