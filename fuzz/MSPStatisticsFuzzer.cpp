#include "FieldParser.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"

using namespace vesprun;

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  return requireFieldsOf(ORUMSPParseBufferToCxt, "ORUMSPParseBufferToCxt: ", sizeof(std::uint32_t),
                         bytes, size);
}
