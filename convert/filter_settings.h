// Conversion of the legacy filter settings into the converted filter maps.
#ifndef HF_CONVERT_FILTER_SETTINGS_H_
#define HF_CONVERT_FILTER_SETTINGS_H_

#include "engine/filter_tables.h"
#include "engine/settings_map.h"

class CHFMigrator;

// One conversion step: translates `legacy` into `converted` by `step`'s rows,
// then writes its fixed settings. CHFMigrator::ConvertFilterSettings runs the
// step of every legacy filter that has one.
void RunConversionStep(CHFMigrator& engine, const SettingsMap& legacy, const ConversionStep& step,
                       SettingsMap& converted);

#endif  // HF_CONVERT_FILTER_SETTINGS_H_
