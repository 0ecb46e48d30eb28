#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>

namespace vesprun {

/// The hash of keys that others choose. It multiplies by a random number of each process, so that
/// nobody can send keys that collide.
class KeyHash {
 public:
  using is_transparent = void;

  std::size_t operator()(std::string_view key) const {
    const Secret& secret = secretOfProcess();
    std::uint64_t hash = key.size();
    std::uint64_t word = 0;
    for (std::size_t at = 0; at + kWordSize < key.size(); at += kWordSize) {
      std::memcpy(&word, key.data() + at, kWordSize);
      hash = mix(hash ^ word, secret);
    }
    if (key.size() >= kWordSize) {
      std::memcpy(&word, key.data() + key.size() - kWordSize, kWordSize);
    } else {
      key.copy(reinterpret_cast<char*>(&word), kWordSize);
    }
    return static_cast<std::size_t>(mix(hash ^ word, secret));
  }

 private:
  struct Secret {
    std::uint64_t mask;
    std::uint64_t factor;  ///< odd
  };

  static constexpr std::size_t kWordSize = sizeof(std::uint64_t);

  // Both halves of the product: without the factor, nobody knows which inputs give the same.
  static std::uint64_t mix(std::uint64_t value, const Secret& secret) {
    __extension__ using Product = unsigned __int128;
    const Product product = Product{value ^ secret.mask} * secret.factor;
    return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
  }

  // Made by the first use: static dictionaries are filled before other static objects are there.
  static const Secret& secretOfProcess() {
    static const Secret kSecret{randomNumber(), randomNumber() | 1};
    return kSecret;
  }
  static std::uint64_t randomNumber();
};

}  // namespace vesprun
