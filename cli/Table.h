// Rows of text under titles, in columns as wide as their widest text.
#pragma once

#include <iosfwd>
#include <string>
#include <vector>

namespace tallowmere::cli {

class Table {
 public:
  enum class Align { kLeft, kRight };
  struct Column {
    std::string title;
    Align align = Align::kLeft;
  };

  explicit Table(std::vector<Column> columns);

  // REQUIRES: one text for each column, safe for a terminal.
  void Add(std::vector<std::string> row);

  // Adds an empty line.
  void AddEmptyRow() { Add(std::vector<std::string>(mColumns.size())); }

  bool IsEmpty() const { return mRows.empty(); }

  // Titles are bold on a terminal. Nothing is padded at the end of a line.
  void Print(std::ostream& out) const;

 private:
  std::string LineOf(const std::vector<std::string>& row) const;

  std::vector<Column> mColumns;
  std::vector<std::size_t> mWidths;  // in characters
  std::vector<std::vector<std::string>> mRows;
};

}  // namespace tallowmere::cli
