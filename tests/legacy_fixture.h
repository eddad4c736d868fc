// Writing legacy installations into a temporary prefix: the binary list file
// and folder.cfg files.
#ifndef HF_TESTS_LEGACY_FIXTURE_H_
#define HF_TESTS_LEGACY_FIXTURE_H_

#include <cstdint>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include "tests/temp_prefix.h"

struct LegacyFolder {
  std::string path;       // Windows path as stored, in Windows-1252 bytes
  std::uint16_t state;    // 2 = enabled
};

// The list file's bytes: the 40-byte header, then one 264-byte record each.
inline std::string LegacyListBytes(const std::vector<LegacyFolder>& folders) {
  std::string bytes("KYR ZerOvurova Database\0\x01", 25);  // magic, version 1
  bytes.append(15, '\0');
  for (const LegacyFolder& folder : folders) {
    std::string record(264, '\0');
    record[2] = static_cast<char>(folder.state & 0xFF);
    record[3] = static_cast<char>(folder.state >> 8);
    record.replace(4, folder.path.size(), folder.path);
    bytes += record;
  }
  return bytes;
}

inline std::filesystem::path LegacyListHostPath(const TempPrefix& prefix) {
  return prefix.Drive('c') / "ProgramData" / "KYR" / "ZerOvurova" /
         "KYR ZerOvurova Preferences" / "KYR ZerOvurova DB";
}

inline void WriteLegacyList(const TempPrefix& prefix, const std::vector<LegacyFolder>& folders) {
  prefix.WriteFile(LegacyListHostPath(prefix), LegacyListBytes(folders));
}

// Records UTF-8 as the prefix's ANSI code page, as Wine does for a Windows
// switched to it: list paths that are not UTF-8 no longer decode.
inline void UseUtf8AnsiCodePage(const TempPrefix& prefix) {
  prefix.WriteFile(prefix.root() / "system.reg",
                   "WINE REGISTRY Version 2\n\n"
                   "[System\\\\CurrentControlSet\\\\Control\\\\Nls\\\\CodePage] 1700000000\n"
                   "\"ACP\"=\"65001\"\n");
}

// Host path of D:\<relative> (relative with forward slashes).
inline std::filesystem::path OnDriveD(const TempPrefix& prefix, const std::string& relative) {
  return prefix.Drive('d') / relative;
}

// Writes <folder>/[_KYR_HotFolder_]/folder.cfg for a folder on drive D:.
inline void WriteFolderConfig(const TempPrefix& prefix, const std::string& folder_on_d,
                              const std::string& xml) {
  prefix.WriteFile(OnDriveD(prefix, folder_on_d) / "[_KYR_HotFolder_]" / "folder.cfg", xml);
}

// <d> elements nested `depth` deep around `inside`.
inline std::string NestedXml(int depth, const std::string& inside = "") {
  std::string xml;
  for (int i = 0; i < depth; ++i) xml += "<d>";
  xml += inside;
  for (int i = 0; i < depth; ++i) xml += "</d>";
  return xml;
}

// UTF-16LE with its byte order mark: the same markup, a NUL after each
// ASCII byte.
inline std::string Utf16LeWithBom(const std::string& ascii) {
  std::string bytes("\xFF\xFE", 2);
  for (char c : ascii) bytes += std::string{c, '\0'};
  return bytes;
}

// A document around `inside` whose entity references expand to 70 MiB,
// padded ahead of them to stay within expat's own amplification limit.
inline std::string ExpandingXml(const std::string& inside = "") {
  std::string xml = "<!DOCTYPE r [<!ENTITY e '" + std::string(64 * 1024, 'e') + "'>]><r>" + inside +
                    "<!--" + std::string(1024 * 1024, 'p') + "-->";
  for (int i = 0; i < 1100; ++i) xml += "&e;";
  return xml + "</r>";
}

#endif  // HF_TESTS_LEGACY_FIXTURE_H_
