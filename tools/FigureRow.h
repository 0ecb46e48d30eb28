#pragma once

#include <string>
#include <string_view>

namespace vesprun {

/// The columns of CSV that tells what devices reported: a row for each figure.
inline constexpr std::string_view kFigureColumns =
    "device,day,date,revision,build,model,kind,key,field,value";

/// Appends a field of CSV as RFC 4180 has it; a comma stands behind it.
inline void appendCsvField(std::string& row, std::string_view field) {
  if (field.find_first_of(",\"\r\n") == std::string_view::npos) {
    row.append(field).append(1, ',');
    return;
  }
  row += '"';
  for (const char byte : field) {
    row.append(byte == '"' ? 2 : 1, byte);
  }
  row += "\",";
}

}  // namespace vesprun
