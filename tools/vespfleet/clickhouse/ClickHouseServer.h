#pragma once

#include <string>
#include <string_view>

#include "exchange/HttpClient.h"

namespace vesprun {

/// A table that is sent with a question, in RowBinary.
struct SentTable {
  std::string name;
  std::string structure;  ///< its columns
  std::string rows;
};

/// Posts to one ClickHouse server. User and password come from `VESPFLEET_USER` and
/// `VESPFLEET_PASSWORD`, else from the line USER:PASSWORD of the file `VESPFLEET_CREDENTIALS`;
/// certificates are verified against `VESPFLEET_CA`, else the system's authorities. A server that
/// does not answer is given up after 10 seconds, one that falls silent after five minutes.
class ClickHouseServer {
 public:
  /// What is wrong with an address, which is "http://HOST:PORT/DATABASE" or "https://..." and holds
  /// no user or password; empty when nothing is.
  static std::string faultOf(const std::string& address);

  /// `address` must have no fault.
  explicit ClickHouseServer(const std::string& address);

  const std::string& address() const { return _address; }

  /// Adds a setting to all further queries.
  void set(const std::string& setting);

  /// Runs `query`, which inserts `data` if there is any, and returns what the server answers.
  /// Throws `StoreFailure` with the server's reason.
  std::string post(const std::string& query, std::string_view data = {});

  /// The same for a question with a long answer, whose pieces `take` gets as they come.
  void ask(const std::string& question, const SentTable* sent, const HttpClient::TakePiece& take);

 private:
  void perform(const std::string& arguments, std::string_view body,
               const HttpClient::TakePiece& take, const std::string& contentType = "text/plain");

  std::string _address;
  std::string _url;
  HttpClient _client;
};

}  // namespace vesprun
