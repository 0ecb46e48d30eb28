#pragma once

#include <string>

#include "platform/host/files/Files.h"

namespace vesprun {

/// The right to change a store. Processes that wait get it one after another: who gives it up and
/// wants it back stands behind those who wait.
///
/// Two locks on bytes of the file that SQLite leaves alone: one waits for the turn holding the
/// first, and takes the second with the turn.
class Turn {
 public:
  /// Throws `StoreFailure`.
  void open(const std::string& path);
  /// Waits for the turn. Throws `StoreFailure`.
  void take();
  void giveUp();

 private:
  std::string _path;
  FileDescriptor _file;
};

}  // namespace vesprun
