#include "exchange/HttpClient.h"

#include <curl/curl.h>
#include <dlfcn.h>

#include <algorithm>
#include <array>
#include <exception>
#include <new>

#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

using SteadyClock = std::chrono::steady_clock;

constexpr long kConnectSeconds = 10;
constexpr std::size_t kMaxReason = 300;

/// The functions of libcurl, which is loaded when the first request is made: that takes longer than
/// most commands do.
class Curl {
 public:
  static const Curl& get() {
    static const Curl loaded;
    return loaded;
  }

 private:
  struct Symbol {
    void* address;
    template <typename Function>
    operator Function*() const {  // NOLINT(google-explicit-constructor)
      return reinterpret_cast<Function*>(address);
    }
  };

  Symbol find(const char* name) const {
    void* const address = _library != nullptr ? dlsym(_library, name) : nullptr;
    if (address == nullptr) {
      throw HttpFailure(dlerror());
    }
    return {address};
  }

  void* _library = dlopen("libcurl.so.4", RTLD_NOW | RTLD_LOCAL);

 public:
  decltype(&curl_easy_init) init = find("curl_easy_init");
  decltype(&curl_easy_cleanup) cleanup = find("curl_easy_cleanup");
  decltype(&curl_easy_setopt) set = find("curl_easy_setopt");
  decltype(&curl_easy_perform) perform = find("curl_easy_perform");
  decltype(&curl_easy_getinfo) getInfo = find("curl_easy_getinfo");
  decltype(&curl_easy_strerror) errorText = find("curl_easy_strerror");
  decltype(&curl_easy_escape) escape = find("curl_easy_escape");
  decltype(&curl_free) free = find("curl_free");
  decltype(&curl_slist_append) append = find("curl_slist_append");
  decltype(&curl_slist_free_all) freeList = find("curl_slist_free_all");
  decltype(&curl_url) url = find("curl_url");
  decltype(&curl_url_cleanup) freeUrl = find("curl_url_cleanup");
  decltype(&curl_url_set) setUrl = find("curl_url_set");
  decltype(&curl_url_get) getUrl = find("curl_url_get");
};

std::string takenText(char* text) {
  if (text == nullptr) {
    throw std::bad_alloc();
  }
  std::string taken = text;
  Curl::get().free(text);
  return taken;
}

/// The first line of a server's answer, for people.
std::string firstLine(const std::string& answer) {
  std::string line = answer.substr(0, std::min(answer.find('\n'), kMaxReason));
  for (char& byte : line) {
    byte = static_cast<unsigned char>(byte) < 0x20 || byte == 0x7F ? ' ' : byte;
  }
  return line;
}

}  // namespace

std::optional<WebAddress> parseWebAddress(const std::string& text) {
  const Curl& curl = Curl::get();
  const std::unique_ptr<CURLU, decltype(curl.freeUrl)> url(curl.url(), curl.freeUrl);
  if (!text.starts_with("http://") && !text.starts_with("https://")) {
    return std::nullopt;
  }
  if (!url || curl.setUrl(url.get(), CURLUPART_URL, text.c_str(), 0) != CURLUE_OK) {
    return std::nullopt;
  }
  const auto part = [&](CURLUPart which, unsigned flags) {
    char* found = nullptr;
    return curl.getUrl(url.get(), which, &found, flags) == CURLUE_OK ? takenText(found) : "";
  };
  WebAddress address;
  address.path = part(CURLUPART_PATH, CURLU_URLDECODE);
  address.isPlain = part(CURLUPART_USER, 0).empty() && part(CURLUPART_PASSWORD, 0).empty() &&
                    part(CURLUPART_QUERY, 0).empty() && part(CURLUPART_FRAGMENT, 0).empty();
  curl.setUrl(url.get(), CURLUPART_PATH, "/", 0);
  curl.setUrl(url.get(), CURLUPART_QUERY, nullptr, 0);
  curl.setUrl(url.get(), CURLUPART_FRAGMENT, nullptr, 0);
  address.server = part(CURLUPART_URL, 0);
  address.server.resize(address.server.find_last_not_of('/') + 1);
  return address;
}

std::string escapedInAddress(std::string_view text) {
  return text.empty()
             ? ""
             : takenText(Curl::get().escape(nullptr, text.data(), static_cast<int>(text.size())));
}

/// A request under way.
struct HttpClient::Transfer {
  const TakePiece* take = nullptr;
  std::optional<std::chrono::seconds> longestAnswer;
  void* curl = nullptr;
  Answer answer;         ///< its status once all headers are there
  std::size_t size = 0;  ///< of an answer that nobody takes
  std::exception_ptr thrown;
  std::optional<SteadyClock::time_point> sentAt;

  long status() const {
    long found = 0;
    Curl::get().getInfo(curl, CURLINFO_RESPONSE_CODE, &found);
    return found;
  }

  static std::size_t takeHeader(const char* bytes, std::size_t size, std::size_t count,
                                void* given) {
    Transfer& transfer = *static_cast<Transfer*>(given);
    const std::string_view line(bytes, size * count);
    const long status = transfer.status();
    if ((line == "\r\n" || line == "\n") && status >= 200) {
      transfer.answer.status = status;
    }
    return size * count;
  }

  static std::size_t takePiece(const char* bytes, std::size_t size, std::size_t count,
                               void* given) {
    constexpr std::size_t kMaxIgnored = 65'536;
    Transfer& transfer = *static_cast<Transfer*>(given);
    try {
      if (transfer.take != nullptr && transfer.answer.status == 200) {
        (*transfer.take)({bytes, size * count});
        return size * count;
      }
      if (transfer.answer.reason.size() < kMaxReason) {
        transfer.answer.reason.append(bytes, std::min(size * count, kMaxReason));
      }
    } catch (...) {
      transfer.thrown = std::current_exception();
      return 0;  // ends the transfer
    }
    transfer.size += size * count;
    return transfer.size <= kMaxIgnored ? size * count : 0;
  }

  static int watch(void* given, curl_off_t, curl_off_t, curl_off_t total, curl_off_t sent) {
    Transfer& transfer = *static_cast<Transfer*>(given);
    if (!transfer.longestAnswer || sent < total) {
      transfer.sentAt.reset();
      return 0;
    }
    const SteadyClock::time_point now = SteadyClock::now();
    transfer.sentAt = transfer.sentAt.value_or(now);
    return now - *transfer.sentAt > *transfer.longestAnswer ? 1 : 0;
  }
};

HttpClient::HttpClient(const Settings& settings)
    : _longestAnswer(settings.longestAnswer),
      _curl(Curl::get().init(), [](void* curl) { Curl::get().cleanup(curl); }),
      _headers(nullptr, [](void* list) { Curl::get().freeList(static_cast<curl_slist*>(list)); }) {
  if (!_curl) {
    throw std::bad_alloc();
  }
  const auto set = [this](CURLoption option, auto value) {
    Curl::get().set(_curl.get(), option, value);
  };
  set(CURLOPT_NOSIGNAL, 1L);
  set(CURLOPT_PROTOCOLS_STR, "http,https");
  set(CURLOPT_PROXY, "");
  set(CURLOPT_CONNECTTIMEOUT, kConnectSeconds);
  set(CURLOPT_LOW_SPEED_LIMIT, 1L);
  set(CURLOPT_LOW_SPEED_TIME, static_cast<long>(settings.longestSilence.count()));
  set(CURLOPT_NOPROGRESS, 0L);
  set(CURLOPT_XFERINFOFUNCTION, &Transfer::watch);
  set(CURLOPT_HEADERFUNCTION, &Transfer::takeHeader);
  set(CURLOPT_WRITEFUNCTION, &Transfer::takePiece);
  if (!settings.authorities.empty()) {
    std::string error;
    std::optional<std::string> text = readWholeFile(settings.authorities, error);
    if (!text) {
      throw HttpFailure(error);
    }
    curl_blob authorities{text->data(), text->size(), CURL_BLOB_COPY};
    set(CURLOPT_CAINFO_BLOB, &authorities);
    set(CURLOPT_CAPATH, static_cast<const char*>(nullptr));
  }
  if (!settings.user.empty()) {
    set(CURLOPT_HTTPAUTH, static_cast<long>(CURLAUTH_BASIC));
    set(CURLOPT_USERNAME, settings.user.c_str());
    set(CURLOPT_PASSWORD, settings.password.c_str());
  }
  for (const std::string& header : settings.headers) {
    append(_headers, header);
  }
  set(CURLOPT_HTTPHEADER, static_cast<curl_slist*>(_headers.get()));
}

void HttpClient::append(Headers& headers, const std::string& header) {
  curl_slist* const longer =
      Curl::get().append(static_cast<curl_slist*>(headers.get()), header.c_str());
  if (longer == nullptr) {
    throw std::bad_alloc();
  }
  static_cast<void>(headers.release());
  headers.reset(longer);
}

bool HttpClient::perform(const std::string& url, const char* method, std::string_view body,
                         Transfer& transfer, std::string& failure) {
  const auto set = [this](CURLoption option, auto value) {
    Curl::get().set(_curl.get(), option, value);
  };
  transfer.curl = _curl.get();
  transfer.longestAnswer = _longestAnswer;
  set(CURLOPT_URL, url.c_str());
  set(CURLOPT_POSTFIELDS, body.data());
  set(CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(body.size()));
  set(CURLOPT_CUSTOMREQUEST, method);
  set(CURLOPT_XFERINFODATA, &transfer);
  set(CURLOPT_HEADERDATA, &transfer);
  set(CURLOPT_WRITEDATA, &transfer);
  std::array<char, CURL_ERROR_SIZE> detail{};
  set(CURLOPT_ERRORBUFFER, detail.data());
  const CURLcode result = Curl::get().perform(_curl.get());
  set(CURLOPT_ERRORBUFFER, static_cast<char*>(nullptr));
  if (transfer.thrown) {
    std::rethrow_exception(transfer.thrown);
  }
  transfer.answer.reason = firstLine(transfer.answer.reason);
  // Of a certificate only the detail says what is wrong: its name, its time, who vouches for it.
  failure = result == CURLE_ABORTED_BY_CALLBACK ? "it does not come to an end with its answer"
            : result == CURLE_PEER_FAILED_VERIFICATION && detail[0] != 0
                ? detail.data()
                : Curl::get().errorText(result);
  return result == CURLE_OK;
}

HttpClient::Answer HttpClient::post(const std::string& url, std::string_view body,
                                    const TakePiece& take, const std::string& contentType) {
  Headers headers(nullptr, _headers.get_deleter());
  append(headers, "Content-Type: " + contentType);
  Transfer transfer;
  transfer.take = &take;
  std::string failure;
  Curl::get().set(_curl.get(), CURLOPT_HTTPHEADER, static_cast<curl_slist*>(headers.get()));
  const bool isWhole = perform(url, "POST", body, transfer, failure);
  Curl::get().set(_curl.get(), CURLOPT_HTTPHEADER, static_cast<curl_slist*>(_headers.get()));
  if (!isWhole) {
    throw HttpFailure(failure);
  }
  return std::move(transfer.answer);
}

HttpClient::Answer HttpClient::put(const std::string& url, std::string_view body) {
  Transfer transfer;
  std::string failure;
  const bool isWhole = perform(url, "PUT", body, transfer, failure);
  if (transfer.answer.status == 0) {
    throw HttpFailure(isWhole ? "the answer breaks off in its headers" : failure);
  }
  return std::move(transfer.answer);
}

}  // namespace vesprun
