#include <string_view>

#include "Require.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"

using namespace vesprun;

/// Whatever is read must be written, and read back as the same value.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  std::string error;
  const auto value = readPtree(std::string_view(reinterpret_cast<const char*>(bytes), size), error);
  if (!value) {
    require(error.starts_with("line "), "a refusal names the line", error.c_str());
    return 0;
  }
  std::string document;
  require(writePtree(*value, document, error), "what was read can be written", error.c_str());
  const auto again = readPtree(document, error);
  require(again.has_value(), "what was written can be read", error.c_str());
  // Compared as text, because a NaN equals nothing.
  std::string second;
  require(writePtree(*again, second, error) && second == document, "it is the same value",
          error.c_str());
  return 0;
}
