#include "exchange/FigureRows.h"

#include <array>

#include "commandline/Arguments.h"
#include "common/TextForm.h"

namespace vesprun {
namespace {

/// A comma follows the field.
void appendField(std::string& text, std::string_view field) {
  if (field.find_first_of(",\"\r\n") == std::string_view::npos) {
    text.append(field).append(1, ',');
    return;
  }
  text += '"';
  for (const char byte : field) {
    text.append(byte == '"' ? 2 : 1, byte);
  }
  text += "\",";
}

}  // namespace

FigureRows::FigureRows(const FigureSource& source) {
  appendField(_source, source.device);
  _source += std::to_string(source.day) + ',' + dateOfDay(source.day) + ',' +
             std::to_string(source.revision) + ',';
  appendField(_source, source.build.value_or(""));
  appendField(_source, source.model.value_or(""));
}

void FigureRows::addScalar(std::string_view key, std::int64_t value) {
  addRow("scalar", key, "value", std::to_string(value));
}

void FigureRows::addDistribution(std::string_view key, std::span<const double, 4> statistics,
                                 std::int64_t count) {
  static constexpr std::array<std::string_view, 4> kFields = {"minimum", "maximum", "mean",
                                                              "deviations"};
  for (std::size_t i = 0; i < kFields.size(); ++i) {
    addRow("distribution", key, kFields[i], textForm(Number(statistics[i])));
  }
  addRow("distribution", key, "count", std::to_string(count));
}

void FigureRows::addBucket(std::string_view key, std::string_view label, std::uint64_t count) {
  addRow("histogram", key, label, std::to_string(count));
}

void FigureRows::addRow(std::string_view kind, std::string_view key, std::string_view field,
                        std::string_view value) {
  _text.append(_source).append(kind) += ',';
  appendField(_text, key);
  appendField(_text, field);
  _text.append(value) += '\n';
}

}  // namespace vesprun
