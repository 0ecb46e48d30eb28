#include <string>

#include "Require.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/documents/JsonForm.h"

using namespace vesprun;

/// A description is read or refused with a reason; a JSON value is written as it was read.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const std::string text(reinterpret_cast<const char*>(bytes), size);
  std::string error;
  require(readDeviceDescription(text, error) || !error.empty(), "a refusal has a reason");
  if (const auto value = valueFromJsonText(text, error)) {
    const std::string written = jsonText(*value);
    const auto again = valueFromJsonText(written, error);
    require(again.has_value(), "what was written can be read", error.c_str());
    require(jsonText(*again) == written, "it is the same value", written.c_str());
  }
  return 0;
}
