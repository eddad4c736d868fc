// hfbench_generate PREFIX COUNT [SEED]
//
// Writes a legacy installation of COUNT hot folders into a new Wine-style
// prefix: the list file on C:, the folders and their folder.cfg on D:. The
// same seed gives the same installation byte for byte. Prints how many
// folders have a folder.cfg, which is how many a migration registers.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "bench/legacy_config.h"

namespace fs = std::filesystem;

namespace {

constexpr int kFoldersPerSite = 100;

struct Kind {
  const char* list_name;  // Windows-1252, as the list file holds it
  const char* host_name;  // UTF-8, as the host file system holds it
};

const Kind kKinds[] = {
    {"Brochures", "Brochures"},
    {"Flyers", "Flyers"},
    {"Booklets", "Booklets"},
    {"Photos", "Photos"},
    {"Office", "Office"},
    {"Archive", "Archive"},
    {"Caf\xE9 Menus", "Caf\xC3\xA9 Menus"},
    {"Proofs \x96 Final", "Proofs \xE2\x80\x93 Final"},  // an en dash, 0x80-0x9F in 1252
    {"Posters", "Posters"},
};

struct Folder {
  std::string list_path;  // D:\... in Windows-1252
  std::string xml_path;   // the same path in UTF-8, for folder.cfg
  fs::path host_dir;
};

Folder MakeFolder(const fs::path& drive_d, bench::Random& random, int index) {
  char site[16];
  char number[16];
  std::snprintf(site, sizeof site, "Site %02d", index / kFoldersPerSite);
  std::snprintf(number, sizeof number, " %05d", index);
  const Kind& kind = kKinds[random.Below(sizeof kKinds / sizeof kKinds[0])];
  std::string suffix = random.Percent(10) ? ".v2" : "";
  std::string tail = std::string(site) + "\\";
  Folder folder;
  folder.list_path = "D:\\Jobs\\" + tail + kind.list_name + number + suffix;
  folder.xml_path = "D:\\Jobs\\" + tail + kind.host_name + number + suffix;
  folder.host_dir = drive_d / "Jobs" / site / (std::string(kind.host_name) + number + suffix);
  return folder;
}

// Mostly enabled, as installations are; a few disabled in every way the
// list file can say so.
std::uint16_t MakeState(bench::Random& random) {
  static const std::uint16_t kOtherStates[] = {0, 1, 3};
  return random.Percent(85) ? 2 : kOtherStates[random.Below(3)];
}

void AppendRecord(std::string* list, const std::string& path, std::uint16_t state) {
  std::string record(264, '\0');
  record[2] = static_cast<char>(state & 0xFF);
  record[3] = static_cast<char>(state >> 8);
  record.replace(4, path.size(), path);
  *list += record;
}

bool WriteFile(const fs::path& path, const std::string& bytes) {
  fs::create_directories(path.parent_path());
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
  return static_cast<bool>(out);
}

void MakePrefix(const fs::path& root) {
  fs::create_directories(root / "drive_c" / "ProgramData");
  fs::create_directories(root / "drive_d");
  fs::create_directories(root / "dosdevices");
  fs::create_directory_symlink("../drive_c", root / "dosdevices" / "c:");
  fs::create_directory_symlink("../drive_d", root / "dosdevices" / "d:");
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 3 || argc > 4) {
    std::fprintf(stderr, "usage: hfbench_generate PREFIX COUNT [SEED]\n");
    return 2;
  }
  fs::path root = argv[1];
  int count = std::atoi(argv[2]);
  std::uint64_t seed = argc == 4 ? std::strtoull(argv[3], nullptr, 10) : 1;
  if (count <= 0 || fs::exists(root / "dosdevices")) {
    std::fprintf(stderr, "hfbench_generate: need a positive count and a new prefix\n");
    return 2;
  }
  MakePrefix(root);
  bench::Random random(seed);
  std::string list("KYR ZerOvurova Database", 23);
  list += std::string(1, '\0') + '\x01' + std::string(15, '\0');
  int configs = 0;
  for (int i = 0; i < count; ++i) {
    Folder folder = MakeFolder(root / "drive_d", random, i);
    AppendRecord(&list, folder.list_path, MakeState(random));
    fs::create_directories(folder.host_dir);
    // A folder whose settings were lost is listed but has nothing to read.
    if (random.Percent(3)) continue;
    std::string config = bench::MakeFolderConfig(random, folder.xml_path);
    if (!WriteFile(folder.host_dir / "[_KYR_HotFolder_]" / "folder.cfg", config)) return 1;
    ++configs;
  }
  fs::path list_file = root / "drive_c" / "ProgramData" / "KYR" / "ZerOvurova" /
                       "KYR ZerOvurova Preferences" / "KYR ZerOvurova DB";
  if (!WriteFile(list_file, list)) return 1;
  std::printf("%d\n", configs);
  return 0;
}
