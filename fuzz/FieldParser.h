#pragma once

#include <cstddef>
#include <cstdint>

#include "ExactCopy.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/GenericParserCxt.h"
#include "NANDInfo/sets/FilteredDict.h"
#include "NANDInfo/tables/FieldSets.h"
#include "Require.h"
#include "common/ProcessState.h"

namespace vesprun {

/// What every parser of fields keeps to: what is taken is appended, each field from an element of
/// its own, of `width` bytes at least, and an error begins with the parser's `name`.
template <typename Parser>
int requireFieldsOf(Parser parse, const char* name, std::size_t width, const std::uint8_t* bytes,
                    std::size_t size) {
  const ExactCopy buffer(bytes, size);
  ProcessState::startAfresh();
  GenericParserCxt ctx;
  const std::uint32_t taken = parse(ctx, buffer.span());
  require(taken == ctx.size(), "fields taken are fields appended");
  require(taken * width <= size, "no field comes out of nothing");

  const std::string error = GetAPIErrorMessage();
  require(error == "NA" || error.starts_with(name), "an error names its parser", error.c_str());
  const PropertyDict all = CreateDictFromCxt(ctx);
  require(all.size() <= ctx.size(), "a dictionary has no more than the fields");
  const FieldTable* const digits = &WhitelistedRawNANDFTLCounters_SigDigDict;
  require(
      CreateFilteredDict_SigDig(ctx, digits, true) == CreateFilteredDict_SigDig(all, digits, true),
      "fields are filtered as their dictionary is");
  return 0;
}

}  // namespace vesprun
