#include "platform/host/outbox/LogNotes.h"

#include <algorithm>
#include <functional>
#include <nlohmann/json.hpp>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/JsonLines.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

/// The name in a note; null when the line is something else.
const std::string* nameIn(const Json& note) {
  const auto name = note.is_object() ? note.find("name") : note.end();
  return name != note.end() ? name->get_ptr<const std::string*>() : nullptr;
}

Json parsed(std::string_view line) { return Json::parse(line, nullptr, false); }

/// Calls `take` with each note.
bool forEachNote(const DeviceDirectory& directory, std::string_view file,
                 const std::function<void(const std::string& name, const Json& note)>& take,
                 std::string& error) {
  const auto takeLine = [&take](std::string_view line) {
    const Json note = parsed(line);
    if (const std::string* const name = nameIn(note)) {
      take(*name, note);
    }
  };
  return forEachLineOf(directory.hostPath(file), takeLine, error);
}

std::optional<std::int64_t> integerIn(const Json& note, const char* key) {
  const auto value = note.find(key);
  return value != note.end() && value->is_number_integer()
             ? std::optional(value->get<std::int64_t>())
             : std::nullopt;
}

std::optional<std::string> textIn(const Json& note, const char* key) {
  const auto value = note.find(key);
  return value != note.end() && value->is_string() ? std::optional(value->get<std::string>())
                                                   : std::nullopt;
}

bool appendNote(JsonLines& lines, const Json& note, std::string& error) {
  return lines.append(note.dump(-1, ' ', false, Json::error_handler_t::replace), error);
}

}  // namespace

std::optional<std::vector<LogNote>> readLogNotes(const DeviceDirectory& directory,
                                                 std::string_view file, std::string& error) {
  std::vector<LogNote> notes;
  const auto take = [&notes](const std::string& name, const Json& note) {
    const std::optional<std::int64_t> day = integerIn(note, "day");
    const std::optional<std::int64_t> revision = integerIn(note, "revision");
    if (day && revision) {
      notes.push_back(
          {name, logNumber(name).value_or(0), static_cast<std::int32_t>(*day), *revision});
    }
  };
  return forEachNote(directory, file, take, error) ? std::optional(std::move(notes)) : std::nullopt;
}

bool addLogNotes(const DeviceDirectory& directory, std::string_view file, const Date& time,
                 const std::vector<LogNote>& notes, std::string& error) {
  JsonLines lines(directory.hostPath(file));
  for (const LogNote& note : notes) {
    if (!appendNote(lines,
                    {{"time", dateText(time)},
                     {"name", note.name},
                     {"day", note.day},
                     {"revision", note.revision}},
                    error)) {
      return false;
    }
  }
  return notes.empty() || flushFile(directory.hostPath(file), error);
}

std::optional<std::map<std::string, SubmittedNote>> readSubmittedNotes(
    const DeviceDirectory& directory, std::string& error) {
  std::map<std::string, SubmittedNote> notes;
  const auto take = [&notes](const std::string& name, const Json& note) {
    notes[name] = {textIn(note, "build"), textIn(note, "model")};
  };
  return forEachNote(directory, kSubmittedFile, take, error) ? std::optional(std::move(notes))
                                                             : std::nullopt;
}

bool addSubmittedNote(const DeviceDirectory& directory, const Date& time, const std::string& name,
                      const SubmittedNote& note, std::string& error) {
  JsonLines lines(directory.hostPath(kSubmittedFile));
  // Without the library's objects: a daily run must outlive memory that runs out.
  std::string line = jsonText(PropertyDict{{"time", dateText(time)}, {"name", name}});
  line.pop_back();
  for (const auto& [entry, text] : {std::pair("build", &note.build), {"model", &note.model}}) {
    line.append(",\"").append(entry).append("\":");
    *text ? appendJsonText(**text, line) : static_cast<void>(line.append("null"));
  }
  return lines.append(line + '}', error);
}

bool removeStaleNotes(const DeviceDirectory& directory, std::string& error) {
  const auto names = namesInFolder(directory.hostPath(kLogFolder), error);
  const auto isStale = [&names](std::string_view line) {
    const Json note = parsed(line);
    const std::string* const name = nameIn(note);
    return name != nullptr && !std::ranges::binary_search(*names, *name);
  };
  return names && JsonLines(directory.hostPath(kSubmittedFile)).remove(isStale, error) &&
         JsonLines(directory.hostPath(kUploadedFile)).remove(isStale, error);
}

}  // namespace vesprun
