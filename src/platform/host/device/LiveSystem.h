#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/host/device/DeviceDescription.h"

/// What the running Linux system answers where a device description is silent.
namespace vesprun::live {

std::string osVersion();  ///< as /etc/os-release names it, for example "Debian GNU/Linux 12"

/// The OS's build: BUILD_ID of /etc/os-release, else its VERSION_ID, else the kernel's release.
std::string osBuild();

/// The record "vm.swapusage": total, free and used bytes (u64), page size and a flag (u32).
std::optional<Bytes> swapUsage();

/// The boot identifier in upper case.
std::optional<std::string> bootSessionIdentifier();

std::string machineIdentifier();  ///< of this installation; empty when it has none
std::string hardwareModel();      ///< the machine's architecture, for example "x86_64"
std::string newIdentifier();      ///< a random UUID in upper case; empty without a source of them

/// The file system that a path lies on; nothing when it cannot be measured.
std::optional<FileSystemStatistics> volume(const std::string& path);

/// Applications by their desktop entries: those of the system and those of the user's home.
std::vector<ApplicationDescription> applications();

/// The languages of the process's locale settings, the most wanted first, as tags such as "en-GB".
std::vector<std::string> preferredLanguages();

/// The languages that the system has locales for.
std::vector<std::string> localizations();

/// The country of the process's locale.
std::optional<std::string> countryCode();

}  // namespace vesprun::live
