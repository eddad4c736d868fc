#include "app/migrator.h"

bool CHFMigrator::ConvertFilterSettings() {
  ApplyPdfConversion();
  return RegisterHotFolder();
}

void CHFMigrator::ApplyPdfConversion() {}
