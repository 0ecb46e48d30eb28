#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "Require.h"
#include "platform/host/counters/CounterStore.h"
#include "platform/host/figures/FigureReader.h"

using namespace vesprun;

namespace {

namespace fs = std::filesystem;

/// A system with one device of each class, all of whose files are one.
class OneFileSystem {
 public:
  OneFileSystem() {
    std::string name = (fs::temp_directory_path() / "figures-XXXXXX").string();
    require(mkdtemp(name.data()) != nullptr, "a folder can be made");
    root = name;
    _file = root + "/file";
    write({});
    for (const LinuxFigure& figure : linuxFigures) {
      std::string path = '/' + std::string(figure.file);
      for (const DeviceClass& device : linuxDeviceClasses) {
        const std::size_t place = path.find(device.name);
        if (place == std::string::npos) {
          continue;
        }
        std::string device1(device.patterns.substr(0, device.patterns.find(' ')));
        std::ranges::replace(device1, '#', '1');
        std::ranges::replace(device1, '@', 'a');
        path.replace(place, device.name.size(), device1);
        for (const std::string_view other : {device.namedBy, device.identity}) {
          if (other.size() > 1) {
            link(path.substr(0, place + device1.size()) + '/' + std::string(other));
          }
        }
      }
      link(path);
    }
  }

  void write(std::string_view content) const {
    std::ofstream file(_file, std::ios::binary | std::ios::trunc);
    require(static_cast<bool>((file << content).flush()), "the file can be written");
  }

  std::string root;

 private:
  void link(const std::string& path) const {
    if (!fs::exists(root + path)) {
      fs::create_directories(fs::path(root + path).parent_path());
      fs::create_hard_link(_file, root + path);
    }
  }

  std::string _file;
};

}  // namespace

/// Figures are in their range, under keys that a counter can have; what is left out is named.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static const OneFileSystem system;
  system.write({reinterpret_cast<const char*>(bytes), size});
  const FigureReadings readings =
      readFigures(system.root, [](const LinuxFigure& /*figure*/) { return true; });
  std::string error;
  for (const FigureReading& reading : readings.figures) {
    const bool isUnread = reading.value == kUnread && reading.figure->kind == FigureKind::Counter;
    require(isUnread || (reading.figure->lowest <= reading.value &&
                         reading.value <= reading.figure->highest),
            "a figure is in its range", reading.place.c_str());
    require(isCounterKey(reading.key, error), "a key is one", error.c_str());
    require(!isUnread || !readings.problems.empty(), "what is left out is named");
  }
  return 0;
}
