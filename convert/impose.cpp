#include "app/migrator.h"

void CHFMigrator::ConvertImposeSettings(db::ImposeConfiguration&) {}
