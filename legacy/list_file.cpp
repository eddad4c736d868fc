#include "app/migrator.h"

bool CHFMigrator::ReadLegacyList() { return false; }
