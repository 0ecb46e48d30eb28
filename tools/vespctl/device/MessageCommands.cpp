#include <sys/socket.h>
#include <sys/time.h>

#include <cerrno>
#include <charconv>
#include <chrono>
#include <cstring>
#include <thread>

#include "Command.h"
#include "DecimalNumber.h"
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
      throw CommandFailure("the document is longer than the " + std::to_string(kLongestMessage) +
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

void sendDocument(const std::string& path, const std::string& document) {
  const DeviceDirectory directory = openDirectory(path);
  const Client client(directory);
  client.send(document);
  client.finish();
}

/// Notifications posted from now on.
class NewNotifications {
 public:
  explicit NewNotifications(const DeviceDirectory& directory)
      : _file(directory.hostPath(kNotificationsFile)), _seen(contentIfThere(_file).size()) {}

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
    const std::string text = contentIfThere(_file);
    bool isThere = false;
    // A shorter file is a new one.
    forEachLine(text.substr(text.size() < _seen ? 0 : _seen), [&](const PropertyDict* line) {
      const std::string* posted = line != nullptr ? line->findString("name") : nullptr;
      isThere = isThere || (posted != nullptr && *posted == name);
    });
    return isThere;
  }

  HostPath _file;
  std::size_t _seen;
};

void runSession(const std::string& path, const std::string& file) {
  const std::string apps = appsDocument(file);
  const DeviceDirectory directory = openDirectory(path);
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

}  // namespace

void addMessageCommands(CLI::App& vespctl) {
  struct Arguments {
    std::string device;
    std::string file;
    std::int64_t day = 0;
  };
  const auto arguments = std::make_shared<Arguments>();

  CLI::App* send =
      addDeviceCommand(vespctl, "send", "Sends messages to a running vesprun", arguments->device);

  send->add_subcommand("logging", "Notifies the logging status")->callback([arguments] {
    sendDocument(arguments->device, loggingDocument());
  });

  CLI::App* apps = send->add_subcommand("apps", "Delivers the active apps");
  apps->callback([arguments] { sendDocument(arguments->device, appsDocument(arguments->file)); });
  CLI::App* session = send->add_subcommand(
      "session", "Notifies the logging status, waits for the answer, delivers the active apps");
  session->callback([arguments] { runSession(arguments->device, arguments->file); });
  for (CLI::App* command : {apps, session}) {
    command
        ->add_option("FILE", arguments->file,
                     "JSON array of apps with \"bundle_id\", \"version\", \"adam_id\", \"arch\" "
                     "and \"uuid\" (text); - for standard input")
        ->required();
  }

  CLI::App* daily = send->add_subcommand("daily", "Asks for the daily tasks of a day");
  daily->add_option("DAY", arguments->day, "The day number")
      ->required()
      ->transform(decimal<std::int64_t>());
  daily->callback([arguments] {
    sendDocument(arguments->device,
                 document({{"operation", std::int64_t{1}}, {"value", arguments->day}}));
  });

  CLI::App* raw = send->add_subcommand("raw", "Sends a ptree document as it is");
  raw->add_option("FILE", arguments->file, "The document; - for standard input")->required();
  raw->callback([arguments] { sendDocument(arguments->device, readInput(arguments->file)); });
  allowOneCommand(*send);
}

}  // namespace vesprun
