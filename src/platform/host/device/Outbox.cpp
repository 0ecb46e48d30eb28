#include "platform/host/device/Outbox.h"

#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <cstdio>
#include <optional>
#include <vector>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/FolderNames.h"

namespace vesprun {
namespace {

constexpr std::string_view kLogFolder = "outbox/logs";
constexpr std::string_view kPtreeLogType = "193";  // the other logs are text

class OutboxLogFile : public LogFileHandle {
 public:
  explicit OutboxLogFile(AtomicFile& file) : _file(file) {}

  bool write(std::string_view bytes) override { return _file.append(bytes); }

 private:
  AtomicFile& _file;
};

/// One more than the largest number that a file name in the folder begins with.
std::optional<std::uint64_t> nextNumber(const std::string& folder, std::string& error) {
  const std::optional<std::vector<std::string>> names = namesInFolder(folder, error);
  if (!names) {
    return std::nullopt;
  }
  std::uint64_t largest = 0;
  for (const std::string& name : *names) {
    std::uint64_t number = 0;
    const auto [rest, problem] = std::from_chars(name.data(), name.data() + name.size(), number);
    if (problem == std::errc() && *rest == '-') {
      largest = std::max(largest, number);
    }
  }
  return largest + 1;
}

std::string baseName(std::uint64_t number, std::string_view type, std::string_view name) {
  char digits[24];
  std::snprintf(digits, sizeof digits, "%04llu", static_cast<unsigned long long>(number));
  return std::string(digits) + '-' + std::string(type) + '-' + std::string(name);
}

AtomicFile::Added addHeader(const std::string& folder, const std::string& name,
                            const PropertyDict& header, std::string& error) {
  std::optional<AtomicFile> file = AtomicFile::create(folder, error);
  if (!file) {
    return AtomicFile::Added::Failed;
  }
  file->append(jsonText(header) + '\n');  // `addNew` reports a failure
  return file->addNew(name, error);
}

}  // namespace

bool Outbox::append(const std::string& file, const PropertyDict& entries) {
  PropertyDict line{{"time", dateText(_clock.now())}};
  line.merge(entries);
  const std::lock_guard lock(_mutex);
  std::string error;
  const auto lines = _files.try_emplace(file, _directory.hostPath("outbox/" + file)).first;
  if (_directory.makeFolder("outbox", error) && lines->second.append(jsonText(line), error)) {
    return true;
  }
  _log.write(LogLevel::Error, error);
  return false;
}

bool Outbox::submitLog(std::string_view type, std::string_view name, const PropertyDict* header,
                       const Logsmith::LogWriter& writer) {
  std::string error;
  if (writeLog(type, name, header, writer, error)) {
    return true;
  }
  _log.write(LogLevel::Error, error);
  return false;
}

bool Outbox::writeLog(std::string_view type, std::string_view name, const PropertyDict* header,
                      const Logsmith::LogWriter& writer, std::string& error) const {
  const std::optional<std::string> folder = _directory.makeFolder(kLogFolder, error);
  if (!folder) {
    return false;
  }
  std::optional<AtomicFile> file = AtomicFile::create(*folder, error);
  if (!file) {
    return false;
  }
  OutboxLogFile handle(*file);
  writer(handle);
  // Two submissions at once must not share a number, or a header would go with the other's log.
  const std::optional<FolderLock> lock = FolderLock::take(*folder, error);
  if (!lock) {
    return false;
  }
  const std::optional<std::uint64_t> first = nextNumber(*folder, error);
  auto added = first ? AtomicFile::Added::NameTaken : AtomicFile::Added::Failed;
  for (std::uint64_t number = first.value_or(0); added == AtomicFile::Added::NameTaken; ++number) {
    const std::string base = baseName(number, type, name);
    const std::string headerName = base + ".header.json";
    // The header first: a log that is there has its header.
    if (header != nullptr) {
      added = addHeader(*folder, headerName, *header, error);
      if (added != AtomicFile::Added::Done) {
        continue;
      }
    }
    added = file->addNew(base + (type == kPtreeLogType ? ".ptree" : ".log"), error);
    if (added != AtomicFile::Added::Done && header != nullptr) {
      unlink((*folder + '/' + headerName).c_str());
    }
  }
  return added == AtomicFile::Added::Done;
}

}  // namespace vesprun
