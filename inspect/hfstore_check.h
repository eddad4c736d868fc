// hfstore check: each folder of the legacy list against the store and the
// disk, for a migration tool that prints nothing. It only reads.
#ifndef HF_INSPECT_HFSTORE_CHECK_H_
#define HF_INSPECT_HFSTORE_CHECK_H_

#include "platform/platform.h"

// Prints one line per listed folder and a summary (or one JSON object) on
// standard output. Answers the exit status: 0 when every folder that had
// legacy settings is migrated as listed, 1 otherwise or when the list or
// the store cannot be read.
int RunCheck(const platform::HostPath& store_file, bool json);

#endif  // HF_INSPECT_HFSTORE_CHECK_H_
