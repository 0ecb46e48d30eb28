#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "ClickHouseServer.h"
#include "store/FleetStore.h"
#include "store/Varint.h"

namespace vesprun {

// What the sources of `ClickHouseStore` have in common: the tables, and pieces of queries.

inline constexpr std::int32_t kDaysOfPartition = 7;
inline constexpr const char* kLineTable = "vespfleet_report";
inline constexpr const char* kRuleTable = "vespfleet_rule";
inline constexpr const char* kUniqueTable = "vespfleet_unique";

/// How many shares the keys of a kind are spread over. Each costs a load its columns, also where
/// they are empty, and a distribution has six.
constexpr std::size_t sharesOf(KeyKind kind) { return kind == KeyKind::Scalar ? 4 : 2; }
std::size_t shareOf(std::string_view key, KeyKind kind);

/// A column of a share, such as "scalars3".
inline std::string column(const char* name, std::size_t share) {
  return name + std::to_string(share);
}

/// The columns of all shares in their order, with the type of an entry.
void visitShared(const std::function<void(const std::string& name, const char* type)>& visit);

std::string hexOf(std::string_view bytes);

/// A text literal of any bytes.
inline std::string literal(std::string_view text) { return "unhex('" + hexOf(text) + "')"; }

/// All that is kept of the name of a forgotten device.
std::string nameDigest(std::string_view device);

inline std::string within(const DayRange& days) {
  return "day BETWEEN " + std::to_string(days.from) + " AND " + std::to_string(days.to);
}

/// The column of a member: an array of one text, or of none.
std::string columnOf(Member by);

inline const char* keysOf(KeyKind kind) {
  return kind == KeyKind::Scalar ? "scalars" : "distributions";
}

/// The sum of integers in two halves of 32 bits, which cannot overflow.
inline constexpr const char* kHigherSum = "toInt64(sum(bitShiftRight(value, 32)))";
inline constexpr const char* kLowerSum = "toInt64(sum(toInt64(bitAnd(value, 4294967295))))";

MemberText readText(PackedReader& row);

template <typename T>
std::vector<T> readArray(PackedReader& row) {
  std::vector<T> values;
  for (std::uint64_t left = row.varint(); left > 0; --left) {
    if constexpr (std::is_same_v<T, std::string>) {
      values.push_back(row.text());
    } else {
      values.push_back(row.raw<T>());
    }
  }
  return values;
}

/// What a summary may come to; all lines may come to more.
inline constexpr std::uint64_t kMaxAnswer = std::uint64_t{1} << 30;

/// Throws `StoreFailure` where a question whose answer came without rows has some.
void requireNoRows(ClickHouseServer& server, const std::string& query);

/// Reads all rows of an answer in RowBinary by `row`, as they come. What `row` does before it has
/// read its row to the end may be done again.
template <typename Row>
void readRows(ClickHouseServer& server, const std::string& query, const Row& row,
              const SentTable* sent = nullptr, std::uint64_t maxAnswer = kMaxAnswer) {
  constexpr std::size_t kMaxRow = std::size_t{128} << 20;  // a line has at most 16 MiB of text
  std::string rest;
  std::size_t wanted = 0;
  std::uint64_t length = 0;
  server.ask(query + " FORMAT RowBinary", sent, [&](std::string_view piece) {
    rest.append(piece);
    length += piece.size();
    if (rest.size() > kMaxRow || length > maxAnswer) {
      throw StoreFailure(server.address() + ": the server's answer does not fit the question");
    }
    if (rest.size() < wanted) {
      return;
    }
    std::size_t taken = 0;
    try {
      while (taken < rest.size()) {
        PackedReader reader(std::string_view(rest).substr(taken));
        row(reader);
        taken = static_cast<std::size_t>(reader.position() - rest.data());
      }
    } catch (const std::out_of_range&) {
      // The rest of the row is still to come.
    }
    rest.erase(0, taken);
    wanted = 2 * rest.size();  // a long row is not read anew for each piece
  });
  if (length == 0) {
    requireNoRows(server, query);
  }
  try {
    for (PackedReader reader(rest); !reader.atEnd();) {
      row(reader);
    }
  } catch (const std::out_of_range&) {
    throw StoreFailure(server.address() + ": the server's answer is cut");
  }
}

}  // namespace vesprun
