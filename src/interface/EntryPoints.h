#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

#include "platform/host/documents/JsonForm.h"
#include "vesprun/PropertyValue.h"

namespace vesprun {

/// An argument of an entry point: a flag, or a number from 0 on.
struct EntryPointParameter {
  const char* name;
  const char* help;
  std::uint64_t most = 1;    ///< 1: a flag
  std::uint64_t absent = 0;  ///< its value when it is not given
  bool isNeeded = false;

  bool isFlag() const { return most == 1; }
};

/// One entry point for other programs, under its own name and that of its command.
struct EntryPointRow {
  const char* command;
  const char* function;
  const char* help;
  /// Takes one value for each parameter. Nothing when the entry point answers nothing.
  std::optional<PropertyValue> (*call)(std::span<const std::uint64_t> values);
  std::span<const EntryPointParameter> parameters{};
};

std::span<const EntryPointRow> entryPoints();

/// The result of the call, or null, and the first error text of the process:
/// {"result":VALUE,"error":TEXT}. Throws `std::bad_alloc`.
Json callToJson(const EntryPointRow& entryPoint, std::span<const std::uint64_t> values);

/// The same for an entry point by either name and a JSON object of its arguments. Nothing, with a
/// text in `error`, for an unknown entry point or argument.
std::optional<std::string> callByName(std::string_view name, std::string_view arguments,
                                      std::string& error);

}  // namespace vesprun
