// hfstore: shows what the configuration store holds. It only reads; a
// missing store stays missing.
#include <wx/cmdline.h>
#include <wx/debug.h>
#include <wx/init.h>

#include <clocale>
#include <iostream>

#include "inspect/hfstore_check.h"
#include "inspect/store_json.h"
#include "store/store_reader.h"

namespace {

constexpr int kExitOk = 0;
constexpr int kExitStoreError = 1;
constexpr int kExitUsage = 2;

const char kCommandsHelp[] =
    "\n"
    "Commands:\n"
    "  list   One line per hot folder, in registration order, with four fields\n"
    "         separated by tabs: \"enabled\" or \"disabled\", the name, the folder\n"
    "         path, and the filter chain as display names joined by \" > \".\n"
    "         Tabs and line breaks inside a value are shown as spaces; dump\n"
    "         shows every value exactly.\n"
    "  dump   The whole store as one JSON object (UTF-8): \"hotFolders\", an\n"
    "         array of hot folders in registration order, each with \"enabled\"\n"
    "         and its six records.\n"
    "  check  Each folder of the legacy hot-folder list against the store and\n"
    "         the disk, one tab-separated line each: the result (\"migrated\",\n"
    "         \"not migrated\", \"interrupted\", \"enabled state differs\",\n"
    "         \"settings not retired\" or \"path not decodable\"), the folder\n"
    "         (a path whose bytes do not decode in the ANSI code page shown\n"
    "         as its bytes, those outside printable ASCII as \\xHH) and what\n"
    "         was found; then a summary line. A field holding a tab, a line\n"
    "         break or another control character, or starting with '\"', is\n"
    "         written as the JSON string --json gives it. With --json, one JSON\n"
    "         object instead.\n"
    "         Exit status 0 when every folder that had legacy settings is\n"
    "         migrated as listed, 1 otherwise.\n"
    "\n"
    "Without --store the store at its fixed location is read\n"
    "(C:\\ProgramData\\KYR\\Dirorodiv\\HotFolders.db, through the Wine prefix on\n"
    "POSIX hosts). The store is never created or changed.\n"
    "\n"
    "Exit status: 0 on success, 1 when the store is missing or unreadable,\n"
    "2 on a usage error.";

std::string Utf8(const wxString& text) {
  wxScopedCharBuffer utf8 = text.utf8_str();
  return std::string(utf8.data(), utf8.length());
}

// A field of a tab-separated line must not break the line apart.
std::string ListField(const wxString& text) {
  wxString field = text;
  for (wxString::iterator it = field.begin(); it != field.end(); ++it) {
    if (*it == '\t' || *it == '\n' || *it == '\r') *it = ' ';
  }
  return Utf8(field);
}

void PrintList(const std::vector<StoredHotFolder>& folders) {
  for (const StoredHotFolder& folder : folders) {
    wxString chain;
    for (const db::FilterEntry& entry : folder.setting.Filters) {
      if (!chain.empty()) chain += " > ";
      chain += entry.DisplayName;
    }
    std::cout << (folder.enabled ? "enabled" : "disabled") << '\t' << ListField(folder.setting.Name)
              << '\t' << ListField(folder.setting.FolderPath) << '\t' << ListField(chain) << '\n';
  }
}

void PrintDump(const std::vector<StoredHotFolder>& folders) {
  // Text that is not valid UTF-8 is shown with replacement characters
  // instead of aborting the dump.
  std::cout << StoreToJson(folders).dump(2, ' ', false,
                                         nlohmann::ordered_json::error_handler_t::replace)
            << '\n';
}

void DescribeCommandLine(wxCmdLineParser* parser) {
  parser->SetLogo("hfstore: inspect the hot-folder configuration store.");
  // Options start with "-" on every host, so the usage reads the same on all.
  parser->SetSwitchChars("-");
  parser->AddSwitch("h", "help", "show this help", wxCMD_LINE_OPTION_HELP);
  parser->AddOption("", "store", "read this database file instead of the fixed location",
                    wxCMD_LINE_VAL_STRING);
  parser->AddSwitch("", "json", "check: print one JSON object instead of lines");
  parser->AddParam("list|dump|check", wxCMD_LINE_VAL_STRING);
  parser->AddUsageText(kCommandsHelp);
}

int Run(int argc, char** argv) {
  wxCmdLineParser parser(argc, argv);
  DescribeCommandLine(&parser);
  switch (parser.Parse(/*showUsage=*/false)) {
    case 0:
      break;
    case -1:
      std::cout << Utf8(parser.GetUsageString());
      return kExitOk;
    default:  // the parser has said what is wrong
      std::cerr << "Try 'hfstore --help'.\n";
      return kExitUsage;
  }
  wxString command = parser.GetParam(0);
  if (command != "list" && command != "dump" && command != "check") {
    std::cerr << "hfstore: unknown command '" << Utf8(command) << "'; try 'hfstore --help'.\n";
    return kExitUsage;
  }
  const bool json = parser.Found("json");
  if (json && command != "check") {
    std::cerr << "hfstore: --json belongs to check; try 'hfstore --help'.\n";
    return kExitUsage;
  }
  wxString store_option;
  platform::HostPath file = parser.Found("store", &store_option)
                                ? platform::HostPath(store_option.fn_str())
                                : StoreHostPath();
  if (command == "check") return RunCheck(file, json);
  std::vector<StoredHotFolder> folders;
  wxString error;
  if (!ReadStore(file, &folders, &error)) {
    std::cerr << "hfstore: " << ListField(error) << '\n';
    return kExitStoreError;
  }
  if (command == "list") {
    PrintList(folders);
  } else {
    PrintDump(folders);
  }
  if (!std::cout.flush()) {
    std::cerr << "hfstore: cannot write the output\n";
    return kExitStoreError;
  }
  return kExitOk;
}

}  // namespace

int main(int argc, char** argv) {
  // No assertion of the GUI library may stop a check that a script runs: on
  // Windows a failed one would open a message box and wait for a click.
  wxDisableAsserts();
  // Arguments (a store path) arrive in the user's encoding.
  std::setlocale(LC_CTYPE, "");
  wxInitializer initializer(argc, argv);
  if (!initializer.IsOk()) {
    std::cerr << "hfstore: cannot start\n";
    return kExitStoreError;
  }
  return Run(argc, argv);
}
