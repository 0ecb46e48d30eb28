#include "support/TestDevice.h"

#include <filesystem>
#include <sstream>

#include "common/ProcessState.h"
#include "common/TextForm.h"
#include "platform/host/files/Files.h"
#include "support/Documents.h"

namespace vesprun {

namespace {

PropertyDict dictionaryOf(const PropertyValue& value) {
  EXPECT_NE(value.dict(), nullptr) << textForm(value);
  return value.dict() != nullptr ? *value.dict() : PropertyDict();
}

}  // namespace

TestDevice::TestDevice(std::string_view description) {
  write("device.json", description);
  platform();
}

TestDevice::~TestDevice() { endProcess(); }

std::string TestDevice::read(std::string_view devicePath) const {
  std::string error;
  return readWholeFile(path(devicePath), error).value_or("");
}

bool TestDevice::exists(std::string_view devicePath) const {
  return std::filesystem::exists(path(devicePath));
}

void TestDevice::writeWhitelistJson(std::string_view groups) const {
  write("Library/Application Support/Tallybook/Whitelist_Stagebox.ptree",
        ptreeOf(valueOfJson(groups)));
}

HostPlatform& TestDevice::platform() {
  if (!_platform) {
    std::string error;
    _platform = HostPlatform::open(path(), error);
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
  ProcessState::startAfresh();
}

std::vector<PropertyDict> TestDevice::lines(std::string_view file) const {
  std::vector<PropertyDict> lines;
  std::istringstream stream(read("outbox/" + std::string(file)));
  for (std::string line; std::getline(stream, line);) {
    lines.push_back(dictionaryOf(valueOfJson(line)));
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
  for (const std::string& name : names("outbox/logs")) {
    if (name.ends_with(".ptree")) {
      documents.push_back(dictionaryOf(valueOfPtree(read("outbox/logs/" + name))));
    }
  }
  return documents;
}

}  // namespace vesprun
