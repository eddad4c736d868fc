// The legacy folder's settings directory: the names built from the folder
// path, and retiring the directory once its settings have been converted.
#ifndef HF_CONVERT_SETTINGS_DIR_H_
#define HF_CONVERT_SETTINGS_DIR_H_

#include <wx/string.h>

#include <cstdint>
#include <optional>

struct FolderPaths {
  wxString full_path;  // the folder path put back together, Windows form
  wxString name;       // last component without the text from its last dot
  wxString settings;   // ...\[_KYR_HotFolder_]
  wxString work;
  wxString failed;
  wxString move;
  wxString retired;  // ...\[_KYR_HotFolder_Old]
};

// Splits and joins the way Windows does on every host, so the store receives
// the same paths wherever the tool runs.
FolderPaths MakeFolderPaths(const wxString& folder_path);

// The folder.cfg the folder reader looks for, built from the folder path as
// listed.
wxString LegacyConfigPath(const wxString& listed_folder);

// What retiring did, so that a refused registration can undo it.
struct Retirement {
  bool moved = false;
  std::optional<std::uint32_t> attributes;  // as found, when they could be read
};

// Clears read-only and system (nothing else) and moves the settings directory
// to its retired name, once more after clearing again if the first move
// fails. An existing retired directory is never replaced. A busy directory
// is waited for up to a few seconds before a move counts as failed. No
// move is synced: the store's commit and the run record are what a power
// loss must not undo.
Retirement RetireSettingsDirectory(const FolderPaths& paths);

// Puts a retired settings directory back under its own name, with the
// attributes it had, after the store refused the folder: its settings must
// stay within reach of a later run. Does nothing unless this run moved it.
void RestoreSettingsDirectory(const FolderPaths& paths, const Retirement& retirement);

// Puts a retired settings directory back under its own name, for a folder
// an interrupted run retired but never registered. Its attributes stay as
// retiring left them.
bool PutBackSettingsDirectory(const FolderPaths& paths);

#endif  // HF_CONVERT_SETTINGS_DIR_H_
