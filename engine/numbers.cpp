#include "engine/numbers.h"

#include <stdlib.h>

#include <locale.h>
#include <cerrno>
#include <charconv>
#include <climits>
#include <string>

namespace {

#ifdef _WIN32
using CLocale = _locale_t;
CLocale MakeCLocale() {
  return _create_locale(LC_ALL, "C");
}
double StrtodC(const char* s, char** end, CLocale l) {
  return _strtod_l(s, end, l);
}
long long StrtollC(const char* s, char** end, CLocale l) {
  return _strtoi64_l(s, end, 10, l);
}
#else
using CLocale = locale_t;
CLocale MakeCLocale() {
  return newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(0));
}
double StrtodC(const char* s, char** end, CLocale l) {
  return strtod_l(s, end, l);
}
long long StrtollC(const char* s, char** end, CLocale l) {
  return strtoll_l(s, end, 10, l);
}
#endif

CLocale TheCLocale() {
  static CLocale locale = MakeCLocale();
  return locale;
}

// Numbers are ASCII; anything else only ends the number, so a lossy
// conversion of other characters cannot change what is read.
std::string Narrow(const wxString& text) {
  std::string out;
  out.reserve(text.length());
  for (wxUniChar c : text)
    out.push_back(c.GetValue() < 0x80 ? static_cast<char>(c.GetValue()) : '?');
  return out;
}

}  // namespace

bool ReadDouble(const wxString& text, double* value) {
  std::string narrow = Narrow(text);
  char* end = nullptr;
  double parsed = StrtodC(narrow.c_str(), &end, TheCLocale());
  if (end == narrow.c_str()) return false;
  *value = parsed;
  return true;
}

double ReadDoubleOr0(const wxString& text) {
  double value = 0.0;
  ReadDouble(text, &value);
  return value;
}

std::int32_t ReadInt32(const wxString& text) {
  std::string narrow = Narrow(text);
  char* end = nullptr;
  long long parsed = StrtollC(narrow.c_str(), &end, TheCLocale());
  if (end == narrow.c_str()) return 0;
  if (parsed > INT32_MAX) return INT32_MAX;
  if (parsed < INT32_MIN) return INT32_MIN;
  return static_cast<std::int32_t>(parsed);
}

wxString FormatFixed(double value) {
  char buffer[512];
  auto result = std::to_chars(buffer, buffer + sizeof(buffer), value, std::chars_format::fixed, 6);
  if (result.ec != std::errc()) return wxString();
  return wxString::FromAscii(buffer, static_cast<size_t>(result.ptr - buffer));
}
