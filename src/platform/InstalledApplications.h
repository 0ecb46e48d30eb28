#pragma once

#include <functional>
#include <string_view>

namespace vesprun {

enum class BundleType { System, User };

/// The applications installed on the device.
class InstalledApplications {
 public:
  using Visitor = std::function<void(std::string_view bundle, BundleType type)>;

  virtual ~InstalledApplications() = default;

  /// Visits every installed bundle once (the platform's bundle-type code 1).
  virtual void EnumerateInstalledBundles(const Visitor& visitor) = 0;
};

}  // namespace vesprun
