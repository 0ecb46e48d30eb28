#include "ClickHouseSql.h"

#include <span>

#include "common/HexText.h"

namespace vesprun {

std::size_t shareOf(std::string_view key, KeyKind kind) {
  std::uint32_t mixed = 2166136261;  // FNV-1a
  for (const char byte : key) {
    mixed = (mixed ^ static_cast<std::uint8_t>(byte)) * 16777619;
  }
  return (mixed ^ mixed >> 16) % sharesOf(kind);
}

void visitShared(const std::function<void(const std::string& name, const char* type)>& visit) {
  struct Column {
    const char* name;
    const char* type;
  };
  constexpr Column kScalars[] = {{"scalars", "String"}, {"values", "Int64"}};
  constexpr Column kDistributions[] = {{"distributions", "String"}, {"figures", "Float64"},
                                       {"counts", "Int64"},         {"histograms", "UInt8"},
                                       {"labels", "Array(String)"}, {"buckets", "Array(UInt64)"}};
  const auto visitAll = [&](std::span<const Column> columns, std::size_t shares) {
    for (std::size_t share = 0; share < shares; ++share) {
      for (const auto& [name, type] : columns) {
        visit(column(name, share), type);
      }
    }
  };
  visitAll(kScalars, sharesOf(KeyKind::Scalar));
  visitAll(kDistributions, sharesOf(KeyKind::Distribution));
}

std::string hexOf(std::string_view bytes) {
  std::string text;
  for (const char byte : bytes) {
    appendHex(text, static_cast<std::uint8_t>(byte), kUpperHexDigits);
  }
  return text;
}

std::string nameDigest(std::string_view device) {
  const LineDigest digest = digestOf(device);
  return hexOf({reinterpret_cast<const char*>(digest.data()), digest.size()});
}

std::string columnOf(Member by) {
  return by == Member::Build       ? "build"
         : by == Member::Model     ? "model"
         : by == Member::Whitelist ? "whitelist"
                                   : "emptyArrayString()";
}

void requireNoRows(ClickHouseServer& server, const std::string& query) {
  if (server.post("SELECT count() FROM (SELECT 1 FROM (" + query + ") LIMIT 1) FORMAT RowBinary") !=
      std::string(sizeof(std::uint64_t), '\0')) {
    throw StoreFailure(server.address() + ": the server's answer is empty");
  }
}

MemberText readText(PackedReader& row) {
  MemberText text;
  for (std::uint64_t left = row.varint(); left > 0; --left) {
    text = row.text();
  }
  return text;
}

}  // namespace vesprun
