#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/documents/JsonForm.h"

namespace vesprun {

/// Prints one value, or one line of several: `json` for programs, else what `text` prints.
void printResult(const Json& json, const std::function<void()>& text);

/// The same where the text is a row for each member of the value, those of inner objects named
/// "outer / inner".
void printResult(const Json& json);

/// Prints a value as one line of JSON.
void printJson(const Json& json);

/// The columns of standard output when it is a terminal; without one, lines have no end.
std::size_t terminalWidth();

/// Emphasized on a terminal, unless NO_COLOR is set.
std::string emphasized(std::string_view text);

/// Prints text for people, untrusted bytes made printable, wrapped at words to the terminal's
/// width. Lines but the first begin with `indentation` more spaces than the text itself.
void printText(std::string_view text, std::size_t indentation = 0);

/// As long as it lives, lines that go to standard output are wrapped as `printText` does.
class WrappedOutput {
 public:
  WrappedOutput();
  ~WrappedOutput();
  WrappedOutput(const WrappedOutput&) = delete;
  WrappedOutput& operator=(const WrappedOutput&) = delete;

 private:
  class Lines;
  std::unique_ptr<Lines> _lines;  ///< null without a terminal
};

/// Rows of text in columns that fit the terminal. Where it is too narrow, cells are wrapped, and at
/// last each row is shown as one "title: cell" below the other.
class Table {
 public:
  enum class Align { Left, Right };
  struct Column {
    std::string title;
    Align align = Align::Left;
  };

  explicit Table(std::vector<Column> columns) : _columns(std::move(columns)) {}

  /// As many cells as columns; untrusted bytes are made printable.
  void addRow(std::vector<std::string> cells);
  bool empty() const { return _rows.empty(); }

  /// Titles are left out when all are empty.
  void print(std::size_t indentation = 0) const;
  /// The rows, or what it means that there are none.
  void printOr(std::string_view whenEmpty) const;

 private:
  std::vector<Column> _columns;
  std::vector<std::vector<std::string>> _rows;
};

/// "1,234,567"
std::string groupedDigits(std::uint64_t number);

/// "1,234 bytes", "12 KiB", "3.4 MiB"
std::string sizeText(std::uint64_t bytes);

}  // namespace vesprun
