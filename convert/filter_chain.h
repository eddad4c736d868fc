// The filter chain of one hot folder: the enabled legacy filters and, unless
// one of them replaces it, the default chain.
#ifndef HF_CONVERT_FILTER_CHAIN_H_
#define HF_CONVERT_FILTER_CHAIN_H_

#include <wx/xml/xml.h>

#include <memory>
#include <vector>

#include "engine/migrator.h"
#include "store/records.h"

// The list the store shows and, in step with it, the "FilterSetting" tree
// whose "Filter" children carry each filter's settings.
struct FilterChain {
  std::unique_ptr<wxXmlNode> root;
  std::vector<db::FilterEntry> entries;
};

// A new "Filter" element, name = identifier, holding one "UI" element with one
// child per map entry (element named after the key, one text child holding
// the value). The caller owns the result.
wxXmlNode* BuildFilterElement(const SettingsMap& settings, const wxString& identifier);

// Reads the filter-enable map and the filters' settings maps. The default
// chain writes its fixed values into the engine's maps first, where they
// stay for later folders.
FilterChain BuildFilterChain(CHFMigrator& engine);

#endif  // HF_CONVERT_FILTER_CHAIN_H_
