#include "NANDInfo/parsers/GenericParserCxt.h"

#include <gmock/gmock.h>

#include "FieldsOf.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/structuredlog/TelemetryList.h"
#include "common/ProcessState.h"
#include "platform/DictionaryHelpers.h"

namespace vesprun {
namespace {

using ::testing::IsEmpty;

constexpr std::uint8_t kBytes[] = {1, 0, 0, 0, 2, 0, 0, 0, 0xFF, 0xFF, 0xFF, 0xFF, 0x80};

TEST(GenericParserCxt, NamesElementsAndWidensThem) {
  const std::tuple<const char*, std::uint32_t, std::uint32_t, bool, Fields> cases[] = {
      {"bin", 4, 3, true, {{"bin0", 1}, {"bin1", 2}, {"bin2", 4294967295}}},
      {"x_", 4, 1, true, {{"x_", 1}}},
      {"odd", 3, 2, true, {{"odd0", 1}, {"odd1", 0x200}}},
      {"all", 8, 1, true, {{"all", 0x200000001}}},
      {"wide", 9, 2, false, {}},
      {"none", 0, 70'000, true, {}},
      {"none", 9, 0, true, {}}};
  for (const auto& [name, width, count, result, fields] : cases) {
    GenericParserCxt ctx;
    EXPECT_EQ(AddMultipleFieldsToGenericContext(ctx, name, kBytes, width, count), result) << name;
    EXPECT_EQ(fieldsOf(ctx), fields) << name;
  }
}

TEST(GenericParserCxt, RefusesWhatOneCallCannotTake) {
  const Bytes bytes(65'536);
  GenericParserCxt ctx;
  EXPECT_FALSE(AddMultipleFieldsToGenericContext(ctx, "n", bytes.data(), 1, 65'536));
  EXPECT_TRUE(ctx.empty());
  EXPECT_TRUE(AddMultipleFieldsToGenericContext(ctx, "n", bytes.data(), 1, 65'535));
  ASSERT_EQ(ctx.size(), 65'535U);
  EXPECT_EQ(fieldsOf(ctx).back().first, "n65534");
}

TEST(GenericParserCxt, CutsNamesAt98Characters) {
  const std::string prefix(97, 'p');
  GenericParserCxt ctx;
  EXPECT_TRUE(AddSingleValueToGenericContext(ctx, prefix, "suffix", 1));
  EXPECT_TRUE(AddMultipleFieldsToGenericContext(ctx, prefix, kBytes, 1, 12));
  EXPECT_TRUE(AddMultipleFieldsToGenericContext(ctx, std::string(120, 'q'), kBytes, 1, 2));
  const Fields fields = fieldsOf(ctx);
  EXPECT_EQ(fields[0].first, prefix + "s");
  EXPECT_EQ(fields[12].first, prefix + "1");  // index 11
  EXPECT_EQ(fields[14].first, std::string(98, 'q'));
}

constexpr auto kFilterRanges = std::to_array<FieldRange>({"b", "c"});
constexpr FieldTable kFilter = fieldTable<kFilterRanges>();

TEST(GenericParserCxt, KeepsOrderAndRepeatsUntilReleased) {
  GenericParserCxt ctx;
  EXPECT_THAT(CreateDictFromCxt(ctx), IsEmpty());
  AddSingleValueToGenericContext(ctx, "a", "1", 18446744073709551615U);
  AddSingleValueToGenericContext(ctx, "", "b", 2);
  AddSingleValueToGenericContext(ctx, "a1", "", 3);
  EXPECT_EQ(fieldsOf(ctx), (Fields{{"a1", 18446744073709551615U}, {"b", 2}, {"a1", 3}}));
  const PropertyDict dict = CreateDictFromCxt(ctx);
  EXPECT_EQ(dict, (PropertyDict{{"a1", 3}, {"b", 2}}));
  EXPECT_EQ(dict.find("b")->number()->kind(), NumberKind::UInt64);
  EXPECT_EQ(CreateDictFromCxt(ctx, &kFilter), (PropertyDict{{"b", 2}}));
  ReleaseGenericParserCxt(ctx);
  ReleaseGenericParserCxt(ctx);
  EXPECT_TRUE(ctx.empty());
  AddSingleValueToGenericContext(ctx, "", "again", 4);
  EXPECT_EQ(fieldsOf(ctx), (Fields{{"again", 4}}));
}

TEST(DictionaryHelpers, FallBackAndKeepTheirKinds) {
  PropertyDict dict{{"n", 7}};
  EXPECT_EQ(GetNumberFromDictionarySafe(dict, "n"), PropertyValue(7));
  EXPECT_EQ(GetNumberFromDictionarySafe(dict, "no"), PropertyValue(0));

  PropertyArray array;
  setNumberValueForType(dict, "n", std::int8_t{-2});
  setNumberValueForType(dict, "int", std::int32_t{-2});
  appendNumberValueForType(array, 0.5);
  EXPECT_EQ(dict, (PropertyDict{{"n", -2}, {"int", -2}}));
  EXPECT_EQ(dict.find("n")->number()->kind(), NumberKind::Int8);
  EXPECT_EQ(dict.find("int")->number()->kind(), NumberKind::Int32);
  EXPECT_EQ(array, PropertyArray{0.5});
}

TEST(HexText, ReadsPairsFromTheLeft) {
  EXPECT_EQ(hexStringToInt32("12345678", 8), 0x12345678U);
  EXPECT_EQ(hexStringToInt32("a5", 2), 0xA5U);
  EXPECT_EQ(hexStringToInt32("123", 3), 0x1203U);
  EXPECT_EQ(hexStringToInt32("12345", 5), 0x123405U);
  EXPECT_EQ(hexStringToInt32("0045", 4), 0x45U);
  EXPECT_EQ(hexStringToInt32("FfeEdD0099", 10), 0xFFEEDD00U);
  EXPECT_EQ(hexStringToInt32("12", 8), 0x12U);  // no further than the text
  EXPECT_EQ(hexStringToInt32("12", 0), 0U);
  EXPECT_EQ(hexStringToByte("ABC", 9), 0xAB);
  EXPECT_EQ(hexStringToByte("9", 1), 9);
  ::testing::internal::CaptureStdout();
  EXPECT_EQ(hexStringToByte("g1", 2), 0x01);
  EXPECT_EQ(::testing::internal::GetCapturedStdout(), "unrecognized hex character: g");
}

TEST(APIErrorMessage, KeepsTheFirstTextCutAt1023Bytes) {
  ProcessState::startAfresh();
  EXPECT_EQ(GetAPIErrorMessage(), "NA");
  SetAPIErrorMessage("open: %s failed with 0x%x", "controller", 0xE00002C2U);
  SetAPIErrorMessage("second");
  EXPECT_EQ(GetAPIErrorMessage(), "open: controller failed with 0xe00002c2");

  ProcessState::startAfresh();
  SetAPIErrorMessage("%s", std::string(1023, 'x').append("yz").c_str());
  EXPECT_EQ(GetAPIErrorMessage(), std::string(1023, 'x'));

  ProcessState::startAfresh();
  SetAPIErrorMessage("%s", "");
  SetAPIErrorMessage("second");
  EXPECT_EQ(GetAPIErrorMessage(), "");
  ProcessState::startAfresh();
}

}  // namespace
}  // namespace vesprun
