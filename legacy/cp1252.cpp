#include "legacy/cp1252.h"

namespace {

// 0x80-0x9F, the only range where Windows-1252 differs from Latin-1.
const wchar_t kHighControls[32] = {
    0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021,  // 80-87
    0x02C6, 0x2030, 0x0160, 0x2039, 0x0152, 0x008D, 0x017D, 0x008F,  // 88-8F
    0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022, 0x2013, 0x2014,  // 90-97
    0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178,  // 98-9F
};

}  // namespace

wxString DecodeCp1252(const char* bytes, std::size_t size) {
  std::wstring wide;
  wide.reserve(size);
  for (std::size_t i = 0; i < size; ++i) {
    unsigned char byte = static_cast<unsigned char>(bytes[i]);
    bool high_control = byte >= 0x80 && byte <= 0x9F;
    wide.push_back(high_control ? kHighControls[byte - 0x80] : static_cast<wchar_t>(byte));
  }
  return wxString(wide);
}
