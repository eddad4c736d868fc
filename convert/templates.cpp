// Imposition template paths. Only path text is composed here: the template
// directory and files belong to the imposition component and are never
// looked at, since they need not be installed when the folders migrate.
#include "convert/templates.h"

#include <wx/wxcrt.h>

#include <cstddef>

#include "engine/ascii_text.h"
#include "engine/migrator.h"
#include "platform/platform.h"

namespace {

// The store receives these exact Windows paths on every host, so the
// separator is the backslash everywhere, not the host's.
const char kSeparator[] = "\\";
const char kTemplateDir[] =
    "C:\\Program Files\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template";
const char kTemplateDirX86[] =
    "C:\\Program Files (x86)\\Velmo\\Applications3\\Common Files\\KYR\\Plexa3\\template";

// The built-in legacy templates. The search is by substring, so the
// two-digit identifiers must come first or "ImposeTemplate.41" would be
// taken for "ImposeTemplate.4".
struct LegacyTemplate {
  const char* form;
  const char* lower_form;
  const char* file;
};
const LegacyTemplate kLegacyTemplates[] = {
    {"ImposeTemplate.41", "imposetemplate.41", "3up-trifold_brochure26.dbt"},
    {"ImposeTemplate.51", "imposetemplate.51", "4up-gate_fold26.dbt"},
    {"ImposeTemplate.61", "imposetemplate.61", "4up-head_to_head26.dbt"},
    {"ImposeTemplate.71", "imposetemplate.71", "4up-z_fold26.dbt"},
    {"ImposeTemplate.1", "imposetemplate.1", "1up-full_bleed.dbt"},
    {"ImposeTemplate.2", "imposetemplate.2", "2up-perfect.dbt"},
    {"ImposeTemplate.3", "imposetemplate.3", "2up-saddle.dbt"},
    {"ImposeTemplate.4", "imposetemplate.4", "3up-trifold_brochure.dbt"},
    {"ImposeTemplate.5", "imposetemplate.5", "4up-gate_fold.dbt"},
    {"ImposeTemplate.6", "imposetemplate.6", "4up-head_to_head.dbt"},
    {"ImposeTemplate.7", "imposetemplate.7", "4up-z_fold.dbt"},
};

bool IsSeparator(wxUniChar c) {
  return c == '\\' || c == '/';
}

// Length of a leading drive ("D:"), which belongs to the directory part.
std::size_t DriveLength(const wxString& path) {
  return path.length() >= 2 && path[1] == ':' && wxIsalpha(path[0]) ? 2 : 0;
}

// Index just past the directory part: the last run of separators (a run
// is one separator, as Windows resolves the path), else the drive. The run
// starts at `last_separator`.
std::size_t FilePartStart(const wxString& path, std::size_t* last_separator) {
  *last_separator = wxString::npos;
  for (std::size_t i = path.length(); i > 0; --i) {
    if (IsSeparator(path[i - 1])) {
      std::size_t run = i - 1;
      while (run > 0 && IsSeparator(path[run - 1])) --run;
      *last_separator = run;
      return i;
    }
  }
  return DriveLength(path);
}

}  // namespace

bool HasWow6432ProductKey() {
  return platform::HklmKeyOpensForRead(L"SOFTWARE\\Wow6432Node\\Tessaly Systems\\Corvane_app\\3.0");
}

wxString TemplateDirectory() {
  return TableText(HasWow6432ProductKey() ? kTemplateDirX86 : kTemplateDir);
}

wxString WindowsDirectoryPart(const wxString& path) {
  std::size_t separator;
  std::size_t start = FilePartStart(path, &separator);
  return separator == wxString::npos ? path.substr(0, start) : path.substr(0, separator);
}

wxString WindowsFileName(const wxString& path) {
  std::size_t separator;
  wxString file = path.substr(FilePartStart(path, &separator));
  std::size_t dot = file.rfind('.');
  return dot == wxString::npos ? file : file.substr(0, dot);
}

// Identifiers are compared as stored, case and all: a form in capitals is
// not one the service ever wrote.
wxString CHFMigrator::MapLegacyTemplate(const wxString& identifier) {
  wxString directory = TemplateDirectory();
  for (const LegacyTemplate& row : kLegacyTemplates) {
    if (identifier.find(TableText(row.form)) != wxString::npos ||
        identifier.find(TableText(row.lower_form)) != wxString::npos) {
      return directory + TableText(kSeparator) + TableText(row.file);
    }
  }
  return wxString();
}

// The custom template is named after the folder two levels above the work
// folder (the hot folder itself, for the usual <folder>\Work\Spool layout).
// "WorkFolder" is read by Find: resolving a path must not add an empty
// work folder to the folder's settings.
wxString CHFMigrator::MakeCustomTemplatePath() {
  wxString directory = TemplateDirectory();
  const wxString* work = m_FolderSettings.Find(TableKey("WorkFolder"));
  wxString d1 = WindowsDirectoryPart(work ? *work : wxString());
  wxString d2 = WindowsDirectoryPart(d1);
  return directory + TableText(kSeparator) + TableText("customTemplateHF2.x-") +
         WindowsFileName(d2) + TableText(".dbt");
}
