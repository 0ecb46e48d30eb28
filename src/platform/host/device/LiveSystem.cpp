#include "platform/host/device/LiveSystem.h"

#include <sys/statvfs.h>
#include <sys/sysinfo.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <algorithm>
#include <cctype>
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

std::string inUpperCase(std::string text) {
  std::ranges::transform(text, text.begin(),
                         [](unsigned char c) { return static_cast<char>(std::toupper(c)); });
  return text;
}

/// "en_GB" of "en_GB.UTF-8@euro"; empty for locales without a language.
std::string localeName(std::string_view locale) {
  const std::string_view name = locale.substr(0, locale.find_first_of(".@"));
  return std::string(name == "C" || name == "POSIX" ? "" : name);
}

std::string processLocale(const char* category) {
  for (const char* variable : {"LC_ALL", category, "LANG"}) {
    const char* value = std::getenv(variable);
    if (value != nullptr && *value != '\0') {
      return localeName(value);
    }
  }
  return "";
}

/// The part of a locale's name after the language.
std::string countryOf(const std::string& name) {
  const auto separator = name.find('_');
  return separator == std::string::npos ? "" : name.substr(separator + 1);
}

/// "en-GB" for "en_GB".
std::string languageTag(const std::string& name) {
  const std::string country = countryOf(name);
  return name.substr(0, name.find('_')) + (country.empty() ? "" : '-' + country);
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
  const std::string identifier = inUpperCase(firstLineOf("/proc/sys/kernel/random/boot_id"));
  return identifier.empty() ? std::nullopt : std::optional(KernelVariable::text(identifier));
}

std::string machineIdentifier() { return firstLineOf("/etc/machine-id"); }

std::string hardwareModel() { return kernelName().machine; }

std::string newIdentifier() { return inUpperCase(firstLineOf("/proc/sys/kernel/random/uuid")); }

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
  const auto add = [&languages](const std::string& name) {
    if (!name.empty()) {
      languages.push_back(languageTag(name));
    }
  };
  if (const char* list = std::getenv("LANGUAGE")) {
    std::istringstream locales(list);
    for (std::string locale; std::getline(locales, locale, ':');) {
      add(localeName(locale));
    }
  }
  if (languages.empty()) {
    add(processLocale("LC_MESSAGES"));
  }
  return languages;
}

std::vector<std::string> localizations() {
  std::set<std::string> languages;
  for (const std::string& locale : namesIn("/usr/share/locale")) {
    if (const std::string name = localeName(locale); !name.empty()) {
      languages.insert(languageTag(name));
    }
  }
  return {languages.begin(), languages.end()};
}

std::optional<std::string> countryCode() {
  const std::string country = countryOf(processLocale("LC_ADDRESS"));
  return country.empty() ? std::nullopt : std::optional(country);
}

}  // namespace vesprun::live
