#include "convert/registration.h"

#include "app/migrator.h"

wxXmlNode* BuildFilterElement(const SettingsMap&, const wxString& identifier) {
  auto* filter = new wxXmlNode(wxXML_ELEMENT_NODE, "Filter");
  filter->AddAttribute("name", identifier);
  return filter;
}

bool CHFMigrator::RegisterHotFolder() { return false; }
