#include "commandline/Results.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iostream>
#include <limits>
#include <numeric>
#include <optional>
#include <streambuf>
#include <utility>

#include "commandline/Program.h"
#include "platform/host/documents/QuotedText.h"

namespace vesprun {
namespace {

constexpr std::size_t kNoEnd = std::numeric_limits<std::size_t>::max();
constexpr std::size_t kGap = 2;  ///< spaces between columns

/// Characters, as far as each takes one column.
std::size_t widthOf(std::string_view text) {
  return static_cast<std::size_t>(
      std::ranges::count_if(text, [](char byte) { return (byte & 0xC0) != 0x80; }));
}

/// The first bytes of a text that take `width` columns at most.
std::size_t bytesOf(std::string_view text, std::size_t width) {
  std::size_t at = 0;
  while (at < text.size() && width > 0) {
    --width;
    for (++at; at < text.size() && (text[at] & 0xC0) == 0x80; ++at) {
    }
  }
  return at;
}

/// Takes the next line off the text: `width` columns at most, parted at spaces where there are any.
/// Nothing is left after the last one.
std::string_view takeLine(std::optional<std::string_view>& text, std::size_t width) {
  const std::string_view rest = text.value_or(std::string_view());
  std::size_t end =
      rest.size() > width ? bytesOf(rest, std::max<std::size_t>(width, 1)) : rest.size();
  if (end == rest.size()) {
    text.reset();
    return rest;
  }
  const std::size_t space = rest[end] == ' ' ? end : rest.rfind(' ', end);
  if (space != std::string_view::npos && rest.find_first_not_of(' ') < space) {
    end = space;
  }
  text = rest.substr(std::min(rest.find_first_not_of(' ', end), rest.size()));
  return rest.substr(0, end);
}

std::string spaces(std::size_t count) { return std::string(count, ' '); }

/// The lines that a line becomes. Those but the first begin with `indentation` more spaces.
std::string wrappedLine(std::string_view text, std::size_t indentation, std::size_t width) {
  const std::size_t own = std::min(text.find_first_not_of(' '), text.size());
  const std::size_t inner = width == kNoEnd ? kNoEnd : width - std::min(width, own + indentation);
  std::string lines;
  std::size_t before = own;
  for (std::optional rest = text.substr(own); rest;) {
    lines.append(before, ' ').append(takeLine(rest, inner)) += '\n';
    before = own + indentation;
  }
  return lines;
}

bool isPair(const Json& json) { return json.is_array() && json.size() == 2 && json[0].is_string(); }

void addRows(Table& table, const std::string& name, const Json& json) {
  const std::string before = name.empty() ? "" : name + " / ";
  if (json.is_object() && !json.empty()) {
    for (const auto& [key, value] : json.items()) {
      addRows(table, before + key, value);
    }
  } else if (json.is_array() && !json.empty() && std::ranges::all_of(json, isPair)) {
    for (const Json& pair : json) {
      addRows(table, before + pair[0].get<std::string>(), pair[1]);
    }
  } else {
    table.addRow({name, json.is_string() ? json.get<std::string>() : jsonText(json)});
  }
}

}  // namespace

void printJson(const Json& json) { std::cout << jsonText(json) << '\n'; }

void printResult(const Json& json, const std::function<void()>& text) {
  if (invocation().json) {
    printJson(json);
  } else {
    text();
  }
}

void printResult(const Json& json) {
  printResult(json, [&json] {
    Table table({{""}, {""}});
    addRows(table, "", json);
    table.print();
  });
}

std::size_t terminalWidth() {
  winsize size{};
  if (isatty(STDOUT_FILENO) == 0 || ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) != 0 ||
      size.ws_col == 0) {
    return kNoEnd;
  }
  return size.ws_col;
}

std::string emphasized(std::string_view text) {
  const char* const noColor = std::getenv("NO_COLOR");
  const bool isPlain = isatty(STDOUT_FILENO) == 0 || (noColor != nullptr && *noColor != '\0');
  return isPlain ? std::string(text) : "\x1b[1m" + std::string(text) + "\x1b[0m";
}

void printText(std::string_view text, std::size_t indentation) {
  std::cout << wrappedLine(printableText(text), indentation, terminalWidth());
}

class WrappedOutput::Lines final : public std::streambuf {
 public:
  Lines() : _below(std::cout.rdbuf(this)) {}
  ~Lines() override {
    if (!_line.empty()) {
      _below->sputn(_line.data(), static_cast<std::streamsize>(_line.size()));
    }
    std::cout.rdbuf(_below);
  }
  Lines(const Lines&) = delete;
  Lines& operator=(const Lines&) = delete;

 protected:
  int_type overflow(int_type byte) override {
    if (byte == traits_type::eof()) {
      return traits_type::not_eof(byte);
    }
    if (byte != '\n') {
      _line += traits_type::to_char_type(byte);
      return byte;
    }
    const std::string text = wrappedLine(std::exchange(_line, {}), 4, terminalWidth());
    const auto size = static_cast<std::streamsize>(text.size());
    return _below->sputn(text.data(), size) == size ? byte : traits_type::eof();
  }
  int sync() override { return _below->pubsync(); }

 private:
  std::streambuf* _below;
  std::string _line;
};

WrappedOutput::WrappedOutput()
    : _lines(terminalWidth() != kNoEnd ? std::make_unique<Lines>() : nullptr) {}

WrappedOutput::~WrappedOutput() = default;

void Table::addRow(std::vector<std::string> cells) {
  for (std::string& cell : cells) {
    cell = printableText(cell);
  }
  _rows.push_back(std::move(cells));
}

void Table::print(std::size_t indentation) const {
  constexpr std::size_t kNarrowest = 8;
  const bool hasTitles =
      std::ranges::any_of(_columns, [](const Column& column) { return !column.title.empty(); });
  std::vector<std::size_t> widths;
  for (std::size_t i = 0; i < _columns.size(); ++i) {
    widths.push_back(widthOf(_columns[i].title));
    for (const auto& row : _rows) {
      widths[i] = std::max(widths[i], widthOf(row[i]));
    }
  }
  const std::size_t room = terminalWidth();
  const auto total = [&] {
    return std::accumulate(widths.begin(), widths.end(), indentation + kGap * (widths.size() - 1));
  };
  while (total() > room) {
    const auto widest = std::ranges::max_element(widths);
    if (*widest <= kNarrowest) {
      break;
    }
    const std::size_t over = total() - room;
    *widest -= std::min(over, *widest - kNarrowest);
  }
  if (total() > room) {  // one below the other
    for (const auto& row : _rows) {
      for (std::size_t i = 0; i < row.size(); ++i) {
        if (!row[i].empty()) {
          const std::string& title = _columns[i].title;
          printText(spaces(i == 0 ? 0 : 2) + (title.empty() ? "" : title + ": ") + row[i], 2);
        }
      }
    }
    return;
  }
  std::vector<std::optional<std::string_view>> cells(_columns.size());
  const auto printRow = [&](const auto& cellOf, bool isTitle) {
    for (std::size_t i = 0; i < cells.size(); ++i) {
      cells[i] = cellOf(i);
    }
    const auto isLeft = [](const auto& cell) { return cell.has_value(); };
    while (std::ranges::any_of(cells, isLeft)) {
      std::string text = spaces(indentation);
      for (std::size_t i = 0; i < cells.size(); ++i) {
        const std::string_view cell = takeLine(cells[i], widths[i]);
        const std::size_t padding = widths[i] - widthOf(cell);
        const bool isRight = _columns[i].align == Align::Right;
        text.append(isRight ? padding : 0, ' ').append(cell);
        text.append((isRight ? 0 : padding) + kGap, ' ');
      }
      text.erase(text.find_last_not_of(' ') + 1);
      std::cout << (isTitle ? emphasized(text) : text) << '\n';
    }
  };
  if (hasTitles) {
    printRow([this](std::size_t i) -> std::string_view { return _columns[i].title; }, true);
  }
  for (const auto& row : _rows) {
    printRow([&row](std::size_t i) -> std::string_view { return row[i]; }, false);
  }
}

void Table::printOr(std::string_view whenEmpty) const {
  if (empty()) {
    printText(whenEmpty);
  } else {
    print();
  }
}

std::string groupedDigits(std::uint64_t number) {
  std::string digits = std::to_string(number);
  for (std::size_t at = digits.size(); at > 3; at -= 3) {
    digits.insert(at - 3, 1, ',');
  }
  return digits;
}

std::string sizeText(std::uint64_t bytes) {
  constexpr std::uint64_t kStep = 1024;
  if (bytes < 10 * kStep) {
    return groupedDigits(bytes) + " bytes";
  }
  constexpr const char* kUnits[] = {" KiB", " MiB", " GiB", " TiB"};
  std::size_t unit = 0;
  std::uint64_t tenths = bytes / (kStep / 2) * 5;
  for (; tenths >= 10 * kStep && unit + 1 < std::size(kUnits); ++unit) {
    tenths /= kStep;
  }
  return groupedDigits(tenths / 10) + (tenths < 1000 ? '.' + std::to_string(tenths % 10) : "") +
         kUnits[unit];
}

}  // namespace vesprun
