// The store as JSON, for `hfstore dump`: one object with "hotFolders", each
// record under its own name and every member under the record member's name.
#ifndef HF_INSPECT_STORE_JSON_H_
#define HF_INSPECT_STORE_JSON_H_

#include <nlohmann/json.hpp>

#include <vector>

#include "store/store_reader.h"

nlohmann::ordered_json StoreToJson(const std::vector<StoredHotFolder>& folders);

#endif  // HF_INSPECT_STORE_JSON_H_
