#ifndef SSOCLIENT_TOOL_OUTPUT_TABLE_H
#define SSOCLIENT_TOOL_OUTPUT_TABLE_H

#include <optional>
#include <string>
#include <vector>

#include "output/console.h"

namespace SsoClient::Tool {

/// A cell, with a text that is safe to write (`SafeText`). A line feed begins a new line.
struct Cell {
  std::string text{};
  std::optional<Colour> colour{};
};

/// Rows of cells in columns that are as wide as their widest cell. On a terminal, the last column
/// is wrapped at its edge; elsewhere lines are as long as their content, for grep.
class Table {
 public:
  /// Each line begins with `indent`. A row may have fewer cells than others.
  explicit Table(std::string indent) : indent_(std::move(indent)) {}

  void Add(std::vector<Cell> row) { rows_.push_back(std::move(row)); }
  /// Writes the rows to `console.out`.
  void Print(const Console& console) const;

 private:
  std::vector<std::size_t> ColumnWidths() const;

  std::string indent_;
  std::vector<std::vector<Cell>> rows_;
};

/// The columns that are left for the last column of a row in which the others and the indentation
/// take `used` columns; at least 24.
std::size_t RemainingColumns(const Console& console, std::size_t used);

}  // namespace SsoClient::Tool

#endif
