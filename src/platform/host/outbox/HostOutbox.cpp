#include "platform/host/outbox/HostOutbox.h"

#include <cstdint>
#include <optional>

#include "common/Calendar.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/LogNumbers.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr std::string_view kPtreeLogType = "193";  // the other logs are text

AtomicFile::Added addHeader(const HostPath& folder, const std::string& name,
                            const PropertyDict& header, const Date& time, std::string& error) {
  std::optional<AtomicFile> file = AtomicFile::create(folder, error);
  if (!file) {
    return AtomicFile::Added::Failed;
  }
  file->append(jsonText(header) + '\n');  // `addNew` reports a failure
  file->setModificationTime(time);
  return file->addNew(name, error);
}

}  // namespace

bool HostOutbox::EventHubIsEventUsed(std::string_view event) {
  return !_description.events.used || _description.events.used->contains(event);
}

bool HostOutbox::EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) {
  if (!_description.events.available || _description.events.fails.contains(event)) {
    return false;
  }
  return !EventHubIsEventUsed(event) ||
         append(kEventsFile, {{"event", event}, {"payload", build()}});
}

void HostOutbox::PostNotification(std::string_view name) {
  append(kNotificationsFile, {{"name", name}});
}

bool HostOutbox::FLLogStructuredData(std::int32_t type, const PropertyDict& record) {
  return append(kRecordsFile, {{"type", type}, {"record", record}});
}

std::string HostOutbox::LGSOSVersion() {
  return describedOr(_description.system.osVersion, live::osVersion);
}

PropertyDict HostOutbox::CopySystemVersionDictionary() {
  return {{"ProductBuildVersion", describedOr(_description.system.buildVersion, live::osBuild)}};
}

bool HostOutbox::append(std::string_view file, const PropertyDict& entries) {
  PropertyDict line{{"time", dateText(_clock.now())}};
  line.merge(entries);
  const std::lock_guard lock(_mutex);
  std::string error;
  const auto lines = _files.try_emplace(file, _directory.hostPath(file)).first;
  if (_directory.makeFolder(kOutbox, error) && lines->second.append(jsonText(line), error)) {
    return true;
  }
  _log.write(LogLevel::Error, error);
  return false;
}

bool HostOutbox::LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                          const PropertyDict* header, const LogWriter& writer) {
  if (_description.submission.fails) {
    return false;
  }
  std::string error;
  if (writeLog(logType, logName, header, writer, error)) {
    return true;
  }
  _log.write(LogLevel::Error, error);
  return false;
}

/// Call before the log is there, so that every log has its note.
void HostOutbox::noteSubmitted(const std::string& name, const Date& time) const {
  const auto textOrNull = [](std::string text) {
    return text.empty() ? std::nullopt : std::optional(std::move(text));
  };
  const SubmittedNote note{
      textOrNull(describedOr(_description.system.buildVersion, live::osBuild)),
      textOrNull(describedOr(_description.system.hardwareModel, live::hardwareModel))};
  std::string error;
  if (!addSubmittedNote(_directory, time, name, note, error)) {
    _log.write(LogLevel::Error, error);
  }
}

bool HostOutbox::writeLog(std::string_view type, std::string_view name, const PropertyDict* header,
                          const LogWriter& writer, std::string& error) const {
  const std::optional<HostPath> folder = _directory.makeFolder(kLogFolder, error);
  if (!folder) {
    return false;
  }
  const LogNumbers numbers(_directory);
  std::optional<AtomicFile> file = AtomicFile::create(*folder, error);
  if (!file) {
    return false;
  }
  writer([&file](std::string_view bytes) { return file->append(bytes); });
  // The machine's clock may be another one.
  const Date time = _clock.now();
  file->setModificationTime(time);
  // Two submissions at once must not share a number, or a header would go with the other's log.
  const std::optional<FileDescriptor> lock = lockFolder(*folder, error);
  if (!lock) {
    return false;
  }
  const std::optional<std::uint64_t> newest = numbers.newest(error);
  auto added = newest ? AtomicFile::Added::NameTaken : AtomicFile::Added::Failed;
  std::uint64_t number = newest.value_or(0);
  while (added == AtomicFile::Added::NameTaken) {
    LogName log{logBase(++number, type, name), number,
                type == kPtreeLogType ? LogName::End::Ptree : LogName::End::Text};
    const std::string headerName = LogName{log.base, number, LogName::End::Header}.text();
    // The header first: a log that is there has its header.
    if (header != nullptr) {
      added = addHeader(*folder, headerName, *header, time, error);
      if (added != AtomicFile::Added::Done) {
        continue;
      }
    }
    if (log.isDailyLog()) {
      noteSubmitted(log.text(), time);
    }
    added = file->addNew(log.text(), error);
    if (added != AtomicFile::Added::Done && header != nullptr) {
      removeFile(folder->below(headerName));
    }
  }
  if (added == AtomicFile::Added::Done) {
    std::string ignored;  // the next log finds its number by reading the folder
    numbers.remember(number, false, ignored);
  }
  return added == AtomicFile::Added::Done;
}

}  // namespace vesprun
