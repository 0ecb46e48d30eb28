#include "support/TemporaryFolder.h"

#include <gtest/gtest.h>
#include <stdlib.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>

namespace vesprun {

namespace fs = std::filesystem;

TemporaryFolder::TemporaryFolder()
    : _path((fs::temp_directory_path() / "vesprun-test-XXXXXX").string()) {
  if (mkdtemp(_path.data()) == nullptr) {
    ADD_FAILURE() << "no temporary folder " << _path;
  }
}

TemporaryFolder::~TemporaryFolder() {
  std::error_code ignored;
  fs::remove_all(_path, ignored);
}

void TemporaryFolder::write(std::string_view name, std::string_view content) const {
  const fs::path file = path(name);
  fs::create_directories(file.parent_path());
  std::ofstream stream(file, std::ios::binary);
  stream << content;
  EXPECT_TRUE(stream.flush().good()) << file;
}

std::string TemporaryFolder::read(std::string_view name) const {
  std::ifstream stream(path(name), std::ios::binary);
  EXPECT_TRUE(stream.good()) << path(name);
  return {std::istreambuf_iterator<char>(stream), {}};
}

std::vector<std::string> TemporaryFolder::names(std::string_view folder) const {
  std::vector<std::string> found;
  std::error_code missing;
  for (const fs::directory_entry& entry : fs::directory_iterator(path(folder), missing)) {
    found.push_back(entry.path().filename().string());
  }
  std::sort(found.begin(), found.end());
  return found;
}

}  // namespace vesprun
