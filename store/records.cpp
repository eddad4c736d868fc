#include "store/records.h"

namespace db {

namespace {

// Yields the UTF-16 code units of a string one at a time. On hosts where
// wchar_t is 32 bits a character beyond the BMP becomes its surrogate pair;
// where it is 16 bits the units pass through as they are.
class Utf16Units {
 public:
  explicit Utf16Units(const wxString& s) : p_(s.wc_str()), end_(p_ + s.length()) {}

  // False at the end of the string.
  bool Next(std::uint32_t* unit) {
    if (pending_ != 0) {
      *unit = pending_;
      pending_ = 0;
      return true;
    }
    if (p_ == end_) return false;
    std::uint32_t c = static_cast<std::uint32_t>(*p_++);
    if (c < 0x10000) {
      *unit = c;
      return true;
    }
    c -= 0x10000;
    *unit = 0xD800 + ((c >> 10) & 0x3FF);
    pending_ = 0xDC00 + (c & 0x3FF);
    return true;
  }

 private:
  const wchar_t* p_;
  const wchar_t* end_;
  std::uint32_t pending_ = 0;
};

}  // namespace

bool Utf16Less::operator()(const wxString& a, const wxString& b) const {
  Utf16Units left(a);
  Utf16Units right(b);
  for (;;) {
    std::uint32_t l = 0;
    std::uint32_t r = 0;
    bool has_left = left.Next(&l);
    bool has_right = right.Next(&r);
    if (!has_right) return false;  // b is a prefix of a, or equal
    if (!has_left) return true;    // a is a proper prefix of b
    if (l != r) return l < r;
  }
}

}  // namespace db
