#include "common/AppInfoList.h"

#include <string>
#include <string_view>

#include "common/HexText.h"

namespace vesprun {
namespace {

std::string appText(const PropertyDict& dict, std::string_view key) {
  const std::string* text = dict.findString(key);
  return text != nullptr ? *text : "";
}

std::string appUUID(const PropertyDict& dict, std::string_view key) {
  constexpr std::size_t kLength = 16;
  const Bytes* bytes = dict.findData(key);
  if (bytes == nullptr || bytes->size() != kLength) {
    return "";
  }
  std::string text;
  for (std::size_t i = 0; i < kLength; ++i) {
    if (i == 4 || i == 6 || i == 8 || i == 10) {
      text += '-';
    }
    appendHex(text, (*bytes)[i], kUpperHexDigits);
  }
  return text;
}

}  // namespace

void AppInfoList::forEach(const std::function<bool(const PropertyDict& app)>& take) const {
  if (_appData == nullptr) {
    return;
  }
  for (const PropertyValue& element : *_appData) {
    if (const PropertyDict* app = element.dict()) {
      PropertyDict info;
      info.reserve(5);
      info.set("bundle", appText(*app, "bundle_id"));
      info.set("version", appText(*app, "version"));
      info.set("adamID", app->integerOr("adam_id", 0));
      info.set("arch", app->integerOr("arch", 0));
      info.set("uuid", appUUID(*app, "uuid"));
      if (!take(info)) {
        return;
      }
    }
  }
}

}  // namespace vesprun
