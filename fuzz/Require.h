#pragma once

#include <cstdio>
#include <cstdlib>

namespace vesprun {

/// Ends the run, so that the fuzzer keeps the input, when what must hold does not.
inline void require(bool condition, const char* expectation, const char* detail = "") {
  if (!condition) {
    std::fprintf(stderr, "not so: %s %s\n", expectation, detail);
    std::abort();
  }
}

}  // namespace vesprun
