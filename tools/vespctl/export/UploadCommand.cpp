#include "export/UploadCommand.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <zlib.h>

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <memory>
#include <set>

#include "access/CommandDevice.h"
#include "commandline/Progress.h"
#include "exchange/HttpClient.h"
#include "export/LogExport.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr std::chrono::seconds kMaxSilence(60);
constexpr std::chrono::seconds kMaxAnswer(60);
constexpr std::size_t kMaxHeaders = 65'536;

struct Upload {
  std::string url;
  std::string device;
  std::string headers;
  std::string authorities;
};

bool isHeader(std::string_view line) {
  const std::size_t colon = line.find(':');
  const auto isNamed = [](unsigned char byte) {
    return std::isalnum(byte) != 0 ||
           (byte != 0 && std::strchr("!#$%&'*+-.^_`|~", byte) != nullptr);
  };
  const auto isText = [](unsigned char byte) {
    return byte == '\t' || (byte >= 0x20 && byte != 0x7F);
  };
  return colon != std::string_view::npos && colon > 0 &&
         std::ranges::all_of(line.substr(0, colon), isNamed) && std::ranges::all_of(line, isText);
}

/// Who must not have a right on a file of secrets. In the folder of its credentials the service
/// manager may show the right of one user as one of the group.
mode_t strangersTo(const std::string& path) {
  const char* const credentials = std::getenv("CREDENTIALS_DIRECTORY");
  const bool isCredential =
      credentials != nullptr && path.starts_with(std::string(credentials) + '/');
  return isCredential ? S_IRWXO : S_IRWXG | S_IRWXO;
}

/// The header lines of a file that its owner alone can read.
std::vector<std::string> headersIn(const std::string& path) {
  const FileDescriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  struct stat status {};
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    throw CommandFailure(systemError(path));
  }
  if (!S_ISREG(status.st_mode) || (status.st_mode & strangersTo(path)) != 0) {
    throw CommandFailure(path + ": must be a file that its owner alone can read (chmod 600)");
  }
  std::string text(kMaxHeaders + 1, '\0');
  const ssize_t size = read(file.get(), text.data(), text.size());
  if (size < 0 || static_cast<std::size_t>(size) > kMaxHeaders) {
    throw CommandFailure(size < 0 ? systemError(path) : path + ": more than 64 KiB of headers");
  }
  text.resize(static_cast<std::size_t>(size));
  std::vector<std::string> headers;
  for (std::size_t begin = 0; begin < text.size();) {
    const std::size_t end = std::min(text.find('\n', begin), text.size());
    std::string line = text.substr(begin, end - begin);
    line.resize(line.ends_with('\r') ? line.size() - 1 : line.size());
    begin = end + 1;
    if (!isHeader(line)) {
      throw CommandFailure(path + ":" + std::to_string(headers.size() + 1) +
                           ": not a header, NAME: VALUE");
    }
    const bool isEmpty = line.find_first_not_of(" \t", line.find(':') + 1) == std::string::npos;
    // As the client wants a header without a value.
    headers.push_back(isEmpty ? line.substr(0, line.find(':')) + ';' : line);
  }
  return headers;
}

std::string gzip(const std::string& text) {
  z_stream stream{};
  constexpr int kGzip = 15 + 16;
  if (deflateInit2(&stream, Z_DEFAULT_COMPRESSION, Z_DEFLATED, kGzip, 8, Z_DEFAULT_STRATEGY) !=
      Z_OK) {
    throw std::bad_alloc();
  }
  std::string packed(deflateBound(&stream, text.size()), '\0');
  stream.next_in = reinterpret_cast<Bytef*>(const_cast<char*>(text.data()));
  stream.avail_in = static_cast<uInt>(text.size());
  stream.next_out = reinterpret_cast<Bytef*>(packed.data());
  stream.avail_out = static_cast<uInt>(packed.size());
  deflate(&stream, Z_FINISH);
  packed.resize(stream.total_out);
  deflateEnd(&stream);
  return packed;
}

/// Keeps another upload from the same logs as long as the result lives.
FileDescriptor takeUpload(const DeviceDirectory& directory) {
  return *orFail([&](std::string& error) -> std::optional<FileDescriptor> {
    if (!directory.makeFolder("run", error)) {
      return std::nullopt;
    }
    const HostPath path = directory.hostPath(kUploadLock);
    FileDescriptor file = openToChange(path, O_RDWR | O_CREAT, error);
    bool isBusy = false;
    if (!file.isOpen() ||
        !takeLock(file.get(), LOCK_EX, std::chrono::milliseconds(0), path, error, &isBusy)) {
      error = isBusy ? "another upload is at work" : error;
      return std::nullopt;
    }
    return file;
  });
}

class Uploading {
 public:
  Uploading(HostPlatform& device, const Upload& wanted, HttpClient& server)
      : _device(device), _source(device, wanted.device), _server(server) {
    _folder = wanted.url.substr(0, wanted.url.find_last_not_of('/') + 1) + '/' +
              escapedInAddress(_source.device()) + '/';
    const auto notes = orFail(
        [&](std::string& error) { return readLogNotes(device.directory(), kUploadedFile, error); });
    for (const LogNote& note : *notes) {
      _acknowledged.insert(note.name);
    }
  }

  /// Sends what was not acknowledged, up to the first failure.
  void run() {
    _unreadable =
        forEachSubmittedLog(_device.directory(), [this](const SubmittedLog& log) { take(log); });
  }

  /// Says what came of it. Throws `CommandFailure` if not all is well.
  void report() {
    printResult({{"sent", _sent}, {"waiting", _waiting}});
    std::cout.flush();
    _unreadable.insert(_unreadable.end(), _refused.begin(), _refused.end());
    if (!_failure.empty()) {
      nameUnreadable(_unreadable);
      throw CommandFailure(_failure);
    }
    failIfUnreadable(_unreadable);
  }

 private:
  void take(const SubmittedLog& log) {
    std::string why;
    if (_acknowledged.contains(log.name)) {
      return;
    }
    if (!_failure.empty()) {
      ++_waiting;
      return;
    }
    const std::optional<std::string> line = _source.lineOf(log, why);
    if (!line) {
      _refused.push_back({log.name, why, true});
    } else if (send(log, *line)) {
      ++_sent;
      _progress.advance();
    } else {
      ++_waiting;
    }
  }

  /// The acknowledgement is durable before the next log is sent.
  bool send(const SubmittedLog& log, const std::string& line) {
    const std::string url =
        _folder + std::to_string(log.day) + '-' + std::to_string(log.revision) + ".jsonl.gz";
    try {
      const HttpClient::Answer answer = _server.put(url, gzip(line + '\n'));
      if (answer.status < 200 || answer.status > 299) {
        _failure = url + ": the server answers " + std::to_string(answer.status) +
                   (answer.reason.empty() ? "" : ": " + answer.reason);
        return false;
      }
    } catch (const HttpFailure& failure) {
      _failure = url + ": " + failure.what();
      return false;
    }
    const LogNote note{log.name, 0, log.day, log.revision};
    return addLogNotes(_device.directory(), kUploadedFile, _device.clock().now(), {note}, _failure);
  }

  HostPlatform& _device;
  LogExport _source;
  HttpClient& _server;
  std::string _folder;
  std::set<std::string> _acknowledged;
  Progress _progress{"uploading", "logs"};
  std::uint64_t _sent = 0;
  std::uint64_t _waiting = 0;
  std::string _failure;  ///< the first one
  std::vector<UnreadableLog> _refused;
  std::vector<UnreadableLog> _unreadable;
};

void upload(const Upload& wanted) {
  HttpClient::Settings settings;
  settings.authorities = wanted.authorities;
  settings.longestSilence = kMaxSilence;
  settings.longestAnswer = kMaxAnswer;
  if (!wanted.headers.empty()) {
    settings.headers = headersIn(wanted.headers);  // with the caller's rights
  }
  settings.headers.insert(settings.headers.begin(), {"Content-Type: application/gzip", "Expect:"});
  HttpClient server(settings);
  const auto device = openDevice();
  const FileDescriptor alone = takeUpload(device->directory());
  Uploading uploading(*device, wanted, server);
  uploading.run();
  uploading.report();
}

}  // namespace

void addUploadCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Upload>();
  command.add_option("URL", wanted->url, "A folder of a server, http://... or https://...")
      ->required()
      ->type_name("")
      ->check([](const std::string& url) -> std::string {
        const std::optional<WebAddress> address = parseWebAddress(url);
        return address && address->isPlain
                   ? ""
                   : "not http://... or https://... without user, password and query";
      });
  addDeviceName(command, wanted->device)->check([](const std::string& name) -> std::string {
    return name != "." && name != ".." ? "" : "not the name of a folder";
  });
  command
      .add_option("--headers", wanted->headers,
                  "A file of headers for the requests, one a line, that its owner alone can read")
      ->type_name("FILE");
  command
      .add_option("--ca", wanted->authorities,
                  "A file of certificates to verify the server's against, instead of the system's")
      ->type_name("FILE");
  command.callback([wanted] { upload(*wanted); });
}

}  // namespace vesprun
