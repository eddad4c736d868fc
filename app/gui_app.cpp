#include "app/gui_app.h"

#include <wx/utils.h>
#ifdef _WIN32
#include <wx/image.h>
#endif

#include <string>
#include <vector>

#include "platform/platform.h"

namespace {

const wchar_t kServerExecutable[] = L"hotfolder.exe";
const wchar_t kServerMutex[] = L"KYR Dirorodiv - Server";
const int kStartupWaitSeconds = 7;

// Ends the first process the platform lists whose executable is named
// "hotfolder.exe" in any letter case and that can be opened. It need not be
// the one this run launched: the server is known by name only.
void StopServer() {
  std::vector<platform::ProcessId> ids;
  if (!platform::EnumerateProcesses(&ids)) return;
  for (platform::ProcessId id : ids) {
    std::wstring base_name;
    if (!platform::QueryProcessModule(id, &base_name, nullptr)) continue;
    if (wxString(base_name).CmpNoCase(kServerExecutable) != 0) continue;
    platform::TerminateProcess(id);
    return;
  }
}

}  // namespace

CHFGuiApp::CHFGuiApp() : m_Version("1.0.0.1") {}

CHFGuiApp::~CHFGuiApp() = default;

bool CHFGuiApp::OnInit() {
  bool started_by_us = false;
  if (!platform::NamedMutexExists(kServerMutex)) {
    platform::LaunchDetached(kServerExecutable);  // outcome deliberately not examined
    wxSleep(kStartupWaitSeconds);
    started_by_us = true;
  }
  // Image handlers belong to the GUI core and no image is ever loaded in a
  // run, so a headless build does without registering them.
#ifdef _WIN32
  wxInitAllImageHandlers();
#endif
  m_Engine.Run();
  if (started_by_us) StopServer();
  return false;
}

int CHFGuiApp::OnExit() { return 0; }

#ifdef _WIN32
wxIMPLEMENT_APP(CHFGuiApp);
#else
wxIMPLEMENT_APP_CONSOLE(CHFGuiApp);
#endif
