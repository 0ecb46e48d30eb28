#include "platform/host/device/PrunedLogs.h"

#include <sstream>

#include "platform/host/device/LogNumbers.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {
namespace {

const Number* integer(const PropertyDict& line, std::string_view key) {
  const PropertyValue* value = line.find(key);
  const Number* number = value != nullptr ? value->number() : nullptr;
  return number != nullptr && !number->isFloatingPoint() ? number : nullptr;
}

}  // namespace

std::optional<PrunedLogs> readPrunedLogs(const DeviceDirectory& directory, std::string& error) {
  bool missing = false;
  const auto content = readWholeFile(directory.hostPath(kPrunedLogsFile), error, &missing);
  if (!content && !missing) {
    return std::nullopt;
  }
  PrunedLogs logs;
  std::istringstream lines(content.value_or(""));
  std::string malformed;
  for (std::string line; std::getline(lines, line);) {
    const std::optional<PropertyValue> value = valueFromJsonText(line, malformed);
    if (!value || value->dict() == nullptr) {
      continue;
    }
    const PropertyValue* name = value->dict()->find("name");
    const Number* day = integer(*value->dict(), "day");
    const Number* revision = integer(*value->dict(), "revision");
    if (name != nullptr && name->string() != nullptr && day != nullptr && revision != nullptr) {
      logs.push_back({*name->string(), logNumber(*name->string()).value_or(0), day->asInt32(),
                      revision->asInt64()});
    }
  }
  return logs;
}

}  // namespace vesprun
