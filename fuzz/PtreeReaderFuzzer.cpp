#include <string>

#include "Require.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"

using namespace vesprun;

/// Whatever is read must be written, and read back as the same value.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  std::string error;
  const std::string input(reinterpret_cast<const char*>(bytes), size);
  const auto value = readPtree(input, error);
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
  // A comment keeps documents from being read the short way.
  const auto commented = readPtree(input + "<!---->", error);
  second.clear();
  require(commented && writePtree(*commented, second, error) && second == document,
          "both ways of reading give the same value", error.c_str());
  return 0;
}
