// CHFMigrator: the migration engine. It holds everything one run works on:
// the legacy folder list, one outcome per folder, and the settings maps that
// are the interface between reading, conversion and registration. Its
// operations are defined by the subsystems that own them (app/ the run's
// order, legacy/ the list file, convert/ conversion and registration); they
// reach the members directly.
#ifndef HF_ENGINE_MIGRATOR_H_
#define HF_ENGINE_MIGRATOR_H_

#include <wx/arrstr.h>
#include <wx/string.h>

#include <map>
#include <optional>
#include <string>
#include <utility>

#include "engine/settings_map.h"
#include "store/records.h"

class CHFMigrator {
 public:
  CHFMigrator() = default;

  // app/run.cpp: the whole migration, ReadLegacyList then MigrateFolders
  // between BeginRun and EndRun, answering what ReadLegacyList answered;
  // and the per-folder loop.
  bool Run();
  void MigrateFolders();

  // app/run_guard.cpp. BeginRun finishes what an interrupted run left (it
  // puts back the settings of folders that run retired but never
  // registered), then records durably which listed folders this run is
  // about to retire; EndRun removes the record of a complete run that left
  // nothing undecided.
  void BeginRun();
  void EndRun();

  // legacy/list_file.cpp
  bool ReadLegacyList();
  // convert/filter_settings.cpp: the legacy filters' settings into their
  // converted maps, then the PDF switch.
  void ConvertFilterSettings();
  void ApplyPdfConversion();
  // convert/registration.cpp
  bool RegisterHotFolder();
  // convert/impose.cpp
  void ConvertImposeSettings(db::ImposeConfiguration& impose);
  // convert/templates.cpp
  wxString MapLegacyTemplate(const wxString& identifier);
  wxString MakeCustomTemplatePath();

  // Empties every settings map. Called before each folder is read, so that
  // nothing of one folder reaches the next.
  void ClearSettingsMaps();
  // Empties the driver and imposition maps, as every folder's registration
  // leaves them.
  void ClearDriverAndImposeMaps();

  wxArrayString m_Folders;       // legacy folder paths, in list-file order
  wxArrayString m_Status;        // one outcome text per folder
  wxArrayString m_EnabledFlags;  // "1" or "0", parallel to m_Folders
  // The bytes of each listed path the host could not decode, by its index
  // in m_Folders, where its entry is empty: such a folder is never touched.
  std::map<std::size_t, std::string> m_UndecodedPaths;
  bool m_CurrentEnabled = true;  // the folder now being converted
  bool m_RunRecorded = false;    // BeginRun left the record of this run
  // Settings of some folder may lie retired though it is not registered (a
  // refused folder's move back, a folder an interrupted run left that this
  // run could not finish): the run's record stays for the next run.
  bool m_RunUndecided = false;

  // The 31 settings maps. "Conv" maps hold a legacy filter's converted
  // settings.
  SettingsMap m_FolderSettings;
  SettingsMap m_FilterSettings;  // FILTERSETTINGS
  SettingsMap m_FilterEnable;
  SettingsMap m_OneBitTiff;
  SettingsMap m_OneBitTiffConv;
  SettingsMap m_CtlwFilter;
  SettingsMap m_CtlwFilterConv;
  SettingsMap m_Dcs2Filter;
  SettingsMap m_Dcs2FilterConv;
  SettingsMap m_Eps2PsFilter;
  SettingsMap m_Eps2PsFilterConv;
  SettingsMap m_ExportPs;
  SettingsMap m_ExportPsConv;
  SettingsMap m_Jpeg2Pdf;
  SettingsMap m_Jpeg2PdfConv;
  SettingsMap m_Pdf2Go;
  SettingsMap m_Pdf2GoConv;
  SettingsMap m_PexFilter;
  SettingsMap m_PexFilterConv;
  SettingsMap m_Tiff2Pdf;
  SettingsMap m_Tiff2PdfConv;
  SettingsMap m_TiffItFilter;
  SettingsMap m_TiffItFilterConv;
  SettingsMap m_MsOffice;
  SettingsMap m_Ps;
  SettingsMap m_Vdp;
  SettingsMap m_DriverSettings;
  SettingsMap m_ImpositionProperties;
  SettingsMap m_ImposeDeliveryInfo;
  SettingsMap m_ImposeInfo;
  SettingsMap m_ImposeInfoVDP;

  // Answers that do not change during one run, kept so that a run over
  // thousands of folders asks the system once: the server's directory
  // (convert/server_lookup) and resolved server names by address.
  std::optional<wxString> m_ServerDirectory;
  std::map<wxString, std::pair<bool, wxString>> m_ResolvedNames;
};

#endif  // HF_ENGINE_MIGRATOR_H_
