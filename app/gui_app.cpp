#include "app/gui_app.h"

#include <wx/utils.h>

#include "platform/platform.h"
#include "server/server_process.h"

namespace {

const int kStartupWaitSeconds = 7;

}  // namespace

CHFGuiApp::CHFGuiApp() : m_Version(HF_VERSION) {}  // the project's version, "1.0.0.1"

CHFGuiApp::~CHFGuiApp() = default;

bool CHFGuiApp::OnInit() {
  bool started_by_us = false;
  if (!platform::NamedMutexExists(kServerMutex)) {
    platform::LaunchDetached(kServerExecutable);  // outcome deliberately not examined
    wxSleep(kStartupWaitSeconds);
    started_by_us = true;
  }
  m_Engine.Run();
  if (started_by_us) StopServer();
  return false;
}

int CHFGuiApp::OnExit() {
  return 0;
}

wxIMPLEMENT_APP_CONSOLE(CHFGuiApp);
