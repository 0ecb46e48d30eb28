#include "page/PageFile.h"

#include <filesystem>
#include <iostream>
#include <system_error>

#include "commandline/Program.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {

void writePage(const std::string& file, const std::string& page) {
  if (file.empty() || file == "-") {
    std::cout << page;
    return;
  }
  std::error_code failure;
  std::filesystem::path path(file);
  if (std::filesystem::exists(path, failure)) {
    if (!std::filesystem::is_regular_file(path, failure)) {
      throw CommandFailure(file + ": not a regular file");
    }
    path = std::filesystem::canonical(path, failure);
  }
  if (failure) {
    throw CommandFailure(file + ": " + failure.message());
  }
  orFail([&](std::string& error) { return replaceFile(path.string(), page, error); });
}

}  // namespace vesprun
