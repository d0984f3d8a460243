#include "cli/Table.h"

#include <algorithm>
#include <ostream>
#include <utility>

#include "cli/Text.h"

namespace tallowmere::cli {

Table::Table(std::vector<Column> columns) : mColumns(std::move(columns)) {
  mWidths.reserve(mColumns.size());
  for (const Column& column : mColumns) mWidths.push_back(CharacterCount(column.title));
}

void Table::Add(std::vector<std::string> row) {
  for (std::size_t i = 0; i < row.size(); ++i) {
    mWidths[i] = std::max(mWidths[i], CharacterCount(row[i]));
  }
  mRows.push_back(std::move(row));
}

void Table::Print(std::ostream& out) const {
  std::vector<std::string> titles;
  titles.reserve(mColumns.size());
  for (const Column& column : mColumns) titles.push_back(column.title);
  PrintRow(out, titles);
  for (const auto& row : mRows) PrintRow(out, row);
}

void Table::PrintRow(std::ostream& out, const std::vector<std::string>& row) const {
  std::string line;
  for (std::size_t i = 0; i < row.size(); ++i) {
    const std::string padding(mWidths[i] - CharacterCount(row[i]), ' ');
    const bool isRight = mColumns[i].align == Align::kRight;
    line += (i == 0 ? "" : "  ") + (isRight ? padding + row[i] : row[i] + padding);
  }
  line.erase(line.find_last_not_of(' ') + 1);
  out << line << '\n';
}

}  // namespace tallowmere::cli
