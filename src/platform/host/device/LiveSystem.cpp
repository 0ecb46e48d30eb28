#include "platform/host/device/LiveSystem.h"

#include <sys/statvfs.h>
#include <sys/sysinfo.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cinttypes>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <limits>
#include <set>
#include <sstream>
#include <string_view>
#include <utility>

#include "common/LittleEndian.h"
#include "platform/host/files/Files.h"

namespace vesprun::live {
namespace {

/// The first of these entries (NAME=value or NAME="value") that /etc/os-release has.
std::optional<std::string> osRelease(std::initializer_list<std::string_view> names) {
  for (const std::string_view name : names) {
    std::ifstream stream("/etc/os-release");
    for (std::string line; std::getline(stream, line);) {
      if (line.substr(0, line.find('=')) == name && line.size() > name.size()) {
        const std::string value = line.substr(name.size() + 1);
        const bool isQuoted = value.size() >= 2 && value.front() == '"' && value.back() == '"';
        return isQuoted ? value.substr(1, value.size() - 2) : value;
      }
    }
  }
  return std::nullopt;
}

utsname kernelName() {
  utsname name{};
  uname(&name);
  return name;
}

std::string firstLineOf(const std::string& file) {
  std::ifstream stream(file);
  std::string line;
  std::getline(stream, line);
  return line;
}

std::vector<std::string> namesIn(const std::string& folder) {
  std::string ignored;
  return namesInFolder(folder, ignored).value_or(std::vector<std::string>());
}

/// "en_GB.UTF-8@euro" is {"en", "GB"}; nothing for locales without a language.
struct LocaleName {
  std::string language;
  std::string country;
};

std::optional<LocaleName> parseLocaleName(std::string_view name) {
  name = name.substr(0, name.find_first_of(".@"));
  if (name.empty() || name == "C" || name == "POSIX") {
    return std::nullopt;
  }
  const auto separator = name.find('_');
  return LocaleName{
      std::string(name.substr(0, separator)),
      separator == std::string_view::npos ? "" : std::string(name.substr(separator + 1))};
}

std::string languageTag(const LocaleName& locale) {
  return locale.country.empty() ? locale.language : locale.language + '-' + locale.country;
}

std::optional<LocaleName> processLocale(const char* category) {
  for (const char* variable : {"LC_ALL", category, "LANG"}) {
    const char* value = std::getenv(variable);
    if (value != nullptr && *value != '\0') {
      return parseLocaleName(value);
    }
  }
  return std::nullopt;
}

void appendDesktopEntries(const std::filesystem::path& folder, bool user,
                          std::vector<ApplicationDescription>& applications) {
  for (const std::string& name : namesIn(folder)) {
    const std::filesystem::path file(name);
    if (file.extension() == ".desktop") {
      applications.push_back({file.stem(), user});
    }
  }
}

}  // namespace

std::string osVersion() {
  const utsname system = kernelName();
  return osRelease({"PRETTY_NAME"}).value_or(std::string(system.sysname) + ' ' + system.release);
}

std::string osBuild() {
  return osRelease({"BUILD_ID", "VERSION_ID"}).value_or(kernelName().release);
}

std::optional<KernelVariable> swapUsage() {
  struct sysinfo system {};
  if (sysinfo(&system) != 0) {
    return std::nullopt;
  }
  const std::uint64_t totalBytes = std::uint64_t{system.totalswap} * system.mem_unit;
  const std::uint64_t freeBytes = std::uint64_t{system.freeswap} * system.mem_unit;
  Bytes record;
  appendLittleEndian(record, totalBytes, 8);
  appendLittleEndian(record, freeBytes, 8);
  appendLittleEndian(record, totalBytes - freeBytes, 8);
  appendLittleEndian(record, static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE)), 4);
  appendLittleEndian(record, 0, 4);
  return KernelVariable{std::move(record)};
}

std::optional<KernelVariable> bootSessionIdentifier() {
  std::string identifier = firstLineOf("/proc/sys/kernel/random/boot_id");
  std::ranges::transform(identifier, identifier.begin(),
                         [](unsigned char c) { return static_cast<char>(std::toupper(c)); });
  return identifier.empty() ? std::nullopt : std::optional(KernelVariable::text(identifier));
}

std::string machineIdentifier() { return firstLineOf("/etc/machine-id"); }

std::string hardwareModel() { return kernelName().machine; }

std::string newIdentifier() {
  std::array<std::uint64_t, 2> bits{};
  std::array<char, 37> text{};
  if (getentropy(bits.data(), sizeof(bits)) == 0) {
    std::snprintf(text.data(), text.size(),
                  "%08" PRIX64 "-%04" PRIX64 "-4%03" PRIX64 "-%04" PRIX64 "-%012" PRIX64,
                  bits[0] >> 32, bits[0] >> 16 & 0xFFFF, bits[0] & 0xFFF,
                  0x8000 | (bits[1] >> 48 & 0x3FFF), bits[1] & 0xFFFF'FFFF'FFFF);
  }
  return text.data();
}

std::optional<FileSystemStatistics> volume(const std::string& path) {
  struct statvfs status {};
  if (statvfs(path.c_str(), &status) != 0 ||
      status.f_frsize > std::numeric_limits<std::uint32_t>::max()) {
    return std::nullopt;
  }
  return FileSystemStatistics{static_cast<std::uint32_t>(status.f_frsize), status.f_blocks,
                              status.f_bavail};
}

std::vector<ApplicationDescription> applications() {
  std::vector<ApplicationDescription> applications;
  appendDesktopEntries("/usr/share/applications", false, applications);
  appendDesktopEntries("/usr/local/share/applications", false, applications);
  if (const char* home = std::getenv("HOME")) {
    appendDesktopEntries(std::filesystem::path(home) / ".local/share/applications", true,
                         applications);
  }
  return applications;
}

std::vector<std::string> preferredLanguages() {
  std::vector<std::string> languages;
  if (const char* list = std::getenv("LANGUAGE")) {
    std::istringstream names(list);
    for (std::string name; std::getline(names, name, ':');) {
      if (const auto locale = parseLocaleName(name)) {
        languages.push_back(languageTag(*locale));
      }
    }
  }
  if (languages.empty()) {
    if (const auto locale = processLocale("LC_MESSAGES")) {
      languages.push_back(languageTag(*locale));
    }
  }
  return languages;
}

std::vector<std::string> localizations() {
  std::set<std::string> languages;
  for (const std::string& name : namesIn("/usr/share/locale")) {
    if (const auto locale = parseLocaleName(name)) {
      languages.insert(languageTag(*locale));
    }
  }
  return {languages.begin(), languages.end()};
}

std::optional<std::string> countryCode() {
  const auto locale = processLocale("LC_ADDRESS");
  return locale && !locale->country.empty() ? std::optional(locale->country) : std::nullopt;
}

}  // namespace vesprun::live
