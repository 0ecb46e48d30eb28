#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "common/PropertyValue.h"
#include "common/RegistryHandle.h"

namespace vesprun {

/// The result of a registry operation: 0 is success, anything else the driver's error code.
using RegistryResult = std::uint32_t;

inline constexpr RegistryResult kRegistrySuccess = 0;

/// The device registry: a tree of driver objects, and the user-client connections to them. Every
/// look-up of an object gives a handle of its own, even when the object was found before. Whoever
/// is given a handle gives it back: objects with `DevRegObjectRelease`, connections with
/// `DevRegServiceClose`. `RegistryObject` does so by itself.
class DeviceRegistry {
 public:
  enum class SearchDirection { Parents, Children };

  virtual ~DeviceRegistry() = default;

  /// The first service of the class, or of one that conforms to it, that can be matched. 0: none.
  virtual RegistryHandle DevRegServiceGetMatchingService(const std::string& className) = 0;

  /// The root of the registry, which stands above every entry. 0 when it cannot be had.
  virtual RegistryHandle DevRegRegistryGetRootEntry() = 0;

  /// An iterator over everything below an entry in the service plane, parents before their
  /// children. 0 when it cannot be made.
  virtual RegistryHandle DevRegRegistryEntryCreateIterator(RegistryHandle entry) = 0;

  /// The next object of an iterator; 0 at its end.
  virtual RegistryHandle DevRegIteratorNext(RegistryHandle iterator) = 0;

  /// Is the object of the class, or of one that conforms to it?
  virtual bool DevRegObjectConformsTo(RegistryHandle object, const std::string& className) = 0;

  /// Gives a handle back. Nothing happens for 0.
  virtual void DevRegObjectRelease(RegistryHandle object) = 0;

  /// A property of the entry itself, else of the nearest one above it or of the first one below it
  /// in the service plane.
  virtual std::optional<PropertyValue> DevRegRegistryEntrySearchProperty(
      RegistryHandle entry, const std::string& key, SearchDirection direction) = 0;

  /// Opens a user client of type 0 for this process. On failure `connection` is 0.
  virtual RegistryResult DevRegServiceOpen(RegistryHandle service, RegistryHandle& connection) = 0;

  /// Closes a connection; it is gone whatever the result. Closing 0 is an error without an effect.
  virtual RegistryResult DevRegServiceClose(RegistryHandle connection) = 0;

  /// Calls a method with a structure in and a structure out (either may be empty). On success
  /// `outputLength` becomes the length that the driver reports, which may differ from the number of
  /// bytes it wrote into `output`; it never writes past its end. Untouched on failure.
  virtual RegistryResult DevRegConnectCallStructMethod(RegistryHandle connection,
                                                       std::uint32_t method,
                                                       std::span<const std::uint8_t> input,
                                                       std::span<std::uint8_t> output,
                                                       std::uint64_t& outputLength) = 0;

  /// Calls a method with one scalar in and one scalar out, which is untouched on failure.
  virtual RegistryResult DevRegConnectCallScalarMethod(RegistryHandle connection,
                                                       std::uint32_t method, std::uint64_t input,
                                                       std::uint64_t& output) = 0;
};

}  // namespace vesprun
