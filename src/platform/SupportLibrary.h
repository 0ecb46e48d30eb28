#pragma once

#include <string_view>

namespace vesprun {

/// The platform's crash-report support library, loaded and searched at run time.
class SupportLibrary {
 public:
  virtual ~SupportLibrary() = default;

  /// False when the library cannot be loaded.
  virtual bool load() = 0;

  /// True when the loaded library offers the named function. What it does is the same operation
  /// of `Preferences`.
  virtual bool offers(std::string_view symbol) = 0;
};

}  // namespace vesprun
