#include "driver/NANDInfoScalars.h"

#include <string>
#include <string_view>

#include "NANDInfo/parsers/APIErrorMessage.h"
#include "common/TextForm.h"
#include "platform/Platform.h"

namespace vesprun {
namespace {

constexpr std::string_view kNANDInfoErrorKey = "com.quill.NANDInfo.Error";

}  // namespace

void SetNANDInfoScalars(const PropertyDict& info) {
  if (const PropertyValue* error = info.find(kNANDInfoErrorKey)) {
    const PropertyValue* message = info.find(kNANDInfoErrorMessageKey);
    logMessage(LogLevel::Default, "error reading nand info, error %s with message %s",
               textForm(*error).c_str(),
               message != nullptr ? textForm(*message).c_str() : "(null)");
    return;
  }
  Tallybook& tallybook = platform().tallybook();
  for (const auto& [key, value] : info) {
    if (const Number* number = value.number()) {
      tallybook.TBClientSetValueForScalarKey(key, number->asInt64());
    } else if (const bool* boolean = value.boolean()) {
      tallybook.TBClientSetValueForScalarKey(key, *boolean ? 1 : 0);
    }
  }
}

}  // namespace vesprun
