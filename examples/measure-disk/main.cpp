// Measures how long a disk takes to make 4 KiB durable, 100 times. With vesprun installed:
//
//   c++ -std=c++20 main.cpp $(pkg-config --cflags --libs vesprun) -o measure-disk
//   ./measure-disk SOCKET KEY FOLDER
//
// As any user, with the socket /run/vesprun/counters and a KEY that begins with "app.".

#include <fcntl.h>
#include <unistd.h>

#include <array>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <iostream>
#include <memory>
#include <string>
#include <vesprun/vesprun.hpp>

int main(int argc, char** argv) {
  if (argc != 4) {
    std::cerr << "usage: measure-disk SOCKET KEY FOLDER\n";
    return 2;
  }
  const auto fail = [](const std::string& why) {
    std::cerr << "measure-disk: " << why << '\n';
    return 1;
  };
  std::string error;
  const std::unique_ptr<vesprun::Device> counters = vesprun::Device::open(argv[1], error);
  if (!counters) {
    return fail(error);
  }
  const int file = open(argv[3], O_TMPFILE | O_WRONLY | O_CLOEXEC, 0600);
  if (file < 0) {
    return fail(std::string(argv[3]) + ": " + std::strerror(errno));
  }
  const std::array<char, 4096> block{};
  for (int i = 0; i < 100; ++i) {
    const auto begin = std::chrono::steady_clock::now();
    if (pwrite(file, block.data(), block.size(), 0) < 0 || fdatasync(file) != 0) {
      return fail(std::string(argv[3]) + ": " + std::strerror(errno));
    }
    const std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - begin;
    if (!counters->addToDistribution(argv[2], took.count(), error)) {
      return fail(error);
    }
  }
  return counters->checkpoint(error) ? 0 : fail(error);
}
