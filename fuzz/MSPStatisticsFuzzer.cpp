#include "ExactCopy.h"
#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/parsers/ORUMSPParseBufferToCxt.h"
#include "Require.h"

using namespace vesprun;

/// What is taken is appended, each field from at least four bytes of its own.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const ExactCopy buffer(bytes, size);
  forgetAPIErrorMessage();
  GenericParserCxt ctx;
  const std::uint32_t taken = ORUMSPParseBufferToCxt(ctx, buffer.span());
  require(taken == ctx.size(), "fields taken are fields appended");
  require(std::size_t{taken} * sizeof(std::uint32_t) <= size, "no field comes out of nothing");

  const std::string error = GetAPIErrorMessage();
  require(error == "NA" || error.starts_with("ORUMSPParseBufferToCxt: "),
          "an error names its parser", error.c_str());
  require(CreateDictFromCxt(ctx).size() <= ctx.size(), "a dictionary has no more than the fields");
  return 0;
}
