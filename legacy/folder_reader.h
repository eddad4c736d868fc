// Reading one legacy folder's folder.cfg into the engine's settings maps.
#ifndef HF_LEGACY_FOLDER_READER_H_
#define HF_LEGACY_FOLDER_READER_H_

#include <cstddef>

#include "engine/migrator.h"
#include "legacy/config_tree.h"

// The first element named `name` (ASCII) below `start` (never `start`
// itself): a direct child of `start` wins; failing that, the first child
// subtree in document order that holds a match, however deep. kNone when
// none matches or `start` is kNone.
ConfigTree::Id FindElement(const ConfigTree& tree, ConfigTree::Id start, const wchar_t* name);

// Sets map[child name] = text for every child of `section` whose first child
// carries a non-empty text. A section of kNone changes nothing.
void ReadSection(const ConfigTree& tree, ConfigTree::Id section, SettingsMap& map);

// Reads folder `index` of the engine's folder list: empties every settings
// map, sets "HFFolderPath", reads the sections of its folder.cfg and sets the
// current enabled flag. An unreadable folder.cfg leaves the maps holding
// "HFFolderPath" alone. False, changing nothing, when the folder has no
// folder.cfg.
bool ReadFolderConfiguration(CHFMigrator& engine, std::size_t index);

#endif  // HF_LEGACY_FOLDER_READER_H_
