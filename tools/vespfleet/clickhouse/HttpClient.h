#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>

namespace vesprun {

/// Posts to one ClickHouse server. User and password come from `VESPFLEET_USER` and
/// `VESPFLEET_PASSWORD`, else from the line USER:PASSWORD of the file `VESPFLEET_CREDENTIALS`;
/// certificates are verified against `VESPFLEET_CA`, else the system's authorities. A server that
/// does not answer is given up after 10 seconds, one that falls silent after five minutes.
class HttpClient {
 public:
  /// What is wrong with an address, which is "http://HOST:PORT/DATABASE" or "https://..." and holds
  /// no user or password; empty when nothing is.
  static std::string faultOf(const std::string& address);

  /// `address` must have no fault.
  explicit HttpClient(const std::string& address);

  /// Runs `query`, which inserts `data` if there is any, and returns what the server answers.
  /// Throws `StoreFailure` with the server's reason.
  std::string post(const std::string& query, std::string_view data = {});

  /// The same for a query with a long answer, whose pieces `take` gets as they come.
  using TakePiece = std::function<void(std::string_view piece)>;
  void post(const std::string& query, std::string_view data, const TakePiece& take);

 private:
  std::string _address;
  std::string _url;
  std::unique_ptr<void, void (*)(void*)> _curl;
};

}  // namespace vesprun
