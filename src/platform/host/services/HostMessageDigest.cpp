#include "platform/host/services/HostMessageDigest.h"

#include <md5.h>

namespace vesprun {

std::array<std::uint8_t, 16> HostMessageDigest::md5(std::string_view bytes) {
  MD5_CTX context;
  MD5Init(&context);
  MD5Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
  std::array<std::uint8_t, 16> digest{};
  MD5Final(digest.data(), &context);
  return digest;
}

}  // namespace vesprun
