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

  using Row = std::vector<std::string>;

  explicit Table(std::vector<Column> columns);

  // Empty texts alone give an empty line. REQUIRES: one text for each column, safe for a terminal.
  void Add(Row row);

  bool IsEmpty() const { return mRows.empty(); }

  // Titles are bold on a terminal. Nothing is padded at the end of a line.
  void Print(std::ostream& out) const;

 private:
  std::string LineOf(const Row& row) const;

  std::vector<Column> mColumns;
  std::vector<std::size_t> mWidths;  // in characters
  std::vector<Row> mRows;
};

}  // namespace tallowmere::cli
