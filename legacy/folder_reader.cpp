#include "app/migrator.h"

void CHFMigrator::MigrateFolders() {}
