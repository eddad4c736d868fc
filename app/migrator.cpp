#include "app/migrator.h"

bool CHFMigrator::Run() {
  bool read = ReadLegacyList();
  MigrateFolders();
  return read;
}

void CHFMigrator::ClearSettingsMaps() {
  SettingsMap* maps[] = {
      &m_FolderSettings,   &m_FilterSettings,       &m_FilterEnable,       &m_OneBitTiff,
      &m_OneBitTiffConv,   &m_CtlwFilter,           &m_CtlwFilterConv,     &m_Dcs2Filter,
      &m_Dcs2FilterConv,   &m_Eps2PsFilter,         &m_Eps2PsFilterConv,   &m_ExportPs,
      &m_ExportPsConv,     &m_Jpeg2Pdf,             &m_Jpeg2PdfConv,       &m_Pdf2Go,
      &m_Pdf2GoConv,       &m_PexFilter,            &m_PexFilterConv,      &m_Tiff2Pdf,
      &m_Tiff2PdfConv,     &m_TiffItFilter,         &m_TiffItFilterConv,   &m_MsOffice,
      &m_Ps,               &m_Vdp,                  &m_DriverSettings,     &m_ImpositionProperties,
      &m_ImposeDeliveryInfo, &m_ImposeInfo,         &m_ImposeInfoVDP,
  };
  static_assert(sizeof(maps) / sizeof(maps[0]) == 31, "the engine has 31 settings maps");
  for (SettingsMap* map : maps) map->Clear();
}
