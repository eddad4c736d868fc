#include "convert/templates.h"

#include "app/migrator.h"

bool HasWow6432ProductKey() { return false; }

wxString CHFMigrator::MapLegacyTemplate(const wxString&) { return wxString(); }

wxString CHFMigrator::MakeCustomTemplatePath() { return wxString(); }
