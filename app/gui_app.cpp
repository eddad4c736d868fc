#include "app/gui_app.h"

#include <wx/debug.h>
#include <wx/init.h>
#include <wx/utils.h>

#include <vector>

#include "app/run_mutex.h"
#include "platform/platform.h"
#include "server/server_process.h"

namespace {

const int kStartupWaitSeconds = 7;

}  // namespace

CHFGuiApp::CHFGuiApp() : m_Version(HF_VERSION) {}  // the project's version, "1.0.0.1"

CHFGuiApp::~CHFGuiApp() = default;

bool CHFGuiApp::OnInit() {
  // Another run is under way: this one changes nothing, not even the server.
  if (!platform::HoldNamedMutex(kRunMutex)) return false;
  bool started_by_us = false;
  std::vector<platform::ProcessId> running_before;
  if (!platform::NamedMutexExists(kServerMutex)) {
    // Whatever runs now is not the server this run starts, whatever its
    // name; without that list the stop cannot tell, so nothing is stopped.
    started_by_us = platform::EnumerateProcesses(&running_before, platform::kAllProcesses);
    platform::LaunchDetached(kServerExecutable);  // outcome deliberately not examined
    wxSleep(kStartupWaitSeconds);
  }
  m_Engine.Run();
  if (started_by_us) StopServer(running_before);
  return false;
}

int CHFGuiApp::OnExit() {
  return 0;
}

wxIMPLEMENT_APP_NO_MAIN(CHFGuiApp);

// The entry point on every host, as wxIMPLEMENT_APP_CONSOLE would write it,
// but with the GUI library's assertions off in every build before any of it
// runs: on Windows a failed one opens a modal message box even in a console
// program, and nothing may wait for a click on an unattended server. (The
// Windows executables cannot open one anyway: platform/win32_no_dialogs.)
int main(int argc, char** argv) {
  wxDisableAsserts();
  wxDISABLE_DEBUG_LOGGING_IN_RELEASE_BUILD();
#ifdef _WIN32
  (void)argc;
  (void)argv;
  return wxEntry();  // the library reads the wide command line itself
#else
  return wxEntry(argc, argv);
#endif
}
