// Imposition template resolution: which installation directory holds the
// current templates, and how a folder's custom template is named.
#ifndef HF_CONVERT_TEMPLATES_H_
#define HF_CONVERT_TEMPLATES_H_

#include <wx/string.h>

// True when the 32-bit view of the imposition product's registry key opens
// for reading under HKEY_LOCAL_MACHINE.
bool HasWow6432ProductKey();

// The directory of the installed imposition templates, as a Windows path:
// the "Program Files (x86)" one when HasWow6432ProductKey() answers true.
wxString TemplateDirectory();

// Windows path splitting, the way the service split its work folder: the
// directory part is everything before the last separator ('\' or '/', a
// run of them counting as one), with no trailing separator; the file part
// everything after it (empty when the text ends in a separator; a leading
// drive such as "D:" is never a file part); a name is a file part without
// the text from its last dot on.
wxString WindowsDirectoryPart(const wxString& path);
wxString WindowsFileName(const wxString& path);

#endif  // HF_CONVERT_TEMPLATES_H_
