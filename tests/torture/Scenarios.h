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
  std::function<Faults(const std::filesystem::path& folder)> run;
  std::string kind{};  ///< cases of one kind are much the same
};

struct Choice {
  std::uint32_t seed = 1;
  bool full = false;  ///< each call in every way it can go wrong, not one that the seed chooses
};

struct CaseList {
  std::string title;
  /// Builds the cases; devices that they share lie in `folder`.
  std::function<std::vector<Case>(const std::filesystem::path& folder, const Choice& choice)> cases;
};

std::vector<CaseList> caseLists();

}  // namespace vesprun::torture
