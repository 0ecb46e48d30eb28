#pragma once

#include <chrono>
#include <functional>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// A request without an answer, and why.
class HttpFailure : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// An address that begins with "http://" or "https://".
struct WebAddress {
  std::string server;    ///< "https://HOST:PORT", as written
  std::string path;      ///< decoded, with its first slash
  bool isPlain = false;  ///< without user, password, query and fragment
};

/// Nothing for any other text.
std::optional<WebAddress> parseWebAddress(const std::string& text);

/// The text as a part of an address.
std::string escapedInAddress(std::string_view text);

/// Sends requests to servers, whose certificates are verified. No redirect is followed, so that
/// credentials go nowhere else. A server that cannot be reached is given up after 10 seconds.
class HttpClient {
 public:
  struct Settings {
    std::string authorities;  ///< a file of certificates; empty: the system's
    std::string user;
    std::string password;
    std::vector<std::string> headers;  ///< "NAME: VALUE"
    /// After which a transfer that stands still is given up.
    std::chrono::seconds longestSilence{300};
    /// After which the answer must be whole, once the request is sent.
    std::optional<std::chrono::seconds> longestAnswer;
  };
  /// Throws `HttpFailure` when the authorities cannot be read.
  explicit HttpClient(const Settings& settings);

  struct Answer {
    long status = 0;
    std::string reason;  ///< for people: the first line of an answer that is an error
  };

  // Both throw `HttpFailure`.

  /// `take` gets what comes with the status 200, in pieces. `contentType` says what `body` is.
  using TakePiece = std::function<void(std::string_view piece)>;
  Answer post(const std::string& url, std::string_view body, const TakePiece& take,
              const std::string& contentType = "text/plain");

  /// An answer may be cut behind its headers: the server has decided then.
  Answer put(const std::string& url, std::string_view body);

 private:
  struct Transfer;

  /// False, with a text in `failure`, when the answer was not received to its end.
  bool perform(const std::string& url, const char* method, std::string_view body,
               Transfer& transfer, std::string& failure);

  std::optional<std::chrono::seconds> _longestAnswer;
  std::unique_ptr<void, void (*)(void*)> _curl;
  using Headers = std::unique_ptr<void, void (*)(void*)>;
  static void append(Headers& headers, const std::string& header);
  Headers _headers;
};

}  // namespace vesprun
