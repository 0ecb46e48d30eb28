#pragma once

#include "platform/SupportLibrary.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

/// The support library as described. It is simulated: what it offers, `Preferences` does.
class HostSupportLibrary : public SupportLibrary {
 public:
  explicit HostSupportLibrary(const SupportLibraryDescription& description)
      : _description(description) {}

  bool load() override { return _description.available; }
  bool offers(std::string_view symbol) override { return !_description.missing.contains(symbol); }

 private:
  const SupportLibraryDescription& _description;
};

}  // namespace vesprun
