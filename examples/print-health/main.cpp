// Prints the health set of the storage in a device directory. With vesprun installed:
//
//   cmake -B build && cmake --build build && build/print-health DIRECTORY
//
// or, without CMake:
//
//   c++ -std=c++20 main.cpp $(pkg-config --cflags --libs vesprun) -o print-health
//
// vesprun in a folder of its own is found with -DCMAKE_PREFIX_PATH=FOLDER, or with the folder of
// its vesprun.pc in PKG_CONFIG_PATH. `vespctl init DIRECTORY --sample` makes a device to try.

#include <iostream>
#include <memory>
#include <string>
#include <vesprun/vesprun.hpp>

int main(int argc, char** argv) {
  if (argc != 2) {
    std::cerr << "usage: print-health DIRECTORY\n";
    return 2;
  }
  std::string error;
  const std::unique_ptr<vesprun::Device> device = vesprun::Device::open(argv[1], error);
  if (!device) {
    std::cerr << "print-health: " << error << '\n';
    return 1;
  }
  const vesprun::PropertyDict health = vesprun::CopyInternalLabNANDInfo();
  for (const auto& [key, value] : health) {
    if (const vesprun::Number* number = value.number()) {
      std::cout << key << ": " << number->asInt64() << '\n';
    } else if (const std::string* text = value.string()) {
      std::cout << key << ": " << *text << '\n';
    }
  }
  return 0;
}
