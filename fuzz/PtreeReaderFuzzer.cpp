#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "platform/host/PtreeReader.h"
#include "platform/host/PtreeWriter.h"

namespace {

void require(bool condition, const char* expectation, const std::string& error) {
  if (!condition) {
    std::fprintf(stderr, "not so: %s (%s)\n", expectation, error.c_str());
    std::abort();
  }
}

}  // namespace

/// Whatever is read must be written, and read back as the same value.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  std::string error;
  const auto value =
      vesprun::readPtree(std::string_view(reinterpret_cast<const char*>(bytes), size), error);
  if (!value) {
    require(error.starts_with("line "), "a refusal names the line", error);
    return 0;
  }
  std::string document;
  require(vesprun::writePtree(*value, document, error), "what was read can be written", error);
  const auto again = vesprun::readPtree(document, error);
  require(again.has_value(), "what was written can be read", error);
  // Compared as text, because a NaN equals nothing.
  std::string second;
  require(vesprun::writePtree(*again, second, error) && second == document, "it is the same value",
          error);
  return 0;
}
