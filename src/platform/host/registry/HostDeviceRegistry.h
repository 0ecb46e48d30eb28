#pragma once

#include <cstdint>
#include <unordered_map>
#include <vector>

#include "platform/DeviceRegistry.h"
#include "platform/host/registry/SimulatedDriver.h"

namespace vesprun {

/// The described registry, with a simulated driver behind each entry that has a user client. An
/// invalid handle finds nothing and fails every call; handles are never reused.
class HostDeviceRegistry : public DeviceRegistry {
 public:
  HostDeviceRegistry(const std::vector<RegistryEntryDescription>& entries,
                     const DeviceDirectory& directory, SystemLog& log);

  RegistryHandle DevRegServiceGetMatchingService(const std::string& className) override;
  RegistryHandle DevRegRegistryGetRootEntry() override;
  RegistryHandle DevRegRegistryEntryCreateIterator(RegistryHandle entry) override;
  RegistryHandle DevRegIteratorNext(RegistryHandle iterator) override;
  bool DevRegObjectConformsTo(RegistryHandle object, const std::string& className) override;
  void DevRegObjectRelease(RegistryHandle object) override;
  std::optional<PropertyValue> DevRegRegistryEntrySearchProperty(
      RegistryHandle entry, const std::string& key, SearchDirection direction) override;
  RegistryResult DevRegServiceOpen(RegistryHandle service, RegistryHandle& connection) override;
  RegistryResult DevRegServiceClose(RegistryHandle connection) override;
  RegistryResult DevRegConnectCallStructMethod(RegistryHandle connection, std::uint32_t method,
                                               std::span<const std::uint8_t> input,
                                               std::span<std::uint8_t> output,
                                               std::uint64_t& outputLength) override;
  RegistryResult DevRegConnectCallScalarMethod(RegistryHandle connection, std::uint32_t method,
                                               std::uint64_t input, std::uint64_t& output) override;

  /// Handles that are out, and returns of handles that were not.
  std::size_t openObjects() const { return _entries.size() + _iterators.size(); }
  std::size_t openConnections() const { return _connections.size(); }
  std::size_t falseReleases() const { return _falseReleases; }

 private:
  /// The entries from `next` up to, but not including, `end`, by place in `_nodes`.
  struct Iterator {
    std::size_t next;
    std::size_t end;
  };

  /// The entries below a node are those after it, up to `end`.
  struct Node {
    const RegistryEntryDescription* description;
    std::size_t parent;
    std::size_t end;
  };

  void layOut(const std::vector<RegistryEntryDescription>& entries, std::size_t parent);
  RegistryHandle handOut(std::size_t node);
  /// Null for any other handle.
  const Node* nodeOf(RegistryHandle entry) const;

  RegistryEntryDescription _root;
  const DeviceDirectory& _directory;
  SystemLog& _log;
  std::vector<Node> _nodes;  ///< the root, then everything below it, parents before children
  std::unordered_map<RegistryHandle, std::size_t> _entries;  ///< places in `_nodes`
  std::unordered_map<RegistryHandle, Iterator> _iterators;
  std::unordered_map<RegistryHandle, SimulatedDriver> _connections;
  RegistryHandle _lastHandle = 0;
  std::size_t _falseReleases = 0;
};

}  // namespace vesprun
