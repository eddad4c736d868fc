// CHFGuiApp: the application object. All of its work happens in OnInit,
// which always answers false, so the framework never enters a main loop and
// the process exits with status -1.
#ifndef HF_APP_GUI_APP_H_
#define HF_APP_GUI_APP_H_

#include <wx/app.h>
#include <wx/string.h>

#include "engine/migrator.h"

// Headless on every host: wx's base library only. On Windows the executable
// is still the GUI-subsystem one it always was, so no console window opens.
class CHFGuiApp : public wxAppConsole {
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
