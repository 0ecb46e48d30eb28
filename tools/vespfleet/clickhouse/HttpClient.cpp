#include "HttpClient.h"

#include <curl/curl.h>
#include <fcntl.h>
#include <sys/stat.h>

#include <algorithm>
#include <cstdlib>
#include <exception>
#include <new>
#include <stdexcept>

#include "FleetStore.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

constexpr long kConnectSeconds = 10;
constexpr long kSilentSeconds = 300;
constexpr std::size_t kMaxReason = 300;

struct FreeUrl {
  void operator()(CURLU* url) const { curl_url_cleanup(url); }
};
using Url = std::unique_ptr<CURLU, FreeUrl>;

/// A part of an address; empty when it has none.
std::string part(const Url& url, CURLUPart which) {
  char* text = nullptr;
  if (curl_url_get(url.get(), which, &text, CURLU_URLDECODE) != CURLUE_OK) {
    return {};
  }
  std::string found = text;
  curl_free(text);
  return found;
}

std::string environment(const char* name) {
  const char* value = std::getenv(name);
  return value != nullptr ? value : "";
}

/// What comes from a server, and what went wrong with taking it.
struct Answer {
  CURL* curl;
  const HttpClient::TakePiece& take;
  std::string reason;  ///< the begin of an answer that is an error
  std::exception_ptr failure;
};

std::size_t takePiece(const char* bytes, std::size_t size, std::size_t count, void* given) {
  Answer& answer = *static_cast<Answer*>(given);
  long status = 0;
  curl_easy_getinfo(answer.curl, CURLINFO_RESPONSE_CODE, &status);
  try {
    if (status == 200) {
      answer.take({bytes, size * count});
    } else if (answer.reason.size() < kMaxReason) {
      answer.reason.append(bytes, size * count);
    }
  } catch (...) {
    answer.failure = std::current_exception();
    return 0;  // ends the transfer
  }
  return size * count;
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

/// The first line of a server's answer, for people.
std::string reasonIn(const std::string& answer) {
  std::string reason = answer.substr(0, std::min(answer.find('\n'), kMaxReason));
  for (char& byte : reason) {
    byte = static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F ? ' ' : byte;
  }
  return reason;
}

}  // namespace

std::string HttpClient::faultOf(const std::string& address) {
  const Url url(curl_url());
  const bool parsed =
      url && curl_url_set(url.get(), CURLUPART_URL, address.c_str(), 0) == CURLUE_OK;
  std::string database = parsed ? part(url, CURLUPART_PATH) : "";
  database.erase(0, 1);
  const bool plain = part(url, CURLUPART_USER).empty() && part(url, CURLUPART_PASSWORD).empty() &&
                     part(url, CURLUPART_QUERY).empty() && part(url, CURLUPART_FRAGMENT).empty();
  return parsed && plain && !database.empty() && database.find('/') == std::string::npos
             ? ""
             : "a ClickHouse store is http://HOST:PORT/DATABASE or https://..., with user and "
               "password in VESPFLEET_USER and VESPFLEET_PASSWORD";
}

HttpClient::HttpClient(const std::string& address)
    : _address(address), _curl(curl_easy_init(), curl_easy_cleanup) {
  const Url url(curl_url());
  if (!_curl || !url || curl_url_set(url.get(), CURLUPART_URL, address.c_str(), 0) != CURLUE_OK) {
    throw std::bad_alloc();
  }
  const std::string database = part(url, CURLUPART_PATH).substr(1);
  curl_url_set(url.get(), CURLUPART_PATH, "/", 0);
  // A late error would otherwise come behind the status 200, in the middle of the answer.
  for (const std::string& setting : {std::string("wait_end_of_query=1"), "database=" + database}) {
    curl_url_set(url.get(), CURLUPART_QUERY, setting.c_str(), CURLU_URLENCODE | CURLU_APPENDQUERY);
  }
  char* text = nullptr;
  if (curl_url_get(url.get(), CURLUPART_URL, &text, 0) != CURLUE_OK) {
    throw std::bad_alloc();
  }
  _url = text;
  curl_free(text);
  CURL* curl = _curl.get();
  curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L);
  curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "http,https");
  curl_easy_setopt(curl, CURLOPT_PROXY, "");
  curl_easy_setopt(curl, CURLOPT_CONNECTTIMEOUT, kConnectSeconds);
  curl_easy_setopt(curl, CURLOPT_LOW_SPEED_LIMIT, 1L);
  curl_easy_setopt(curl, CURLOPT_LOW_SPEED_TIME, kSilentSeconds);
  curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, takePiece);
  if (const std::string authorities = environment("VESPFLEET_CA"); !authorities.empty()) {
    curl_easy_setopt(curl, CURLOPT_CAINFO, authorities.c_str());
  }
  std::string user = environment("VESPFLEET_USER");
  std::string password = environment("VESPFLEET_PASSWORD");
  if (const std::string file = environment("VESPFLEET_CREDENTIALS");
      user.empty() && !file.empty()) {
    user = credentialsIn(file);
    password = user.substr(user.find(':') + 1);
    user.resize(user.find(':'));
  }
  if (!user.empty()) {
    curl_easy_setopt(curl, CURLOPT_HTTPAUTH, static_cast<long>(CURLAUTH_BASIC));
    curl_easy_setopt(curl, CURLOPT_USERNAME, user.c_str());
    curl_easy_setopt(curl, CURLOPT_PASSWORD, password.c_str());
  }
}

void HttpClient::set(const std::string& setting) { _url.append("&").append(setting); }

std::string HttpClient::urlOf(
    std::initializer_list<std::pair<std::string, std::string>> arguments) {
  std::string url = _url;
  for (const auto& [name, value] : arguments) {
    char* escaped = curl_easy_escape(_curl.get(), value.c_str(), static_cast<int>(value.size()));
    if (escaped == nullptr) {
      throw std::bad_alloc();
    }
    url.append("&").append(name).append("=").append(escaped);
    curl_free(escaped);
  }
  return url;
}

std::string HttpClient::post(const std::string& query, std::string_view data) {
  std::string answer;
  const TakePiece take = [&answer](std::string_view piece) { answer.append(piece); };
  if (data.empty()) {
    ask(query, nullptr, take);
    return answer;
  }
  curl_easy_setopt(_curl.get(), CURLOPT_POSTFIELDS, data.data());
  curl_easy_setopt(_curl.get(), CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(data.size()));
  perform(urlOf({{"query", query}}), take);
  return answer;
}

void HttpClient::ask(const std::string& question, const SentTable* sent, const TakePiece& take) {
  CURL* curl = _curl.get();
  if (sent == nullptr) {
    curl_easy_setopt(curl, CURLOPT_POSTFIELDS, question.data());
    curl_easy_setopt(curl, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(question.size()));
    perform(_url, take);
    return;
  }
  const std::unique_ptr<curl_mime, void (*)(curl_mime*)> form(curl_mime_init(curl), curl_mime_free);
  curl_mimepart* part = form ? curl_mime_addpart(form.get()) : nullptr;
  if (part == nullptr || curl_mime_name(part, sent->name.c_str()) != CURLE_OK ||
      curl_mime_filename(part, sent->name.c_str()) != CURLE_OK ||
      curl_mime_data(part, sent->rows.data(), sent->rows.size()) != CURLE_OK) {
    throw std::bad_alloc();
  }
  curl_easy_setopt(curl, CURLOPT_MIMEPOST, form.get());
  perform(urlOf({{"query", question},
                 {sent->name + "_structure", sent->structure},
                 {sent->name + "_format", "RowBinary"}}),
          take);
}

/// Sends what was set, and reads the answer.
void HttpClient::perform(const std::string& url, const TakePiece& take) {
  CURL* curl = _curl.get();
  Answer answer{curl, take, {}, {}};
  curl_easy_setopt(curl, CURLOPT_URL, url.c_str());
  curl_easy_setopt(curl, CURLOPT_WRITEDATA, &answer);
  const CURLcode result = curl_easy_perform(curl);
  if (answer.failure) {
    std::rethrow_exception(answer.failure);
  }
  if (result != CURLE_OK) {
    throw StoreFailure(_address + ": " + curl_easy_strerror(result));
  }
  long status = 0;
  curl_easy_getinfo(curl, CURLINFO_RESPONSE_CODE, &status);
  if (status != 200) {
    throw StoreFailure(_address + ": " + reasonIn(answer.reason));
  }
}

}  // namespace vesprun
