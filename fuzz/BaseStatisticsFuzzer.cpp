#include "ExactCopy.h"
#include "NANDInfo/parsers/ORUParseBufferToCxt.h"
#include "Require.h"

using namespace vesprun;

/// Parsing twice into one context adds the same fields again, and a failure leaves no version.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  const ExactCopy buffer(bytes, size);
  ORUStatsContext ctx;
  const bool result = ORUParseBufferToCxt(ctx, buffer.span());
  require(ctx.driverVersion == -1, "a parse sets the driver version");
  require(result || ctx.exportVersion == 0, "a failed parse leaves no export version");
  require(!result || size >= 8, "a buffer of no word fails");

  const std::size_t count = ctx.fields.size();
  require(ORUParseBufferToCxt(ctx, buffer.span()) == result, "a parse gives the same result again");
  require(ctx.fields.size() == 2 * count, "a parse appends the same fields again");
  std::vector<GenericParserCxt::Field> fields;
  std::size_t repeated = 0;
  ctx.fields.forEach([&](const GenericParserCxt::Field& field) {
    if (fields.size() < count) {
      fields.push_back(field);
      return;
    }
    const GenericParserCxt::Field& first = fields[repeated++];
    require(!field.name.empty() && field.name == first.name, "names are the same again");
    require(field.value == first.value, "values are the same again");
  });
  ORUReleaseContext(ctx);
  require(ctx.fields.empty() && ctx.driverVersion == 0, "a released context is empty");
  return 0;
}
