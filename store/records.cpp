#include "store/records.h"

namespace db {

bool Utf16Less::operator()(const wxString& a, const wxString& b) const { return a < b; }

}  // namespace db
