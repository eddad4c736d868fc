// Assembly of the store records of one hot folder and its registration.
#ifndef HF_CONVERT_REGISTRATION_H_
#define HF_CONVERT_REGISTRATION_H_

#include <wx/string.h>
#include <wx/xml/xml.h>

#include "app/settings_map.h"

// A new "Filter" element, name = identifier, holding one "UI" element with one
// child per map entry (element named after the key, one text child holding
// the value). The caller owns the result.
wxXmlNode* BuildFilterElement(const SettingsMap& settings, const wxString& identifier);

#endif  // HF_CONVERT_REGISTRATION_H_
