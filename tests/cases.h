// Test cases kept as data: one case a line, its fields separated by tabs,
// "#" starting a comment line; \n, \r, \t, \\ and \xHH stand for what they
// stand for in C.
#ifndef HF_TESTS_CASES_H_
#define HF_TESTS_CASES_H_

#include <fstream>
#include <stdexcept>
#include <string>
#include <vector>

using CaseRow = std::vector<std::string>;

inline std::string Unescape(const std::string& text) {
  std::string out;
  for (std::size_t i = 0; i < text.size(); ++i) {
    const char c = i + 1 < text.size() && text[i] == '\\' ? text[++i] : 0;
    if (c == 'x') {
      out += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
      i += 2;
    } else {
      out += c == 'n' ? '\n' : c == 'r' ? '\r' : c == 't' ? '\t' : c ? c : text[i];
    }
  }
  return out;
}

// The rows of a case file in the source tree, such as "convert/impose_cases.tsv".
inline std::vector<CaseRow> ReadCases(const std::string& file) {
  std::ifstream in(std::string(HF_SOURCE_DIR) + "/" + file);
  if (!in) throw std::runtime_error("cannot read " + file);
  std::vector<CaseRow> rows;
  for (std::string line; std::getline(in, line);) {
    if (line.empty() || line[0] == '#') continue;
    CaseRow row;
    for (std::size_t start = 0, tab = 0; tab != std::string::npos; start = tab + 1) {
      tab = line.find('\t', start);
      row.push_back(Unescape(line.substr(start, tab - start)));
    }
    rows.push_back(row);
  }
  return rows;
}

#endif  // HF_TESTS_CASES_H_
