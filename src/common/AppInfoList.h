#pragma once

#include <functional>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The actively used apps in the order of a message's "app_data", each a dictionary: "bundle",
/// "version", "adamID" (64-bit), "arch" (64-bit) and "uuid" (upper case, 8-4-4-4-12). Each is made
/// on demand: all of them can take a hundred times the memory of the message.
///
/// Elements that are not dictionaries are skipped. A field that is missing or of another type, or a
/// "uuid" of other than 16 bytes, is the empty text or 0. A fraction is truncated.
class AppInfoList {
 public:
  /// `appData` must outlive the list; null and other types than arrays have no apps.
  explicit AppInfoList(const PropertyValue* appData)
      : _appData(appData != nullptr ? appData->array() : nullptr) {}

  /// Until `take` returns false.
  void forEach(const std::function<bool(const PropertyDict& app)>& take) const;

 private:
  const PropertyArray* _appData;
};

}  // namespace vesprun
