#pragma once

#include <string_view>

namespace vesprun {

/// The platform's crash-report support library, loaded and searched at run time.
class SupportLibrary {
 public:
  virtual ~SupportLibrary() = default;

  /// False when the library cannot be loaded.
  virtual bool load() = 0;

  /// True when the loaded library has the function; `Preferences` does its work.
  virtual bool offers(std::string_view symbol) = 0;
};

}  // namespace vesprun
