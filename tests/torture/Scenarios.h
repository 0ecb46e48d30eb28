#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "Device.h"

namespace vesprun::torture {

/// One thing that goes wrong. `run` works in the folder it is given and answers what broke.
struct Case {
  std::string name;
  std::function<std::vector<std::string>(const std::filesystem::path& folder)> run;
  std::string kind{};  ///< cases of one kind are much the same
};

struct Scenario {
  std::string name;
  /// Builds the cases; devices that they share lie in `folder`.
  std::function<std::vector<Case>(const Programs& programs, const std::filesystem::path& folder,
                                  std::uint32_t seed, bool full)>
      cases;
};

/// Of the daily run, and of `vespctl` commands.
std::vector<Scenario> dailyScenarios();
std::vector<Scenario> commandScenarios();

}  // namespace vesprun::torture
