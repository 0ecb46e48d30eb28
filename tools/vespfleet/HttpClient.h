#pragma once

#include <memory>
#include <string>
#include <string_view>

namespace vesprun {

/// Posts to one ClickHouse server. User and password come from `VESPFLEET_USER` and
/// `VESPFLEET_PASSWORD`. A server that does not answer is given up after 10 seconds, one that falls
/// silent after five minutes.
class HttpClient {
 public:
  /// `address` is "http://HOST:PORT/DATABASE". Throws `std::invalid_argument` for another form, and
  /// for one that holds a user or password.
  explicit HttpClient(const std::string& address);

  /// Runs `query`, which inserts `data` if there is any, and returns what the server answers.
  /// Throws `StoreFailure` with the server's reason.
  std::string post(const std::string& query, std::string_view data = {});

 private:
  std::string _address;
  std::string _url;
  std::unique_ptr<void, void (*)(void*)> _curl;
};

}  // namespace vesprun
