#include "cli/Table.h"

#include <unistd.h>

#include <algorithm>
#include <ostream>
#include <utility>

#include "cli/Output.h"
#include "cli/Text.h"

namespace tallowmere::cli {

Table::Table(std::vector<Column> columns) : mColumns(std::move(columns)) {
  mWidths.reserve(mColumns.size());
  for (const Column& column : mColumns) mWidths.push_back(CharacterCount(column.title));
}

void Table::Add(Row row) {
  for (std::size_t i = 0; i < row.size(); ++i) {
    mWidths[i] = std::max(mWidths[i], CharacterCount(row[i]));
  }
  mRows.push_back(std::move(row));
}

void Table::Print(std::ostream& out) const {
  std::vector<std::string> titles;
  titles.reserve(mColumns.size());
  for (const Column& column : mColumns) titles.push_back(column.title);
  out << Styled(LineOf(titles), Style::kBold, STDOUT_FILENO) << '\n';
  for (const auto& row : mRows) out << LineOf(row) << '\n';
}

std::string Table::LineOf(const Row& row) const {
  std::string line;
  for (std::size_t i = 0; i < row.size(); ++i) {
    const std::string padding(mWidths[i] - CharacterCount(row[i]), ' ');
    const bool isRight = mColumns[i].align == Align::kRight;
    line += (i == 0 ? "" : "  ") + (isRight ? padding + row[i] : row[i] + padding);
  }
  line.erase(line.find_last_not_of(' ') + 1);
  return line;
}

}  // namespace tallowmere::cli
