#include "ClickHouseSql.h"

#include "common/HexText.h"

namespace vesprun {

int shareOf(std::string_view key) {
  std::uint32_t mixed = 2166136261;  // FNV-1a
  for (const char byte : key) {
    mixed = (mixed ^ static_cast<std::uint8_t>(byte)) * 16777619;
  }
  return static_cast<int>((mixed ^ mixed >> 16) % kShares);
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
