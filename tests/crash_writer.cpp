// Registers hot folders D:\Crash\<first> ... one after another, so that a
// test can kill it mid-write and check what the store kept. Every folder has
// three filters, two job settings and one imposition setting. With
// "disabled", each is registered as the tool registers a folder listed
// disabled: announced, created, then disabled.
//
//   store_crash_writer FIRST COUNT [disabled]
#include <wx/init.h>

#include <cstdlib>
#include <string>

#include "store/store.h"

namespace {

bool Register(long number, bool disabled) {
  wxString path = wxString::Format("D:\\Crash\\%ld", number);
  db::Setting setting;
  setting.Name = wxString::Format("%ld", number);
  setting.FolderPath = path;
  setting.Flag4 = false;
  setting.Filters = {{"PDF", "KYR.PDF.1"}, {"PS", "KYR.PS.1"}, {"VDP", "KYR.VDP.1"}};
  db::FolderConfiguration folder;
  folder.FolderPath = path;
  folder.WorkFolder = path + "\\[_KYR_HotFolder_]\\[WorkFolder]";
  db::JobConfiguration job;
  job.emplace("num copies", db::JobSettingEntry{"NumCopies", "2", ""});
  job.emplace("Duplex", db::JobSettingEntry{"Duplex", "None", ""});
  wxXmlNode tree(wxXML_ELEMENT_NODE, "FilterSetting");
  tree.AddChild(new wxXmlNode(wxXML_ELEMENT_NODE, "Filter"));
  db::FilterConfiguration filter;
  filter = tree;
  db::ImposeConfiguration impose;
  impose.emplace("QXImpFdGaps", db::ImposeSettingEntry{"QXImpFdGaps", "5 5 "});
  db::PreflightConfiguration preflight;
  RODuriZudaze& store = RODuriZudaze::GetInstance();
  if (disabled) store.CreateNextDisabled(path);
  if (store.CreateHotFolder(setting, folder, job, filter, impose, preflight) == 0) return false;
  return !disabled || RODuriZudaze::GetInstance().DisableHotFolder(path);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3 && (argc != 4 || std::string(argv[3]) != "disabled")) return 2;
  wxInitializer initializer;
  long first = std::strtol(argv[1], nullptr, 10);
  long count = std::strtol(argv[2], nullptr, 10);
  for (long n = first; n < first + count; ++n) {
    if (!Register(n, argc == 4)) return 1;
  }
  return 0;
}
