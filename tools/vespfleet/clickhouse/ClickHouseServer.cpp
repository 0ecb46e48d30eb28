#include "ClickHouseServer.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdlib>

#include "platform/host/files/Files.h"
#include "store/FleetStore.h"

namespace vesprun {
namespace {

std::string environment(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? value : "";
}

/// USER:PASSWORD of a file that others cannot read.
std::string credentialsIn(const std::string& path) {
  struct stat status {};
  const FileDescriptor file(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
  if (!file.isOpen() || fstat(file.get(), &status) != 0) {
    throw StoreFailure(systemError(path));
  }
  if (!S_ISREG(status.st_mode) || (status.st_mode & (S_IRWXG | S_IRWXO)) != 0) {
    throw StoreFailure(path + ": must be a file that its owner alone can read (chmod 600)");
  }
  char bytes[4096];
  const ssize_t length = read(file.get(), bytes, sizeof bytes);
  std::string line(bytes, length > 0 ? static_cast<std::size_t>(length) : 0);
  line.resize(std::min(line.find_last_not_of("\r\n") + 1, line.size()));
  if (line.find(':') == std::string::npos || line.find_first_of("\r\n") != std::string::npos) {
    throw StoreFailure(path + ": has not one line USER:PASSWORD");
  }
  return line;
}

HttpClient::Settings settings() {
  HttpClient::Settings settings;
  settings.authorities = environment("VESPFLEET_CA");
  settings.user = environment("VESPFLEET_USER");
  settings.password = environment("VESPFLEET_PASSWORD");
  if (const std::string file = environment("VESPFLEET_CREDENTIALS");
      settings.user.empty() && !file.empty()) {
    const std::string line = credentialsIn(file);
    settings.user = line.substr(0, line.find(':'));
    settings.password = line.substr(line.find(':') + 1);
  }
  return settings;
}

}  // namespace

std::string ClickHouseServer::faultOf(const std::string& address) {
  const std::optional<WebAddress> parsed = parseWebAddress(address);
  const std::string database = parsed && !parsed->path.empty() ? parsed->path.substr(1) : "";
  return parsed && parsed->isPlain && !database.empty() && database.find('/') == std::string::npos
             ? ""
             : "a ClickHouse store is http://HOST:PORT/DATABASE or https://..., with user and "
               "password in VESPFLEET_USER and VESPFLEET_PASSWORD";
}

ClickHouseServer::ClickHouseServer(const std::string& address)
    : _address(address), _client(settings()) {
  const std::optional<WebAddress> parsed = parseWebAddress(address);
  // A late error would otherwise come behind the status 200, in the middle of the answer.
  _url =
      parsed->server + "/?wait_end_of_query=1&database=" + escapedInAddress(parsed->path.substr(1));
}

void ClickHouseServer::set(const std::string& setting) { _url.append("&").append(setting); }

std::string ClickHouseServer::post(const std::string& query, std::string_view data) {
  std::string answer;
  const auto take = [&answer](std::string_view piece) { answer.append(piece); };
  if (data.empty()) {
    perform("", query, take);
  } else {
    perform("&query=" + escapedInAddress(query), data, take);
  }
  return answer;
}

void ClickHouseServer::ask(const std::string& question, const SentTable* sent,
                           const HttpClient::TakePiece& take) {
  if (sent == nullptr) {
    perform("", question, take);
    return;
  }
  std::string boundary = "rows";
  while (sent->rows.find(boundary) != std::string::npos) {
    boundary += std::to_string(boundary.size());
  }
  perform("&query=" + escapedInAddress(question) + '&' + sent->name + "_structure=" +
              escapedInAddress(sent->structure) + '&' + sent->name + "_format=RowBinary",
          "--" + boundary + "\r\nContent-Disposition: form-data; name=\"" + sent->name +
              "\"; filename=\"" + sent->name + "\"\r\n\r\n" + sent->rows + "\r\n--" + boundary +
              "--\r\n",
          take, "multipart/form-data; boundary=" + boundary);
}

void ClickHouseServer::perform(const std::string& arguments, std::string_view body,
                               const HttpClient::TakePiece& take, const std::string& contentType) {
  HttpClient::Answer answer;
  try {
    answer = _client.post(_url + arguments, body, take, contentType);
  } catch (const HttpFailure& failure) {
    throw StoreFailure(_address + ": " + failure.what());
  }
  if (answer.status != 200) {
    throw StoreFailure(
        _address + ": " +
        (answer.reason.empty() ? "status " + std::to_string(answer.status) : answer.reason));
  }
}

}  // namespace vesprun
