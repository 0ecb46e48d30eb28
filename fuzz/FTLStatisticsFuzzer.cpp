#include "FieldParser.h"
#include "NANDInfo/parsers/ORUFTLParseBufferToCxt.h"

using namespace vesprun;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  return requireFieldsOf(ORUFTLParseBufferToCxt, "ORUFTLParseBufferToCxt", sizeof(std::uint64_t),
                         bytes, size);
}
