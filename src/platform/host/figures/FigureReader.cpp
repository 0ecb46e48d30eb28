#include "platform/host/figures/FigureReader.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <memory>
#include <optional>

#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxFileSize = 256 * 1024;
constexpr std::size_t kMaxDevices = 512;
constexpr std::size_t kMaxNameLength = 40;
constexpr std::size_t kAddressDigits = 12;
constexpr std::string_view kClockFile = "clock";

/// Takes the first word off a line.
std::string_view nextWord(std::string_view& line) {
  line.remove_prefix(std::min(line.find_first_not_of(" \t"), line.size()));
  const std::string_view word = line.substr(0, line.find_first_of(" \t"));
  line.remove_prefix(word.size());
  return word;
}

/// Takes the first line off a text.
std::string_view nextLine(std::string_view& text) {
  const std::string_view line = text.substr(0, text.find('\n'));
  text.remove_prefix(std::min(line.size() + 1, text.size()));
  return line;
}

/// The word of a text that a field names; empty if the text lacks it.
std::string_view fieldOf(std::string_view text, std::string_view field) {
  const std::size_t space = field.rfind(' ');
  const std::string_view label = space == std::string_view::npos ? "" : field.substr(0, space);
  const std::string_view selector = field.substr(space + 1);
  std::string_view line = nextLine(text);
  while (!label.empty() && nextWord(line) != label) {
    if (text.empty()) {
      return {};
    }
    line = nextLine(text);
  }
  int position = 0;
  const bool isPosition =
      std::from_chars(selector.begin(), selector.end(), position).ec == std::errc();
  for (std::string_view word = nextWord(line); !word.empty(); word = nextWord(line)) {
    if (isPosition ? --position == 0 : word.starts_with(selector)) {
      return isPosition ? word : word.substr(selector.size());
    }
  }
  return {};
}

/// Reads a decimal number, without its fraction, or a hexadecimal one after "0x".
std::optional<std::int64_t> numberOf(std::string_view word) {
  const bool isHexadecimal = word.starts_with("0x");
  const std::string_view digits = word.substr(isHexadecimal ? 2 : 0);
  std::int64_t number = 0;
  const auto [end, error] =
      std::from_chars(digits.begin(), digits.end(), number, isHexadecimal ? 16 : 10);
  const bool hasFraction =
      !isHexadecimal && end != digits.end() && *end == '.' &&
      std::all_of(end + 1, digits.end(), [](char c) { return '0' <= c && c <= '9'; });
  if (error != std::errc() || (end != digits.end() && !hasFraction)) {
    return std::nullopt;
  }
  return number;
}

/// A device's name as a part of a key: short, without a hardware address, and of safe characters.
std::string nameInKey(std::string_view name) {
  static constexpr std::string_view kSafe =
      "0123456789abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ-_";
  static constexpr std::string_view kHexDigits = kSafe.substr(0, 16);
  if (name.size() > kAddressDigits &&
      name.substr(name.size() - kAddressDigits).find_first_not_of(kHexDigits) == name.npos) {
    name.remove_suffix(kAddressDigits);
  }
  std::string text(name.substr(0, kMaxNameLength));
  std::ranges::replace_if(
      text, [](char c) { return kSafe.find(c) == kSafe.npos; }, '_');
  return text;
}

class FigureReader {
 public:
  FigureReader(const std::string& root, FigureReadings& readings)
      : _root(root), _readings(readings) {}

  /// Reads the figures of one file.
  void read(std::span<const LinuxFigure> figures) {
    _figures = figures;
    _isListed = true;
    const std::string_view file = figures.front().file;
    expand("", file, {});
    if (_isListed && file.find('<') != std::string_view::npos) {
      _readings.listed.insert(file);
    }
  }

  std::string boot(std::string_view file) {
    return std::string(fieldOf(text(std::string(file)).value_or(std::string_view()), "1")
                           .substr(0, kMaxNameLength));
  }

 private:
  struct Device {
    bool isThere = false;
    std::string name;
    std::int64_t identity = 0;
  };

  /// Reads the files that `path` and `pattern` make together, with every device that is there in
  /// place of the pattern's device classes.
  void expand(const std::string& path, std::string_view pattern, const Device& device) {
    const std::size_t start = pattern.find('<');
    std::string folder = path + std::string(pattern.substr(0, start));
    if (start == std::string_view::npos) {
      readFile(folder, device);
      return;
    }
    const std::size_t end = pattern.find('>', start) + 1;
    const DeviceClass& deviceClass = *std::ranges::find(
        linuxDeviceClasses, pattern.substr(start, end - start), &DeviceClass::name);
    const std::optional<std::vector<std::string>>& names = devicesIn(folder, deviceClass);
    if (!names) {
      _isListed = false;
      return;
    }
    for (const std::string& name : *names) {
      Device inner = device;
      inner.isThere = true;
      if (!deviceClass.namedBy.empty()) {
        inner.name = nameInKey(nameOf(folder + name, name, deviceClass));
      }
      if (!deviceClass.identity.empty()) {
        const auto identity = text(folder + name + '/' + std::string(deviceClass.identity));
        inner.identity = identity ? numberOf(fieldOf(*identity, "1")).value_or(0) : 0;
      }
      expand(folder + name, pattern.substr(end), inner);
    }
  }

  std::string nameOf(const std::string& path, const std::string& name,
                     const DeviceClass& deviceClass) {
    if (deviceClass.namedBy == ".") {
      return name;
    }
    auto content = text(path + '/' + std::string(deviceClass.namedBy)).value_or(std::string_view());
    const std::string_view line = nextLine(content);
    return line.empty() ? name : std::string(line);
  }

  void readFile(const std::string& path, const Device& device) {
    const std::optional<std::string_view> content = text(path);
    for (const LinuxFigure& figure : _figures) {
      std::optional<std::int64_t> value;
      if (content && !figure.unlessZero.empty() &&
          numberOf(fieldOf(*content, figure.unlessZero)) == 0) {
        continue;
      }
      if (content) {
        const std::string_view word = fieldOf(*content, figure.field);
        value = numberOf(word);
        if (!value || *value < figure.lowest * figure.divisor ||
            *value / figure.divisor > figure.highest) {
          complain(path, std::string(figure.field) + (word.empty() ? " is missing"
                                                      : value      ? " is out of range"
                                                                   : " is not a number"));
          value.reset();
        }
      }
      if (value || (device.isThere && figure.kind == FigureKind::Counter)) {
        add(figure, path, device, value ? *value / figure.divisor : kUnread);
      }
    }
  }

  void add(const LinuxFigure& figure, const std::string& path, const Device& device,
           std::int64_t value) {
    std::string key(figure.key);
    if (key.ends_with('.')) {
      key += device.name;
    }
    _readings.figures.push_back(
        {&figure, path + ' ' + std::string(figure.field), std::move(key), device.identity, value});
  }

  /// The content of a file, valid until the next call; nothing when it cannot be used.
  std::optional<std::string_view> text(const std::string& path) {
    if (path == kClockFile) {
      return clockText();
    }
    // Without O_NONBLOCK, opening a pipe would wait for a writer.
    const FileDescriptor file(
        open((_root + path).c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    struct stat status {};
    if (!file.isOpen() || fstat(file.get(), &status) != 0) {
      return failed(path);
    }
    if (!S_ISREG(status.st_mode)) {
      return complain(path, "not a regular file");
    }
    std::size_t size = 0;
    ssize_t count = 0;
    do {
      count = ::read(file.get(), _buffer.get() + size, kMaxFileSize + 1 - size);
      size += count > 0 ? static_cast<std::size_t>(count) : 0;
    } while ((count > 0 && size <= kMaxFileSize) || (count < 0 && errno == EINTR));
    if (count < 0) {
      return failed(path);
    }
    if (size > kMaxFileSize) {
      return complain(path, "longer than 256 KiB");
    }
    const std::string_view content(_buffer.get(), size);
    if (size == 0 || !std::ranges::all_of(content, [](char c) {
          return (' ' <= c && c <= '~') || c == '\n' || c == '\t';
        })) {
      return complain(path, size == 0 ? "empty" : "not plain text");
    }
    return content;
  }

  /// The clocks of the running system as a file of /proc might have them.
  std::optional<std::string_view> clockText() {
    timespec awake{};
    timespec all{};
    if (!_root.empty() || clock_gettime(CLOCK_MONOTONIC, &awake) != 0 ||
        clock_gettime(CLOCK_BOOTTIME, &all) != 0) {
      return std::nullopt;
    }
    const int size =
        std::snprintf(_buffer.get(), kMaxFileSize, "awake %lld\nasleep %lld\n",
                      static_cast<long long>(awake.tv_sec),
                      static_cast<long long>(std::max(all.tv_sec - awake.tv_sec, time_t{0})));
    return std::string_view(_buffer.get(), static_cast<std::size_t>(size));
  }

  std::nullopt_t failed(const std::string& path) {
    // Missing, or gone between opening and reading.
    if (errno != ENOENT && errno != ENOTDIR && errno != ENODEV) {
      complain(path, std::strerror(errno));
    }
    return std::nullopt;
  }

  /// The names of the devices of a class in a folder; nothing when not all can be known.
  const std::optional<std::vector<std::string>>& devicesIn(const std::string& folder,
                                                           const DeviceClass& deviceClass) {
    const auto [entry, isNew] = _devices.try_emplace(folder + std::string(deviceClass.name));
    if (isNew) {
      entry->second = listDevices(folder, deviceClass.patterns);
    }
    return entry->second;
  }

  std::optional<std::vector<std::string>> listDevices(const std::string& folder,
                                                      std::string_view patterns) {
    struct Close {
      void operator()(DIR* stream) const { closedir(stream); }
    };
    const std::unique_ptr<DIR, Close> stream(opendir((_root + folder).c_str()));
    if (!stream) {
      return failed(folder);
    }
    std::vector<std::string> names;
    while (const dirent* entry = readdir(stream.get())) {
      if (!matchesPatterns(entry->d_name, patterns)) {
        continue;
      }
      if (names.size() == kMaxDevices) {
        return complain(folder, "more than " + std::to_string(kMaxDevices) + " devices");
      }
      names.emplace_back(entry->d_name);
    }
    std::ranges::sort(names);
    return names;
  }

  std::nullopt_t complain(const std::string& path, const std::string& problem) {
    std::string& problems = _readings.problems[path];
    if (problems.find(problem) == std::string::npos) {
      problems += (problems.empty() ? "" : ", ") + problem;
    }
    return std::nullopt;
  }

  const std::string& _root;
  FigureReadings& _readings;
  std::span<const LinuxFigure> _figures;
  bool _isListed = false;
  std::unique_ptr<char[]> _buffer{
      new char[kMaxFileSize + 1]};  // pages that nothing is read into cost nothing
  std::map<std::string, std::optional<std::vector<std::string>>> _devices;  ///< by folder and class
};

}  // namespace

FigureReadings readFigures(const std::string& root,
                           const std::function<bool(const LinuxFigure&)>& wanted) {
  FigureReadings readings;
  FigureReader reader(root, readings);
  for (std::span<const LinuxFigure> rest = linuxFigures; !rest.empty();) {
    const LinuxFigure& first = rest.front();
    const auto isOfOther = [&](const LinuxFigure& figure) { return figure.file != first.file; };
    const auto figures =
        rest.first(static_cast<std::size_t>(std::ranges::find_if(rest, isOfOther) - rest.begin()));
    rest = rest.subspan(figures.size());
    if (first.kind == FigureKind::Boots) {
      readings.boot = reader.boot(first.file);
    } else if (wanted(first)) {
      reader.read(figures);
    }
  }
  return readings;
}

std::map<std::string, std::int64_t> mergedFigures(
    const std::function<bool(const LinuxFigure&)>& wanted) {
  std::map<std::string, std::int64_t> merged;
  for (const FigureReading& reading : readFigures("", wanted).figures) {
    if (reading.value != kUnread) {
      mergeFigure(merged, *reading.figure, reading.key, reading.value);
    }
  }
  return merged;
}

void mergeFigure(std::map<std::string, std::int64_t>& figures, const LinuxFigure& figure,
                 const std::string& key, std::int64_t value) {
  const auto [entry, isNew] = figures.try_emplace(key, value);
  if (!isNew) {
    entry->second =
        figure.kind == FigureKind::Gauge ? std::max(entry->second, value) : entry->second + value;
  }
}

}  // namespace vesprun
