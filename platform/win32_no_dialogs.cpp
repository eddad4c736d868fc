// No dialog, ever, in a shipped executable: a run on an unattended server
// must never wait for a click.
//
// The GUI library opens a modal message box for a failed assertion and for
// its last-resort error message, even in a console program. The statically
// linked library calls MessageBoxW through its import pointer; that pointer
// is defined here instead, so the executable does not import the function at
// all (scripts/build_win64.sh checks that), and a call answers as a box that
// could not be shown.
//
// The system and the C runtime have boxes of their own: the critical-error
// box ("no disk in the drive", for a listed folder on an empty removable
// drive), the fault box, and the runtime's abort message, which a
// GUI-subsystem program shows in a box. They are turned off before main.
#include <stdlib.h>
#include <windows.h>

namespace {

int WINAPI NoMessageBox(HWND, LPCWSTR, LPCWSTR, UINT) {
  SetLastError(ERROR_NOT_SUPPORTED);
  return 0;
}

const bool kNoSystemDialogs = [] {
  SetErrorMode(SEM_FAILCRITICALERRORS | SEM_NOGPFAULTERRORBOX | SEM_NOOPENFILEERRORBOX);
  _set_error_mode(_OUT_TO_STDERR);
  return true;
}();

}  // namespace

extern "C" {
decltype(&MessageBoxW) __imp_MessageBoxW = NoMessageBox;
}
