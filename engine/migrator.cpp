#include "engine/migrator.h"

#include "engine/legacy_filters.h"

namespace {

// The maps that belong to no legacy filter.
const SettingsMember kFolderMaps[] = {
    &CHFMigrator::m_FolderSettings,
    &CHFMigrator::m_FilterSettings,
    &CHFMigrator::m_FilterEnable,
    &CHFMigrator::m_Ps,
    &CHFMigrator::m_Vdp,
};

const SettingsMember kDriverAndImposeMaps[] = {
    &CHFMigrator::m_DriverSettings,     &CHFMigrator::m_ImpositionProperties,
    &CHFMigrator::m_ImposeDeliveryInfo, &CHFMigrator::m_ImposeInfo,
    &CHFMigrator::m_ImposeInfoVDP,
};

}  // namespace

void CHFMigrator::ClearSettingsMaps() {
  for (SettingsMember map : kFolderMaps) (this->*map).Clear();
  for (const LegacyFilter& filter : kLegacyFilters) {
    if (filter.legacy) (this->*filter.legacy).Clear();
    (this->*filter.converted).Clear();
  }
  ClearDriverAndImposeMaps();
}

void CHFMigrator::ClearDriverAndImposeMaps() {
  for (SettingsMember map : kDriverAndImposeMaps) (this->*map).Clear();
}
