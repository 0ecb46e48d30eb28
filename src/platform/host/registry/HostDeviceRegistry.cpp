#include "platform/host/registry/HostDeviceRegistry.h"

namespace vesprun {

HostDeviceRegistry::HostDeviceRegistry(const std::vector<RegistryEntryDescription>& entries,
                                       const DeviceDirectory& directory, SystemLog& log)
    : _directory(directory), _log(log) {
  _root.className = "DevRegRegistryRoot";
  _root.matching = false;
  _nodes.push_back({&_root, 0, 0});
  layOut(entries, 0);
}

void HostDeviceRegistry::layOut(const std::vector<RegistryEntryDescription>& entries,
                                std::size_t parent) {
  for (const RegistryEntryDescription& entry : entries) {
    const std::size_t node = _nodes.size();
    _nodes.push_back({&entry, parent, 0});
    layOut(entry.children, node);
  }
  _nodes[parent].end = _nodes.size();
}

RegistryHandle HostDeviceRegistry::handOut(std::size_t node) {
  _entries.emplace(++_lastHandle, node);
  return _lastHandle;
}

const HostDeviceRegistry::Node* HostDeviceRegistry::nodeOf(RegistryHandle entry) const {
  const auto found = _entries.find(entry);
  return found != _entries.end() ? &_nodes[found->second] : nullptr;
}

RegistryHandle HostDeviceRegistry::DevRegServiceGetMatchingService(const std::string& className) {
  for (std::size_t node = 0; node < _nodes.size(); ++node) {
    const RegistryEntryDescription& entry = *_nodes[node].description;
    if (entry.matching && conformsTo(entry, className)) {
      return handOut(node);
    }
  }
  return 0;
}

RegistryHandle HostDeviceRegistry::DevRegRegistryGetRootEntry() { return handOut(0); }

RegistryHandle HostDeviceRegistry::DevRegRegistryEntryCreateIterator(RegistryHandle entry) {
  const Node* node = nodeOf(entry);
  if (node == nullptr) {
    return 0;
  }
  const auto place = static_cast<std::size_t>(node - _nodes.data());
  _iterators.emplace(++_lastHandle, Iterator{place + 1, node->end});
  return _lastHandle;
}

RegistryHandle HostDeviceRegistry::DevRegIteratorNext(RegistryHandle iterator) {
  const auto range = _iterators.find(iterator);
  return range != _iterators.end() && range->second.next < range->second.end
             ? handOut(range->second.next++)
             : 0;
}

bool HostDeviceRegistry::DevRegObjectConformsTo(RegistryHandle object,
                                                const std::string& className) {
  const Node* node = nodeOf(object);
  return node != nullptr && conformsTo(*node->description, className);
}

void HostDeviceRegistry::DevRegObjectRelease(RegistryHandle object) {
  if (object != 0 && _entries.erase(object) + _iterators.erase(object) == 0) {
    ++_falseReleases;
  }
}

std::optional<PropertyValue> HostDeviceRegistry::DevRegRegistryEntrySearchProperty(
    RegistryHandle entry, const std::string& key, SearchDirection direction) {
  const Node* node = nodeOf(entry);
  if (node == nullptr) {
    return std::nullopt;
  }
  for (std::size_t place = static_cast<std::size_t>(node - _nodes.data());;) {
    if (const PropertyValue* property = _nodes[place].description->properties.find(key)) {
      return *property;
    }
    if (direction == SearchDirection::Parents) {
      if (place == 0) {
        return std::nullopt;
      }
      place = _nodes[place].parent;
    } else if (++place == node->end) {
      return std::nullopt;
    }
  }
}

RegistryResult HostDeviceRegistry::DevRegServiceOpen(RegistryHandle service,
                                                     RegistryHandle& connection) {
  connection = 0;
  const Node* node = nodeOf(service);
  if (node == nullptr || !node->description->userClient) {
    return SimulatedDriver::kBadArgument;
  }
  if (const RegistryResult error = node->description->userClient->openError) {
    return error;
  }
  connection = ++_lastHandle;
  _connections.emplace(connection, SimulatedDriver(*node->description, _directory, _log));
  return kRegistrySuccess;
}

RegistryResult HostDeviceRegistry::DevRegServiceClose(RegistryHandle connection) {
  const auto open = _connections.find(connection);
  if (open == _connections.end()) {
    _falseReleases += connection != 0 ? 1 : 0;
    return SimulatedDriver::kBadArgument;
  }
  const RegistryResult error = open->second.closeError();
  _connections.erase(open);
  return error;
}

RegistryResult HostDeviceRegistry::DevRegConnectCallStructMethod(
    RegistryHandle connection, std::uint32_t method, std::span<const std::uint8_t> input,
    std::span<std::uint8_t> output, std::uint64_t& outputLength) {
  const auto open = _connections.find(connection);
  return open != _connections.end()
             ? open->second.callStructMethod(method, input, output, outputLength)
             : SimulatedDriver::kBadArgument;
}

RegistryResult HostDeviceRegistry::DevRegConnectCallScalarMethod(RegistryHandle connection,
                                                                 std::uint32_t method,
                                                                 std::uint64_t input,
                                                                 std::uint64_t& output) {
  const auto open = _connections.find(connection);
  return open != _connections.end() ? open->second.callScalarMethod(method, input, output)
                                    : SimulatedDriver::kBadArgument;
}

}  // namespace vesprun
