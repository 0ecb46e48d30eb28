#pragma once

#include <functional>

#include "common/PropertyDict.h"

namespace vesprun {

/// The actively used apps, in the order of a message's "app_data". For each a dictionary: "bundle",
/// "version", "adamID" (64-bit), "arch" (64-bit) and "uuid" (upper case, 8-4-4-4-12). It is made
/// when it is asked for, since a message of small elements would grow a hundredfold.
///
/// An element that is not a dictionary is skipped. A field that is missing or of another type, and
/// a "uuid" of other than 16 bytes, becomes the empty text, or 0. As everywhere in a message, a
/// fraction counts as the integer that it truncates to.
class AppInfoList {
 public:
  /// `appData`, which must outlive the list, may be null or of another type than array: no apps.
  explicit AppInfoList(const PropertyValue* appData)
      : _appData(appData != nullptr ? appData->array() : nullptr) {}

  void forEach(const std::function<void(PropertyDict app)>& visit) const;

  PropertyArray array() const;

 private:
  const PropertyArray* _appData;
};

}  // namespace vesprun
