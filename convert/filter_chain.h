// The filter chain of one hot folder: the enabled legacy filters and, unless
// one of them replaces it, the default chain.
#ifndef HF_CONVERT_FILTER_CHAIN_H_
#define HF_CONVERT_FILTER_CHAIN_H_

#include <wx/xml/xml.h>

#include <vector>

#include "engine/migrator.h"
#include "store/records.h"

// The list the store shows, in step with the "Filter" children of the
// "FilterSetting" tree, which carry each filter's settings.
struct FilterChain {
  std::vector<db::FilterEntry> entries;
};

// A new "Filter" element, name = identifier, holding one "UI" element with one
// child per map entry (element named after the key, one text child holding
// the value). The caller owns the result.
wxXmlNode* BuildFilterElement(const SettingsMap& settings, const wxString& identifier);

// Reads the filter-enable map and the filters' settings maps, and makes
// `root`, a node without children, the "FilterSetting" element of the chain.
// The tree is built where the store record holds it, so that no folder pays
// for a copy of it. The default chain writes its fixed values into the
// engine's maps first, where they stay for later folders.
FilterChain BuildFilterChain(CHFMigrator& engine, wxXmlNode* root);

#endif  // HF_CONVERT_FILTER_CHAIN_H_
