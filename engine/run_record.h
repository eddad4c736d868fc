// The run record: which listed folders a migration run is about to retire,
// written durably beside the store before the first settings directory
// moves and removed when the run is complete. A record found at start-up was
// left by an interrupted run; it names the folders whose retired settings
// may have to be put back.
//
// The file is text: a header line, the number of entries, one line per
// entry ("R" or "K", the byte length of the folder path, the path in UTF-8)
// and a line with a checksum of everything before it. A file that does not
// read exactly so is damaged or not ours, and is never trusted.
#ifndef HF_ENGINE_RUN_RECORD_H_
#define HF_ENGINE_RUN_RECORD_H_

#include <wx/string.h>

#include <string>
#include <vector>

struct RunRecordEntry {
  wxString folder;  // as the legacy list names it
  // Whether the run creates the folder's "[_KYR_HotFolder_Old]". False when
  // that directory was there before the run: it is someone else's and is
  // never put back ("K", keep).
  bool retires = true;
};

// C:\ProgramData\KYR\Dirorodiv\hfmigrate.run, beside the store.
std::wstring RunRecordPath();

std::string EncodeRunRecord(const std::vector<RunRecordEntry>& entries);
// False, leaving `entries` empty, for anything but a whole record.
bool DecodeRunRecord(const std::string& bytes, std::vector<RunRecordEntry>* entries);

enum class RunRecordState { kNone, kFound, kDamaged };
RunRecordState ReadRunRecord(std::vector<RunRecordEntry>* entries);

// Replaces the record in one durable step, creating its folder if needed.
bool WriteRunRecord(const std::vector<RunRecordEntry>& entries);
// True when no record is left.
bool RemoveRunRecord();
// Renames a damaged record out of the way ("hfmigrate.run.damaged", then
// ".damaged-2" and so on), so that it can be looked at but is never read
// again. False when it could not be moved.
bool SetAsideRunRecord();

#endif  // HF_ENGINE_RUN_RECORD_H_
