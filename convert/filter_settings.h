// Conversion of the legacy filter settings into the converted filter maps.
#ifndef HF_CONVERT_FILTER_SETTINGS_H_
#define HF_CONVERT_FILTER_SETTINGS_H_

#include "app/settings_map.h"
#include "convert/filter_tables.h"

class CHFMigrator;

// Everything ConvertFilterSettings does before it registers the folder: the
// nine conversion steps, the office and DCS settings, then the PDF switch.
// Kept apart so the conversion can be checked without touching a store.
void ConvertFilterMaps(CHFMigrator& migrator);

// One conversion step: translates `legacy` into `converted` by `step`'s rows,
// then writes its fixed settings. An empty legacy map writes nothing at all.
void RunConversionStep(CHFMigrator& migrator, const SettingsMap& legacy, const ConversionStep& step,
                       SettingsMap& converted);

#endif  // HF_CONVERT_FILTER_SETTINGS_H_
