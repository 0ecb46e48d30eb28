#pragma once

#include <optional>
#include <string>
#include <vector>

#include "platform/host/device/DeviceDescription.h"

/// The running Linux system's answers where a device description is silent.
namespace vesprun::live {

std::string osVersion();  ///< as /etc/os-release names it, for example "Debian GNU/Linux 12"

/// BUILD_ID of /etc/os-release, else its VERSION_ID, else the kernel's release.
std::string osBuild();

/// "vm.swapusage": total, free and used bytes (u64), page size and a flag (u32).
std::optional<KernelVariable> swapUsage();

/// "kern.bootsessionuuid", in upper case.
std::optional<KernelVariable> bootSessionIdentifier();

std::string machineIdentifier();  ///< empty without one
std::string hardwareModel();      ///< the architecture, for example "x86_64"
std::string newIdentifier();      ///< a random UUID in upper case; empty without /proc

/// The file system of a path; nothing when it cannot be measured.
std::optional<FileSystemStatistics> volume(const std::string& path);

/// By the desktop entries of the system and of the user's home.
std::vector<ApplicationDescription> applications();

/// The languages of the locale settings, most wanted first, such as "en-GB".
std::vector<std::string> preferredLanguages();

/// The languages with locales on this system.
std::vector<std::string> localizations();

/// The country of the process's locale.
std::optional<std::string> countryCode();

}  // namespace vesprun::live
