#include "HttpClient.h"

#include <curl/curl.h>

#include <cstdlib>
#include <new>
#include <stdexcept>

#include "FleetStore.h"

namespace vesprun {
namespace {

constexpr long kConnectSeconds = 10;
constexpr long kSilentSeconds = 300;
constexpr std::size_t kLongestReason = 300;

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

std::size_t take(const char* bytes, std::size_t size, std::size_t count, void* answer) {
  try {
    static_cast<std::string*>(answer)->append(bytes, size * count);
  } catch (const std::bad_alloc&) {
    return 0;  // ends the transfer
  }
  return size * count;
}

/// The first line of a server's answer, for people.
std::string reasonIn(const std::string& answer) {
  std::string reason = answer.substr(0, std::min(answer.find('\n'), kLongestReason));
  for (char& byte : reason) {
    byte = static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F ? ' ' : byte;
  }
  return reason;
}

}  // namespace

HttpClient::HttpClient(const std::string& address)
    : _address(address), _curl(curl_easy_init(), curl_easy_cleanup) {
  if (!_curl) {
    throw std::bad_alloc();
  }
  const Url url(curl_url());
  const bool parsed =
      url && curl_url_set(url.get(), CURLUPART_URL, address.c_str(), 0) == CURLUE_OK;
  std::string database = parsed ? part(url, CURLUPART_PATH) : "";
  database.erase(0, 1);
  const bool plain = part(url, CURLUPART_USER).empty() && part(url, CURLUPART_PASSWORD).empty() &&
                     part(url, CURLUPART_QUERY).empty() && part(url, CURLUPART_FRAGMENT).empty();
  if (!parsed || !plain || database.empty() || database.find('/') != std::string::npos) {
    throw std::invalid_argument(
        "a ClickHouse store is http://HOST:PORT/DATABASE, with user and password in "
        "VESPFLEET_USER and VESPFLEET_PASSWORD");
  }
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
  curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "http");
  curl_easy_setopt(curl, CURLOPT_PROXY, "");
  curl_easy_setopt(curl, CURLOPT_CONNECTTIMEOUT, kConnectSeconds);
  curl_easy_setopt(curl, CURLOPT_LOW_SPEED_LIMIT, 1L);
  curl_easy_setopt(curl, CURLOPT_LOW_SPEED_TIME, kSilentSeconds);
  curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, take);
  if (const std::string user = environment("VESPFLEET_USER"); !user.empty()) {
    curl_easy_setopt(curl, CURLOPT_HTTPAUTH, static_cast<long>(CURLAUTH_BASIC));
    curl_easy_setopt(curl, CURLOPT_USERNAME, user.c_str());
    curl_easy_setopt(curl, CURLOPT_PASSWORD, environment("VESPFLEET_PASSWORD").c_str());
  }
}

std::string HttpClient::post(const std::string& query, std::string_view data) {
  CURL* curl = _curl.get();
  std::string url = _url;
  if (!data.empty()) {
    char* escaped = curl_easy_escape(curl, query.c_str(), static_cast<int>(query.size()));
    if (escaped == nullptr) {
      throw std::bad_alloc();
    }
    url.append("&query=").append(escaped);
    curl_free(escaped);
  }
  const std::string_view body = data.empty() ? std::string_view(query) : data;
  std::string answer;
  curl_easy_setopt(curl, CURLOPT_URL, url.c_str());
  curl_easy_setopt(curl, CURLOPT_POSTFIELDS, body.data());
  curl_easy_setopt(curl, CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(body.size()));
  curl_easy_setopt(curl, CURLOPT_WRITEDATA, &answer);
  const CURLcode result = curl_easy_perform(curl);
  if (result != CURLE_OK) {
    throw StoreFailure(_address + ": " + curl_easy_strerror(result));
  }
  long status = 0;
  curl_easy_getinfo(curl, CURLINFO_RESPONSE_CODE, &status);
  if (status != 200) {
    throw StoreFailure(_address + ": " + reasonIn(answer));
  }
  return answer;
}

}  // namespace vesprun
