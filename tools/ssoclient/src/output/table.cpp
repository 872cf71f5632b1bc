#include "output/table.h"

#include <algorithm>
#include <limits>
#include <ostream>
#include <string_view>

#include "output/text_width.h"

namespace SsoClient::Tool {
namespace {

constexpr std::string_view kGap = "  ";
constexpr std::size_t kNarrowest = 24;

std::string Painted(const Console& console, const Cell& cell, const std::string& text) {
  return cell.colour ? console.Paint(*cell.colour, text) : text;
}

std::size_t WidthOf(const Cell& cell) {
  std::size_t widest = 0;
  for (const std::string& line : WrappedLines(cell.text, std::numeric_limits<std::size_t>::max())) {
    widest = std::max(widest, DisplayWidth(line));
  }
  return widest;
}

struct Lines {
  const Cell* cell;
  std::vector<std::string> lines;
};

// Trailing spaces are left out, since they would wrap on a narrow terminal.
void PrintRow(const Console& console, const std::string& indent, const std::vector<Lines>& cells,
              const std::vector<std::size_t>& widths) {
  std::size_t height = 1;
  for (const Lines& each : cells) {
    height = std::max(height, each.lines.size());
  }
  for (std::size_t line = 0; line < height; ++line) {
    std::string pending = indent;
    for (std::size_t column = 0; column < cells.size(); ++column) {
      const Lines& each = cells[column];
      const std::string text = line < each.lines.size() ? each.lines[line] : std::string();
      if (!text.empty()) {
        console.out << pending << Painted(console, *each.cell, text);
        pending.clear();
      }
      pending += PaddedTo("", widths[column] - std::min(widths[column], DisplayWidth(text)));
      pending += kGap;
    }
    console.out << '\n';
  }
}

}  // namespace

std::size_t RemainingColumns(const Console& console, std::size_t used) {
  const auto columns = static_cast<std::size_t>(std::max(console.columns, 1));
  return columns > used + kNarrowest ? columns - used : kNarrowest;
}

std::vector<std::size_t> Table::ColumnWidths() const {
  std::vector<std::size_t> widths;
  for (const std::vector<Cell>& row : rows_) {
    widths.resize(std::max(widths.size(), row.size()));
    for (std::size_t i = 0; i < row.size(); ++i) {
      widths[i] = std::max(widths[i], WidthOf(row[i]));
    }
  }
  return widths;
}

void Table::Print(const Console& console) const {
  const std::vector<std::size_t> widths = ColumnWidths();
  for (const std::vector<Cell>& row : rows_) {
    std::vector<Lines> cells;
    std::size_t used = DisplayWidth(indent_);
    for (std::size_t i = 0; i < row.size(); ++i) {
      const bool isWrapped = console.outIsTerminal && i + 1 == widths.size();
      const std::size_t width =
          isWrapped ? RemainingColumns(console, used) : std::numeric_limits<std::size_t>::max();
      cells.push_back({&row[i], WrappedLines(row[i].text, width)});
      used += widths[i] + kGap.size();
    }
    PrintRow(console, indent_, cells, widths);
  }
}

}  // namespace SsoClient::Tool
