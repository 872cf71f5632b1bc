#include "support/findings_page.h"

#include <cctype>
#include <fstream>
#include <stdexcept>

namespace SsoClient::Tool::Testing {
namespace {

constexpr std::size_t kCells = 5;

std::vector<std::string> CellsOf(const std::string& row) {
  std::vector<std::string> cells;
  std::size_t begin = 1;
  for (std::size_t end = row.find('|', begin); end != std::string::npos;
       end = row.find('|', begin)) {
    cells.push_back(row.substr(begin, end - begin));
    begin = end + 1;
  }
  return cells;
}

std::set<int> NumbersOf(const std::string& cell) {
  std::set<int> numbers;
  for (const char each : cell) {
    if (std::isdigit(static_cast<unsigned char>(each)) != 0) {
      numbers.insert(each - '0');
    }
  }
  return numbers;
}

// What is between pairs of "`".
std::vector<DocumentedFinding> FindingsIn(const std::string& cell) {
  std::vector<DocumentedFinding> all;
  for (std::size_t begin = cell.find('`'); begin != std::string::npos;) {
    const std::size_t end = cell.find('`', begin + 1);
    DocumentedFinding finding;
    finding.name = cell.substr(begin + 1, end - begin - 1);
    finding.mayBeWarning = cell.compare(end + 1, 1, "*") == 0;
    all.push_back(finding);
    begin = cell.find('`', end + 1);
  }
  return all;
}

std::set<std::string> NamesIn(const std::string& cell) {
  std::set<std::string> names;
  for (const DocumentedFinding& each : FindingsIn(cell)) {
    names.insert(each.name);
  }
  return names;
}

std::vector<DocumentedFinding> ReadPage() {
  std::ifstream page(SSOCLIENT_TOOL_PAGE);
  std::string line;
  while (std::getline(page, line) && line != "### Findings") {
  }
  std::vector<DocumentedFinding> all;
  std::set<std::string> steps;
  while (std::getline(page, line)) {
    const std::vector<std::string> cells = line.starts_with('|') ? CellsOf(line) : CellsOf("");
    if (cells.size() != kCells) {
      continue;
    }
    if (cells[0] != " ") {  // otherwise the same as before
      steps = cells[0] == " any " ? std::set<std::string>{"any"} : NamesIn(cells[0]);
    }
    for (DocumentedFinding finding : FindingsIn(cells[1])) {
      finding.steps = steps;
      finding.statuses = NumbersOf(cells[2]);
      all.push_back(finding);
    }
  }
  if (all.empty()) {
    throw std::runtime_error(SSOCLIENT_TOOL_PAGE " has no table of findings");
  }
  return all;
}

}  // namespace

const std::vector<DocumentedFinding>& DocumentedFindings() {
  static const std::vector<DocumentedFinding> all = ReadPage();
  return all;
}

std::map<std::string, std::set<std::string>> DocumentedDetails() {
  constexpr std::size_t kDetailCells = 3;
  std::ifstream page(SSOCLIENT_TOOL_PAGE);
  std::string line;
  while (std::getline(page, line) && !line.starts_with("| step | members of `details` |")) {
  }
  std::map<std::string, std::set<std::string>> all;
  std::string step;
  while (std::getline(page, line) && line.starts_with('|')) {
    const std::vector<std::string> cells = CellsOf(line);
    const std::set<std::string> steps = NamesIn(cells.front());
    step = steps.empty() ? step : *steps.begin();
    if (cells.size() == kDetailCells && !step.empty()) {
      all[step].merge(NamesIn(cells[1]));
    }
  }
  if (all.empty()) {
    throw std::runtime_error(SSOCLIENT_TOOL_PAGE " has no table of details");
  }
  return all;
}

}  // namespace SsoClient::Tool::Testing
