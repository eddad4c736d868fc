// The settings map through growth and through clearing and refilling, as
// every folder of a run refills the engine's maps: insertion order, exact
// keys, a new key's empty value, find never inserting.
#include "engine/settings_map.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace {

TEST(SettingsMap, KeepsOrderAndExactKeysWhenGrownClearedAndRefilled) {
  // Keys that differ only in case, a trailing blank or what follows a NUL.
  const std::vector<wxString> odd = {"a",
                                     "A",
                                     "a ",
                                     wxString(L"a\0b", 3),
                                     wxString(L"a\0c", 3),
                                     "",
                                     L"\u043A\u043B\u044E\u0447",
                                     L"\U0001F600"};
  const struct {
    int count;           // keys besides the odd ones
    const char* prefix;  // of those keys
    std::size_t value;   // length of each value
  } rounds[] = {{20000, "KEY", 1}, {40, "Key", 100}, {60, "k", 2}, {10, "Key", 1}};
  SettingsMap map;
  for (const auto& round : rounds) {
    SCOPED_TRACE(round.prefix);
    map.Clear();
    EXPECT_TRUE(map.Empty());
    std::vector<wxString> keys = odd;
    for (int i = round.count; i > 0; --i)
      keys.push_back(wxString::Format("%s%07d", round.prefix, i));
    for (std::size_t i = 0; i < keys.size(); ++i) {
      wxString& value = map.GetOrInsert(keys[i]);
      ASSERT_EQ(value, "") << i;  // nothing of an earlier round's entry
      value = wxString(round.value, wxUniChar('a' + i % 26));
    }
    ASSERT_EQ(map.Size(), keys.size());
    std::size_t i = 0;
    for (const SettingsMap::Entry& entry : map) {
      ASSERT_EQ(entry.first, keys[i]) << i;
      ASSERT_EQ(entry.second, wxString(round.value, wxUniChar('a' + i % 26))) << i;
      ++i;
    }
    for (std::size_t k = 0; k < keys.size(); k += 7) {
      ASSERT_EQ(map.Find(SettingsKey(keys[k])), &map.GetOrInsert(keys[k])) << k;
    }
    for (const wxString& absent : {wxString("b"), wxString(L"a\0", 2), wxString(round.prefix)}) {
      EXPECT_EQ(map.Find(absent), nullptr);
    }
    EXPECT_EQ(map.Size(), keys.size());
    map.GetOrInsert(SettingsKey("b")) = "last";
    EXPECT_EQ(map.Size(), keys.size() + 1);
    EXPECT_EQ((map.end() - 1)->first, "b");
  }
}

}  // namespace
