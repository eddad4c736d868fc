// CHFGuiApp: the application object. All of its work happens in OnInit,
// which always answers false, so the framework never enters a main loop and
// the process exits with status -1.
#ifndef HF_APP_GUI_APP_H_
#define HF_APP_GUI_APP_H_

#include <wx/app.h>
#include <wx/string.h>

#include "engine/migrator.h"

// A headless tool needs no display on POSIX hosts; on Windows it is the
// GUI-subsystem application it always was.
#ifdef _WIN32
using CHFGuiAppBase = wxApp;
#else
using CHFGuiAppBase = wxAppConsole;
#endif

class CHFGuiApp : public CHFGuiAppBase {
 public:
  CHFGuiApp();
  ~CHFGuiApp() override;
  bool OnInit() override;
  int OnExit() override;

 private:
  wxString m_Version;
  CHFMigrator m_Engine;
};

#endif  // HF_APP_GUI_APP_H_
