#include "support/TestDevice.h"

#include <stdlib.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "common/TextForm.h"
#include "config/InternalDevice.h"
#include "platform/host/JsonForm.h"
#include "platform/host/PtreeReader.h"
#include "platform/host/PtreeWriter.h"
#include "platform/host/WholeFile.h"
#include "report/SupportLibraryFunctions.h"

namespace vesprun {

TestDevice::TestDevice(std::string_view description) {
  std::string pattern = std::filesystem::temp_directory_path() / "vesprun-test-XXXXXX";
  EXPECT_NE(mkdtemp(pattern.data()), nullptr);
  _path = pattern;
  write("device.json", description);
}

TestDevice::~TestDevice() {
  endProcess();
  std::error_code ignored;
  std::filesystem::permissions(_path, std::filesystem::perms::owner_all, ignored);
  std::filesystem::remove_all(_path, ignored);
}

std::string TestDevice::path(std::string_view devicePath) const {
  return _path + '/' + std::string(devicePath);
}

void TestDevice::write(std::string_view devicePath, std::string_view content) const {
  std::filesystem::create_directories(std::filesystem::path(path(devicePath)).parent_path());
  std::ofstream(path(devicePath), std::ios::binary) << content;
}

std::string TestDevice::read(std::string_view devicePath) const {
  std::string error;
  return readWholeFile(path(devicePath), error).value_or("");
}

bool TestDevice::exists(std::string_view devicePath) const {
  return std::filesystem::exists(path(devicePath));
}

std::vector<std::string> TestDevice::list(std::string_view devicePath) const {
  std::vector<std::string> names;
  std::error_code error;
  for (const auto& entry : std::filesystem::directory_iterator(path(devicePath), error)) {
    names.push_back(entry.path().filename());
  }
  std::sort(names.begin(), names.end());
  return names;
}

void TestDevice::writeWhitelist(std::string_view groups) const {
  write("Library/Application Support/Tallybook/Whitelist_Stagebox.ptree",
        "<ptree version=\"1.0\"><dict>" + std::string(groups) + "</dict></ptree>");
}

void TestDevice::writeWhitelistJson(std::string_view groups) const {
  std::string error;
  std::string document;
  const std::optional<PropertyValue> root = valueFromJsonText(std::string(groups), error);
  EXPECT_TRUE(root && writePtree(*root->dict(), document, error)) << error;
  write("Library/Application Support/Tallybook/Whitelist_Stagebox.ptree", document);
}

HostPlatform& TestDevice::platform() {
  if (!_platform) {
    std::string error;
    _platform = HostPlatform::open(_path, error);
    if (!_platform) {
      throw std::runtime_error(error);
    }
    _installed = std::make_unique<InstalledPlatform>(*_platform);
  }
  return *_platform;
}

void TestDevice::endProcess() {
  _installed.reset();
  _platform.reset();
  forgetInternalDeviceAnswer();
  forgetSupportLibraryFunctions();
}

std::vector<PropertyDict> TestDevice::lines(std::string_view file) const {
  std::vector<PropertyDict> lines;
  std::istringstream stream(read("outbox/" + std::string(file)));
  for (std::string line; std::getline(stream, line);) {
    std::string error;
    const std::optional<PropertyValue> value = valueFromJsonText(line, error);
    EXPECT_TRUE(value && value->dict() != nullptr) << line << ": " << error;
    lines.push_back(value && value->dict() != nullptr ? *value->dict() : PropertyDict());
  }
  return lines;
}

std::vector<std::string> TestDevice::log() const {
  std::vector<std::string> messages;
  for (const PropertyDict& line : lines("log.jsonl")) {
    messages.push_back(textForm(*line.find("level")) + ": " + textForm(*line.find("message")));
  }
  return messages;
}

std::vector<PropertyDict> TestDevice::documents() const {
  std::vector<PropertyDict> documents;
  for (const std::string& name : list("outbox/logs")) {
    if (name.ends_with(".ptree")) {
      std::string error;
      const std::optional<PropertyValue> value = readPtree(read("outbox/logs/" + name), error);
      EXPECT_TRUE(value && value->dict() != nullptr) << name << ": " << error;
      documents.push_back(value && value->dict() != nullptr ? *value->dict() : PropertyDict());
    }
  }
  return documents;
}

}  // namespace vesprun
