#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "interface/CallFailure.h"
#include "platform/host/files/FileDescriptor.h"

namespace vesprun {

/// Counters that go as datagrams to the socket of `vespctl listen`. Lines are collected until they
/// fill one. From any thread. False, with the reason in `failure` and nothing changed, when the
/// socket cannot carry the key or the value, or the datagram before it cannot be sent.
class CounterSocket {
 public:
  static bool isSocket(const std::string& path);

  /// Null, with the reason in `failure`, when nobody listens at `path`.
  static std::unique_ptr<CounterSocket> open(const std::string& path, CallFailure& failure);

  bool setScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToDistribution(std::string_view key, double value, CallFailure& failure);

  /// Sends what is collected. On failure it stays collected.
  bool flush(CallFailure& failure);

 private:
  explicit CounterSocket(std::string path) : _path(std::move(path)) {}

  template <typename T>
  bool append(std::string_view key, T value, char type, CallFailure& failure);
  bool connect(CallFailure& failure);
  bool sendCollected(CallFailure& failure);
  bool failed(CallFailure& failure) const;

  std::string _path;
  std::mutex _mutex;
  FileDescriptor _socket;
  std::string _lines;  ///< a datagram at most
};

}  // namespace vesprun
