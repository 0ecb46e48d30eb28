#pragma once

#include <string>
#include <vector>

#include "platform/host/HostPlatform.h"
#include "platform/host/registry/HostDeviceRegistry.h"

namespace vesprun {

/// Sits between the program and a device's registry as long as it lives, notes every call that can
/// fail, and makes one of them fail.
class WatchedRegistry : public DeviceRegistry {
 public:
  struct Call {
    std::string operation;
    std::uint32_t method;   ///< of a call to a driver
    Bytes input;            ///< the structure that went into it
    RegistryHandle handle;  ///< what it was called for
  };

  static constexpr RegistryResult kFailure = 0xE00002D8;

  explicit WatchedRegistry(HostPlatform& device)
      : _device(device), _registry(device.describedRegistry()) {
    _device.deviceRegistry = *this;
  }
  ~WatchedRegistry() override { _device.deviceRegistry = _registry; }

  /// The call to fail, counted from 1; 0: none. Calls are counted anew.
  void failCall(std::size_t number) {
    _failing = number;
    _calls.clear();
  }
  const std::vector<Call>& calls() const { return _calls; }
  std::vector<std::string> operations() const {
    std::vector<std::string> operations;
    for (const Call& call : _calls) {
      operations.push_back(call.operation);
    }
    return operations;
  }

  RegistryHandle DevRegServiceGetMatchingService(const std::string& className) override {
    return fails("match " + className) ? 0 : _registry.DevRegServiceGetMatchingService(className);
  }
  RegistryHandle DevRegRegistryGetRootEntry() override {
    return fails("root") ? 0 : _registry.DevRegRegistryGetRootEntry();
  }
  RegistryHandle DevRegRegistryEntryCreateIterator(RegistryHandle entry) override {
    return fails("iterate", entry) ? 0 : _registry.DevRegRegistryEntryCreateIterator(entry);
  }
  RegistryHandle DevRegIteratorNext(RegistryHandle iterator) override {
    return fails("next", iterator) ? 0 : _registry.DevRegIteratorNext(iterator);
  }
  bool DevRegObjectConformsTo(RegistryHandle object, const std::string& className) override {
    return !fails("conforms", object) && _registry.DevRegObjectConformsTo(object, className);
  }
  void DevRegObjectRelease(RegistryHandle object) override {
    _registry.DevRegObjectRelease(object);
  }
  std::optional<PropertyValue> DevRegRegistryEntrySearchProperty(
      RegistryHandle entry, const std::string& key, SearchDirection direction) override {
    return fails("search " + key, entry)
               ? std::nullopt
               : _registry.DevRegRegistryEntrySearchProperty(entry, key, direction);
  }
  RegistryResult DevRegServiceOpen(RegistryHandle service, RegistryHandle& connection) override {
    connection = 0;
    return fails("open", service) ? kFailure : _registry.DevRegServiceOpen(service, connection);
  }
  RegistryResult DevRegServiceClose(RegistryHandle connection) override {
    const RegistryResult result = _registry.DevRegServiceClose(connection);
    return fails("close", connection) ? kFailure : result;
  }
  RegistryResult DevRegConnectCallStructMethod(RegistryHandle connection, std::uint32_t method,
                                               std::span<const std::uint8_t> input,
                                               std::span<std::uint8_t> output,
                                               std::uint64_t& outputLength) override {
    return fails("struct", connection, method, input)
               ? kFailure
               : _registry.DevRegConnectCallStructMethod(connection, method, input, output,
                                                         outputLength);
  }
  RegistryResult DevRegConnectCallScalarMethod(RegistryHandle connection, std::uint32_t method,
                                               std::uint64_t input,
                                               std::uint64_t& output) override {
    return fails("scalar", connection, method)
               ? kFailure
               : _registry.DevRegConnectCallScalarMethod(connection, method, input, output);
  }

 private:
  /// Notes the call; true when it is the one to fail.
  bool fails(std::string operation, RegistryHandle handle = 0, std::uint32_t method = 0,
             std::span<const std::uint8_t> input = {}) {
    _calls.push_back({std::move(operation), method, Bytes(input.begin(), input.end()), handle});
    return _calls.size() == _failing;
  }

  HostPlatform& _device;
  DeviceRegistry& _registry;
  std::vector<Call> _calls;
  std::size_t _failing = 0;
};

}  // namespace vesprun
