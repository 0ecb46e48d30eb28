#pragma once

#include "platform/MessageDigest.h"

namespace vesprun {

class HostMessageDigest : public MessageDigest {
 public:
  std::array<std::uint8_t, 16> md5(std::string_view bytes) override;
};

}  // namespace vesprun
