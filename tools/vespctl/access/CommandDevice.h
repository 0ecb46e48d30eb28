#pragma once

#include <functional>
#include <memory>
#include <string>

#include "access/OwnersRights.h"
#include "commandline/Program.h"
#include "commandline/Results.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/files/Files.h"
#include "vesprun/PropertyValue.h"

namespace vesprun {

/// Adds -C, which names the device directory for all of the functions below.
void addDeviceOption(CLI::App& vespctl);

/// The device directory that the command line names: -C, else VESPRUN_DEVICE, else that of this
/// build.
std::string deviceDirectory();

// A start as root goes on with the rights of the directory's owner once one of these opened it: a
// FILE of the command line is opened before. They throw `CommandFailure` without a device,
// or another user's that may not be changed.

std::unique_ptr<HostPlatform> openDevice();

/// Without changing anything on the device; see `HostPlatform::open`.
std::unique_ptr<HostPlatform> openDeviceReadOnly(SystemLog& log,
                                                 OwnersRights rights = OwnersRights::ForGood);

enum class Access { Reading, Changing };

/// The directory alone, without its description.
DeviceDirectory openDirectory(Access access, OwnersRights rights = OwnersRights::ForGood);

/// Waits until no run is at the daily work, and keeps others from it as long as the result lives.
/// Throws `CommandFailure` when that takes more than minutes.
FileDescriptor takeDailyWork(const DeviceDirectory& directory);

/// A FILE of the command line; "-" is standard input.
FileDescriptor openInput(const std::string& file);

/// The content of a file or pipe.
std::string readInput(const std::string& file);

/// Calls `take` with each line of a file from the byte `begin` on, null for one that is not a JSON
/// object. A missing file has none.
void forEachLine(const HostPath& file, const std::function<void(PropertyDict* line)>& take,
                 std::uint64_t begin = 0);

/// A file's name in messages: "-" is "standard input".
std::string inputName(const std::string& file);

}  // namespace vesprun
