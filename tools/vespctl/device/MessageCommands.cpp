#include <sys/socket.h>
#include <sys/time.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <thread>

#include "Command.h"
#include "DecimalNumber.h"
#include "device/AppFile.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"

namespace vesprun {
namespace {

constexpr const char* kServiceName = "com.quill.aggregated.vesprun";
constexpr std::string_view kLoggingNotification = "com.quill.aggregated.vesprun.logging";
constexpr int kPatienceInSeconds = 10;
constexpr std::chrono::milliseconds kLookAgain(20);
constexpr timeval kLastLook{2, 0};

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

  /// Nothing comes back, but a service that ends before it has read the message resets the
  /// connection. One that is still there after a moment has the message.
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
      : _file(directory.hostPath("outbox/notifications.jsonl")),
        _seen(contentIfThere(_file).size()) {}

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
    // A shorter file is a new one.
    std::string_view rest = std::string_view(text).substr(text.size() < _seen ? 0 : _seen);
    for (auto end = rest.find('\n'); end != std::string_view::npos; end = rest.find('\n')) {
      std::string ignored;
      const std::optional<PropertyValue> line = valueFromJsonText(rest.substr(0, end), ignored);
      const PropertyDict* dict = line ? line->dict() : nullptr;
      const std::string* posted = dict != nullptr ? dict->findString("name") : nullptr;
      if (posted != nullptr && *posted == name) {
        return true;
      }
      rest.remove_prefix(end + 1);
    }
    return false;
  }

  std::string _file;
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
