#include "platform/host/device/Pseudonym.h"

#include <sha2.h>

#include <array>
#include <cstdint>
#include <span>

#include "common/TextForm.h"

namespace vesprun {
namespace {

using Digest = std::array<std::uint8_t, SHA256_DIGEST_LENGTH>;

Digest sha256(std::string_view bytes) {
  SHA2_CTX context;
  SHA256Init(&context);
  SHA256Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
  Digest digest{};
  SHA256Final(digest.data(), &context);
  return digest;
}

std::string bytesOf(const Digest& digest) {
  return {reinterpret_cast<const char*>(digest.data()), digest.size()};
}

/// HMAC-SHA-256 (RFC 2104).
Digest authenticationCode(std::string_view key, std::string_view message) {
  std::string block = key.size() > SHA256_BLOCK_LENGTH ? bytesOf(sha256(key)) : std::string(key);
  block.resize(SHA256_BLOCK_LENGTH, '\0');
  std::string inner = block;
  for (std::size_t i = 0; i < block.size(); ++i) {
    inner[i] = static_cast<char>(inner[i] ^ 0x36);
    block[i] = static_cast<char>(block[i] ^ 0x5C);
  }
  return sha256(block + bytesOf(sha256(inner.append(message))));
}

}  // namespace

std::string pseudonymOf(std::string_view identifier, std::string_view purpose) {
  const Digest code = authenticationCode(identifier, purpose);
  constexpr std::size_t kBytes = 16;
  return hexadecimalText(std::span(code).first(kBytes));
}

}  // namespace vesprun
