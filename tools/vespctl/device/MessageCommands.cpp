#include "device/MessageCommands.h"

#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>

#include <cerrno>
#include <charconv>
#include <chrono>
#include <cstring>
#include <thread>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr const char* kServiceName = "com.quill.aggregated.vesprun";
constexpr std::string_view kLoggingNotification = "com.quill.aggregated.vesprun.logging";
constexpr int kPatienceInSeconds = 10;
constexpr std::chrono::milliseconds kLookAgain(20);
constexpr timeval kLastLook{2, 0};

std::optional<Bytes> uuidBytes(std::string_view text) {
  constexpr std::string_view kForm = "hhhhhhhh-hhhh-hhhh-hhhh-hhhhhhhhhhhh";
  Bytes bytes;
  for (std::size_t i = 0; i < kForm.size() && text.size() == kForm.size(); i += 2) {
    if (kForm[i] == '-' && text[i++] != '-') {
      return std::nullopt;
    }
    const char* const end = text.data() + i + 2;
    if (std::from_chars(text.data() + i, end, bytes.emplace_back(), 16).ptr != end) {
      return std::nullopt;
    }
  }
  return bytes.empty() ? std::nullopt : std::optional(std::move(bytes));
}

/// The value as the message carries it; nothing, with the fault in `fault`, for a wrong one.
std::optional<PropertyValue> messageValue(std::string_view name, const PropertyValue& value,
                                          std::string& fault) {
  if (name == "bundle_id" || name == "version") {
    fault = "not a string";
    return value.string() != nullptr ? std::optional(value) : std::nullopt;
  }
  if (name == "adam_id" || name == "arch") {
    fault = "not a signed 64-bit integer";
    const Number* number = value.number();
    return number != nullptr && number->kind() == NumberKind::Int64 ? std::optional(value)
                                                                    : std::nullopt;
  }
  if (name == "uuid") {
    fault = "not a UUID text such as 00112233-4455-6677-8899-AABBCCDDEEFF";
    std::optional<Bytes> bytes =
        value.string() != nullptr ? uuidBytes(*value.string()) : std::nullopt;
    return bytes ? std::optional<PropertyValue>(*std::move(bytes)) : std::nullopt;
  }
  fault = "unknown entry";
  return std::nullopt;
}

/// "app_data" from a JSON array of app dictionaries: "bundle_id" and "version" (strings), "adam_id"
/// and "arch" (integers), "uuid" (8-4-4-4-12 hexadecimal digits in either case). Absent entries
/// stay absent. Nothing, with the place in `error` ("app 2: \"uuid\": ..."), for anything else.
std::optional<PropertyArray> appDataFromJson(std::string_view json, std::string& error) {
  const std::optional<PropertyValue> value = valueFromJsonText(json, error);
  if (!value) {
    return std::nullopt;
  }
  if (value->array() == nullptr) {
    error = "not an array of app dictionaries";
    return std::nullopt;
  }
  PropertyArray apps;
  for (const PropertyValue& element : *value->array()) {
    const std::string place = "app " + std::to_string(apps.size() + 1) + ": ";
    if (element.dict() == nullptr) {
      error = place + "not a dictionary";
      return std::nullopt;
    }
    PropertyDict app;
    for (const auto& [name, entry] : *element.dict()) {
      std::string fault;
      std::optional<PropertyValue> carried = messageValue(name, entry, fault);
      if (!carried) {
        error = place + quotedText(name) + ": " + fault;
        return std::nullopt;
      }
      app.set(name, *std::move(carried));
    }
    apps.emplace_back(std::move(app));
  }
  return apps;
}

std::string document(const PropertyDict& message) {
  std::string text;
  orFail([&](std::string& error) { return writePtree(message, text, error); });
  return text;
}

std::string loggingDocument() { return document({{"operation", std::int64_t{0}}}); }

std::string appsDocument(const std::string& file) {
  std::string error;
  std::optional<PropertyArray> apps = appDataFromJson(readInput(file), error);
  if (!apps) {
    throw CommandFailure(inputName(file) + ": " + error);
  }
  return document({{"operation", std::int64_t{2}}, {"app_data", *std::move(apps)}});
}

class Client {
 public:
  explicit Client(const DeviceDirectory& directory) {
    std::string error;
    _socket = connectToService(directory, kServiceName, kPatienceInSeconds, error);
    if (!_socket.isOpen()) {
      throw CommandFailure(error);
    }
  }

  void send(std::string_view document) const {
    const std::optional<std::string> frame = messageFrame(document);
    if (!frame) {
      throw CommandFailure("the document is longer than the " + std::to_string(kMaxMessageSize) +
                           " bytes that a message may carry");
    }
    for (std::string_view rest = *frame; !rest.empty();) {
      const ssize_t sent = ::send(_socket.get(), rest.data(), rest.size(), MSG_NOSIGNAL);
      if (sent < 0 && errno != EINTR) {
        throw CommandFailure(errno == EAGAIN ? "the service is too busy to take the message"
                                             : ended());
      }
      rest.remove_prefix(sent < 0 ? 0 : static_cast<std::size_t>(sent));
    }
  }

  /// The service answers nothing, but when it ends before it has read the message, the connection
  /// is reset. When it is still there after a moment, it has the message.
  void finish() const {
    setsockopt(_socket.get(), SOL_SOCKET, SO_RCVTIMEO, &kLastLook, sizeof kLastLook);
    char byte = 0;
    if (shutdown(_socket.get(), SHUT_WR) == 0 && recv(_socket.get(), &byte, 1, 0) < 0 &&
        errno == ECONNRESET) {
      throw CommandFailure(ended());
    }
  }

 private:
  static std::string ended() {
    return std::string("the service ended the connection: ") + std::strerror(errno);
  }

  FileDescriptor _socket;
};

void sendDocument(const std::string& document) {
  const Client client(openDirectory(Access::Changing));
  client.send(document);
  client.finish();
}

/// Notifications posted from now on.
class NewNotifications {
 public:
  explicit NewNotifications(const DeviceDirectory& directory)
      : _file(directory.hostPath(kNotificationsFile)), _seen(size()) {}

  /// Waits for one of that name, but not for ever.
  bool await(std::string_view name) const {
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(kPatienceInSeconds);
    while (!isPosted(name)) {
      if (std::chrono::steady_clock::now() >= end) {
        return false;
      }
      std::this_thread::sleep_for(kLookAgain);
    }
    return true;
  }

 private:
  bool isPosted(std::string_view name) const {
    bool isThere = false;
    const auto look = [&](const PropertyDict* line) {
      const std::string* posted = line != nullptr ? line->findString("name") : nullptr;
      isThere = isThere || (posted != nullptr && *posted == name);
    };
    // A shorter file is a new one.
    forEachLine(_file, look, size() < _seen ? 0 : _seen);
    return isThere;
  }

  std::uint64_t size() const {
    const std::optional<struct stat> status = _file.status();
    return status ? static_cast<std::uint64_t>(status->st_size) : 0;
  }

  HostPath _file;
  std::uint64_t _seen;
};

void runSession(const std::string& file) {
  const std::string apps = appsDocument(file);
  const DeviceDirectory directory = openDirectory(Access::Changing);
  const NewNotifications notifications(directory);
  const Client client(directory);
  client.send(loggingDocument());
  if (!notifications.await(kLoggingNotification)) {
    throw CommandFailure("the notification " + std::string(kLoggingNotification) +
                         " did not come within " + std::to_string(kPatienceInSeconds) + " seconds");
  }
  client.send(apps);
  client.finish();
}

/// "today" is that of the device.
void askForDailyTasks(std::string_view day) {
  std::int64_t number = 0;
  if (!parseWholeText(day, number)) {
    Complaints complaints;
    const auto device = openDeviceReadOnly(complaints);
    number = GivenDay::parse(day)->on(device->tallybook().TBDaysSince1970());
  }
  sendDocument(document({{"operation", std::int64_t{1}}, {"value", number}}));
}

void addLogging(CLI::App& command) {
  command.callback([] { sendDocument(loggingDocument()); });
}

/// A command with a FILE.
template <auto send>
void addFileCommand(CLI::App& command, const char* help) {
  const auto file = std::make_shared<std::string>();
  command.add_option("FILE", *file, help)->required();
  command.callback([file] { send(*file); });
}

constexpr const char* kApps =
    "JSON array of apps with \"bundle_id\", \"version\", \"adam_id\", \"arch\" and \"uuid\" "
    "(text); - for standard input";

void sendApps(const std::string& file) { sendDocument(appsDocument(file)); }
void sendRaw(const std::string& file) { sendDocument(readInput(file)); }

void addDaily(CLI::App& command) {
  const auto day = std::make_shared<std::string>();
  command.add_option("DAY", *day, "The day")->required()->check([](const std::string& text) {
    std::int64_t number = 0;  // the message carries more than a day has
    return parseWholeText(text, number) || GivenDay::parse(text) ? std::string()
                                                                 : quotedText(text) + kNoDay;
  });
  command.callback([day] { askForDailyTasks(*day); });
}

constexpr Command kMessageCommands[] = {
    {"logging", "Notifies the logging status", addLogging},
    {"apps", "Delivers the active apps",
     [](CLI::App& command) { addFileCommand<sendApps>(command, kApps); }},
    {"session", "Notifies the logging status, waits for the answer, delivers the active apps",
     [](CLI::App& command) { addFileCommand<runSession>(command, kApps); }},
    {"daily", "Asks for the daily tasks of a day", addDaily},
    {"raw", "Sends a ptree document as it is",
     [](CLI::App& command) {
       addFileCommand<sendRaw>(command, "The document; - for standard input");
     }},
};

}  // namespace

void addMessageCommands(CLI::App& command) { addCommands(command, kMessageCommands); }

}  // namespace vesprun
