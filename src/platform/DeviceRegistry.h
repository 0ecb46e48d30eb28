#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "vesprun/PropertyValue.h"
#include "vesprun/RegistryHandle.h"

namespace vesprun {

/// The result of a registry operation: 0 is success, anything else the driver's error code.
using RegistryResult = std::uint32_t;

inline constexpr RegistryResult kRegistrySuccess = 0;

/// The device registry: a tree of driver objects, and the user-client connections to them. Each
/// look-up gives a new handle, 0 on failure. The caller returns objects with `DevRegObjectRelease`
/// (or lets `RegistryObject` do it) and connections with `DevRegServiceClose`.
class DeviceRegistry {
 public:
  enum class SearchDirection { Parents, Children };

  virtual ~DeviceRegistry() = default;

  /// The first service that can be matched and conforms to the class.
  virtual RegistryHandle DevRegServiceGetMatchingService(const std::string& className) = 0;

  virtual RegistryHandle DevRegRegistryGetRootEntry() = 0;

  /// An iterator over everything below an entry in the service plane, parents first.
  virtual RegistryHandle DevRegRegistryEntryCreateIterator(RegistryHandle entry) = 0;

  /// The next object of an iterator; 0 at its end.
  virtual RegistryHandle DevRegIteratorNext(RegistryHandle iterator) = 0;

  /// Is the object of the class, or of one derived from it?
  virtual bool DevRegObjectConformsTo(RegistryHandle object, const std::string& className) = 0;

  /// Returns a handle. Nothing happens for 0.
  virtual void DevRegObjectRelease(RegistryHandle object) = 0;

  /// A property of the entry, else of the nearest one above it or the first one below it.
  virtual std::optional<PropertyValue> DevRegRegistryEntrySearchProperty(
      RegistryHandle entry, const std::string& key, SearchDirection direction) = 0;

  /// Opens a user client of type 0 for this process. On failure `connection` is 0.
  virtual RegistryResult DevRegServiceOpen(RegistryHandle service, RegistryHandle& connection) = 0;

  /// Closes a connection, even if the result is an error. 0 is an error.
  virtual RegistryResult DevRegServiceClose(RegistryHandle connection) = 0;

  /// Calls a method with a structure in and one out; either may be empty. On success `outputLength`
  /// is what the driver reports, which may differ from what it wrote, never past `output`.
  virtual RegistryResult DevRegConnectCallStructMethod(RegistryHandle connection,
                                                       std::uint32_t method,
                                                       std::span<const std::uint8_t> input,
                                                       std::span<std::uint8_t> output,
                                                       std::uint64_t& outputLength) = 0;

  /// Calls a method with one scalar in and one out; `output` is untouched on failure.
  virtual RegistryResult DevRegConnectCallScalarMethod(RegistryHandle connection,
                                                       std::uint32_t method, std::uint64_t input,
                                                       std::uint64_t& output) = 0;
};

}  // namespace vesprun
