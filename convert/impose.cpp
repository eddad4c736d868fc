// Imposition settings: the legacy ImposeInfo, ImpositionProperties and
// ImposeDeliveryInfo maps become the printer-description keywords of one hot
// folder's imposition configuration.
//
// The legacy maps are only read (by Find, so nothing is inserted into them);
// a key read while absent counts as empty text. Entries go into the result
// only when their keyword is not there yet.
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/ascii_text.h"
#include "engine/migrator.h"
#include "engine/numbers.h"

namespace {

// A legacy word and the code the store knows it by.
struct WordCode {
  const char* word;
  int code;
};

// A whole table: rows searched in order, whole text, ignoring case; the
// first match decides and `otherwise` answers for everything else.
struct CodeTable {
  const WordCode* rows;
  std::size_t count;
  int otherwise;
};

template <std::size_t N>
constexpr CodeTable Table(const WordCode (&rows)[N], int otherwise) {
  return CodeTable{rows, N, otherwise};
}

// clang-format off
// "GANGUPCOLLATE" comes before "GANGUPCOLLATEMULTI"; with whole-text
// comparison the order decides nothing, but it is kept as the service has it.
const WordCode kBindingRows[] = {
    {"PERFECT",            2},
    {"SADDLESTITCH",       3},
    {"NESTEDSADDLESTITCH", 4},
    {"GANGUPREPEAT",       5},
    {"GANGUPUNIQUE",       6},
    {"GANGUPCOLLATE",      10},
    {"GANGUPCOLLATEMULTI", 11},
    {"GANGUPSTACKNCUT",    12},
};
const WordCode kEdgeRows[] = {
    {"LEFT",  0},
    {"RIGHT", 1},
};
const WordCode kYesNoRows[] = {
    {"YES", 1},
    {"NO",  2},
};
const WordCode kOrientationRows[] = {
    {"LANDSCAPE", 2},
    {"PORTRAIT",  1},
};
const WordCode kOutputSequenceRows[] = {
    {"DEFAULT", 0},
    {"REVERSE", 1},
};
const WordCode kGangupRows[] = {
    {"STANDARD",           1000},
    {"HEAD2HEAD",          1001},
    {"FOOT2FOOT",          1002},
    {"REVERSAL",           1003},
    {"REVERSAL_ALTERNATE", 1004},
};
// clang-format on

const CodeTable kBinding = Table(kBindingRows, 0);
const CodeTable kEdge = Table(kEdgeRows, -1);
// A printer mark that is neither YES nor NO (absent included) still fills
// its field in "QXImpMarks". The service defines no code for it; 0 is the
// code auto-scale and watermarks use for "neither", so all three YES/NO
// settings read the same way.
const CodeTable kMark = Table(kYesNoRows, 0);
const CodeTable kAutoScale = Table(kYesNoRows, 0);
const CodeTable kWatermark = Table(kYesNoRows, 0);
const CodeTable kOrientation = Table(kOrientationRows, -1);
const CodeTable kOutputSequence = Table(kOutputSequenceRows, -1);
const CodeTable kGangup = Table(kGangupRows, 0);

int CodeOf(const CodeTable& table, const wxString& value) {
  for (std::size_t i = 0; i < table.count; ++i) {
    if (value.CmpNoCase(TableText(table.rows[i].word)) == 0) return table.rows[i].code;
  }
  return table.otherwise;
}

// The same digits as "%ld", without a format string to parse for each of
// the dozens of numbers in a folder's imposition (std::to_wstring parses
// one).
wxString Decimal(long value) {
  wchar_t digits[24];
  wchar_t* const end = digits + sizeof(digits) / sizeof(digits[0]);
  wchar_t* first = end;
  unsigned long magnitude =
      value < 0 ? 0UL - static_cast<unsigned long>(value) : static_cast<unsigned long>(value);
  do {
    *--first = static_cast<wchar_t>(L'0' + magnitude % 10);
    magnitude /= 10;
  } while (magnitude != 0);
  if (value < 0) *--first = L'-';
  return wxString(first, static_cast<std::size_t>(end - first));
}

// The store's fixed point: 16 fractional bits in a signed 32-bit integer,
// handed over as the text of a double. A product that is not a number or
// does not fit is the value x86 gives for a failed conversion, produced here
// explicitly because the C++ conversion would be undefined.
wxString FixedPoint(const wxString& text) {
  double product = ReadDoubleOr0(text) * 65536.0;
  std::int32_t fixed = INT32_MIN;
  if (!std::isnan(product) && product > -2147483649.0 && product < 2147483648.0) {
    fixed = static_cast<std::int32_t>(product);  // truncates toward zero
  }
  return FormatFixed(static_cast<double>(fixed));
}

// Reads one converted folder's legacy maps and writes its entries.
class ImposeWriter {
 public:
  ImposeWriter(const CHFMigrator& engine, db::ImposeConfiguration& out)
      : ii_(engine.m_ImposeInfo),
        ip_(engine.m_ImpositionProperties),
        di_(engine.m_ImposeDeliveryInfo),
        out_(out) {}

  // Keywords and keys are the table's ASCII texts (see TableText).
  void Put(const char* keyword, const wxString& value) {
    const wxString& key = TableText(keyword);
    auto [entry, added] = out_.try_emplace(key);
    if (added) entry->second = db::ImposeSettingEntry{key, value};
  }
  void Put(const char* keyword, const char* value) { Put(keyword, TableText(value)); }

  // Writers for a key that is present, whatever its value.
  void Copy(const SettingsMap& from, const char* key, const char* keyword) {
    if (const wxString* value = from.Find(TableKey(key))) Put(keyword, *value);
  }
  void Code(const SettingsMap& from, const char* key, const char* keyword, const CodeTable& table) {
    if (const wxString* value = from.Find(TableKey(key))) {
      Put(keyword, Decimal(CodeOf(table, *value)));
    }
  }

  static const wxString& Text(const SettingsMap& from, const char* key) {
    static const wxString kAbsent;
    const wxString* value = from.Find(TableKey(key));
    return value ? *value : kAbsent;
  }

  void Marks();
  void LayoutAndGaps(bool zero_margins);
  void ScaleBleedCreep();
  void TemplateAndDelivery(CHFMigrator& engine);

  const SettingsMap& ii_;
  const SettingsMap& ip_;
  const SettingsMap& di_;
  db::ImposeConfiguration& out_;
};

void ImposeWriter::Marks() {
  static const char* const kMarkKeys[] = {"ShowCropMarks", "ShowFoldLines", "ShowJobName",
                                          "ShowSheetInfo", "ShowDateAndTime"};
  wxString marks;
  for (const char* key : kMarkKeys) {
    if (!marks.empty()) marks += ' ';
    marks += Decimal(CodeOf(kMark, Text(ii_, key)));
  }
  Put("QXImpMarks", marks);
}

// The gap list names its count twice, once before each direction. A gap
// that is missing is left out without lowering the count, as the service
// wrote it; the store reads what it was always sent.
void ImposeWriter::LayoutAndGaps(bool zero_margins) {
  const wxString& x = Text(ii_, "x");
  const wxString& y = Text(ii_, "y");
  Put("QXImpLayout", x + L" " + y);

  std::int32_t columns = ReadInt32(x);
  std::int32_t rows = ReadInt32(y);
  if (columns > 10 || rows > 10) return;

  // The keys HorizontalGap0 to HorizontalGap9, then VerticalGap0 to
  // VerticalGap9, made once per run.
  constexpr int kMostGaps = 10;
  static const std::vector<SettingsKey> kGapKeys = [] {
    std::vector<SettingsKey> keys;
    for (const char* direction : {"HorizontalGap", "VerticalGap"}) {
      for (int i = 0; i < kMostGaps; ++i) keys.emplace_back(AsciiText(direction) + Decimal(i));
    }
    return keys;
  }();
  const int count = zero_margins ? kMostGaps : 5;
  wxString gaps;
  for (int direction = 0; direction < 2; ++direction) {
    gaps += Decimal(count) + L" ";
    for (int i = 0; i < count; ++i) {
      if (const wxString* gap = ii_.Find(kGapKeys[direction * kMostGaps + i])) {
        gaps += *gap;
        gaps += L' ';
      }
    }
  }
  Put("QXImpFdGaps", gaps);
}

void ImposeWriter::ScaleBleedCreep() {
  Code(ii_, "AutoScale", "QXImpAutoPScal", kAutoScale);
  if (const wxString* scale = ii_.Find(TableKey("ScaleFactor"))) {
    Put("QXImpPageScale", *scale);
    Put("QXImpFdPgScale", FixedPoint(*scale));
  }
  Code(ii_, "Orientation", "QXImpOrient", kOrientation);

  // An absent vertical bleed leaves its half empty, not "0": the second
  // field is the legacy text, and there is none.
  if (const wxString* horizontal = ii_.Find(TableKey("HorizontalBleed"))) {
    const wxString* vertical = ii_.Find(TableKey("VerticalBleed"));
    Put("QXImpBleed",
        FixedPoint(*horizontal) + L" " + (vertical ? FixedPoint(*vertical) : wxString()));
    Put("QXImpFdBleed", *horizontal + L" " + (vertical ? *vertical : wxString()));
  }
  if (const wxString* creep = ii_.Find(TableKey("Creep"))) {
    wxString fixed = FixedPoint(*creep);
    Put("QXImpCreeps", fixed + L" " + fixed);
    Put("QXImpFdCreeps", *creep + L" " + *creep);
  }
  Copy(ii_, "CreepDirection", "QXImpCreepDir");
}

// A legacy template decides alone, even one outside the table (its entry is
// then empty); only a custom imposition file brings delivery settings.
void ImposeWriter::TemplateAndDelivery(CHFMigrator& engine) {
  const wxString& legacy_template = Text(ip_, "Template");
  if (!legacy_template.empty()) {
    Put("QXImposeTemplate", engine.MapLegacyTemplate(legacy_template));
    return;
  }
  if (Text(ip_, "ImpInfoFile").empty()) return;
  Put("QXImposeTemplate", engine.MakeCustomTemplatePath());
  Code(di_, "OutputSequence", "QXDeliverySeq", kOutputSequence);
  Copy(di_, "SurfaceOrder", "QXDeliverySur");
  Copy(di_, "NestedSaddleOutputSequence", "QXDeliveryNSSeq");
}

}  // namespace

void CHFMigrator::ConvertImposeSettings(db::ImposeConfiguration& impose) {
  ImposeWriter w(*this, impose);
  w.Code(w.ii_, "Binding", "QXImpBinding", kBinding);
  w.Put("QXImpThickness", "0");
  w.Put("QXImpSpineFold", "0");
  w.Copy(w.ii_, "GroupsOf", "QXImpPPGrp");
  w.Code(w.ii_, "Edge", "QXImpBindEdge", kEdge);
  w.Marks();
  w.Copy(w.ip_, "FixedDuplexValue", "QXDuplex");
  w.Copy(w.ip_, "CustomPageSize", "CustomPageSize");
  w.Copy(w.ip_, "PageSize", "PageSize");
  w.Copy(w.ip_, "PageRegion", "PageRegion");

  bool zero_margins = ImposeWriter::Text(w.ip_, "ZeroMarginsSupport").CmpNoCase(L"TRUE") == 0;
  w.LayoutAndGaps(zero_margins);
  w.ScaleBleedCreep();
  w.Code(w.ii_, "Watermarks", "QXImpWatermark", kWatermark);

  // Only "1" is sent, as "True". "0" would pair with "False", but the
  // service never sent that entry, and a store without it already treats
  // the folder as having no zero margins; we add nothing it never received.
  if (zero_margins && ImposeWriter::Text(w.ip_, "ZeroMargins") == L"1") {
    w.Put("QXImpZeroMargin", "True");
  }
  w.Put("QXImpFdValues", "1");
  w.TemplateAndDelivery(*this);
  w.Code(w.ii_, "GangupStyle", "QXGangupStyle", kGangup);
  w.Copy(w.ii_, "FrontCover", "QXFrontCover");
  w.Copy(w.ii_, "BackCover", "QXBackCover");
}
