#include <gmock/gmock.h>
#include <cmath>
#include <limits>

#include "support/Documents.h"

namespace vesprun {
namespace {

using ::testing::HasSubstr;

const PropertyDict kEverything{
    {"z", PropertyArray{1, std::uint8_t{255}, -7, std::numeric_limits<std::uint64_t>::max(),
                        std::numeric_limits<std::int64_t>::min()}},
    {"a", PropertyArray{2.0, 0.1, 1e300, -0.0, 123456789012345680.0}},
    {"inf", PropertyArray{std::numeric_limits<double>::infinity(),
                          -std::numeric_limits<double>::infinity()}},
    {"float", PropertyArray{0.25F, 0.1F, 3.4028235e38F}},
    {"bytes", Bytes{1, 2, 3, 4}},
    {"date", Date{1709630102, 500'000'000}},
    {"text", "\"\\\n\xE2\x82\xAC"},
    {"", PropertyArray{true, false, PropertyDict{}, PropertyArray{}}}};

TEST(JsonForm, WritesEveryKindOfValue) {
  EXPECT_EQ(jsonText(kEverything),
            R"({"z":[1,255,-7,18446744073709551615,-9223372036854775808],)"
            R"("a":[2.0,0.1,1e+300,-0.0,1.2345678901234568e+17],)"
            R"("inf":[{"real":"inf"},{"real":"-inf"}],)"
            R"("float":[{"float":0.25},{"float":0.1},{"float":3.4028235e+38}],)"
            R"("bytes":{"data":"AQIDBA=="},"date":{"date":"2024-03-05T09:15:02.5Z"},)"
            "\"text\":\"\\\"\\\\\\n\xE2\x82\xAC\",\"\":[true,false,{},[]]}");
  EXPECT_EQ(jsonText(PropertyValue(std::nan(""))), R"({"real":"nan"})");
  EXPECT_EQ(jsonText(PropertyValue("a\xFFz\n")), "\"a\xEF\xBF\xBDz\\n\"");
  EXPECT_EQ(jsonText(PropertyValue("\b\f\r\t\x7F\x01")), "\"\\b\\f\\r\\t\x7F\\u0001\"");
}

TEST(JsonForm, ReadsBackWhatItWrites) {
  const std::string text = jsonText(kEverything);
  EXPECT_EQ(jsonText(valueOfJson(text)), text);  // also the order, and that a float is one
  const auto kindOf = [](const char* number) { return valueOfJson(number).number()->kind(); };
  EXPECT_EQ(kindOf("18446744073709551615"), NumberKind::UInt64);
  EXPECT_EQ(kindOf("7"), NumberKind::Int64);
  EXPECT_EQ(kindOf("7.0"), NumberKind::Double);
  EXPECT_EQ(kindOf(R"({"float":1})"), NumberKind::Float);
}

TEST(JsonForm, TakesObjectsForDictionariesUnlessTheyAreOneOfTheFour) {
  for (const char* text : {R"({"real":1.5})", R"({"data":[1]})", R"({"date":{"date":{}}})",
                           R"({"data":"AQ==","date":"x"})", R"({"float":"x"})"}) {
    const PropertyValue value = valueOfJson(text);
    EXPECT_EQ(jsonText(value), text);
    EXPECT_NE(value.dict(), nullptr) << text;
  }
}

TEST(JsonForm, NamesWhatItRefuses) {
  const std::pair<std::string, const char*> cases[] = {
      {"", "line 1, column 1"},
      {"{\"a\":1,\n x}", "line 2, column 2"},
      {"[1] 2", "line 1, column 5"},
      {"\"\xFF\"", "UTF-8"},
      {"{\"a\":[1,null]}", "\"a\" > [1]: null"},
      {"[18446744073709551616]", "[0]: the integer 18446744073709551616 does not fit 64 bits"},
      {"-9223372036854775809", "does not fit"},
      {"{\"a\":[1e999]}", "\"a\" > [0]: number overflow"},
      {R"([{"a":1,"a":2,"b":3}])", "[0] > \"a\": there twice"},
      {R"({"a":{"real":"Inf"}})",
       "\"a\": a \"real\" of \"Inf\" instead of \"inf\", \"-inf\" or \"nan\""},
      {R"([{"data":"A"}])", "[0]: \"A\" is not base64"},
      {R"({"date":"today"})", "\"today\" is not a date"},
      {R"({"float":1e39})", "a \"float\" that single precision cannot hold"},
      {std::string(201, '[') + std::string(201, ']'),
       "[0] > [0] > [0] > [0] > [0] > [0] > [0] > [0] > \xE2\x80\xA6: nested deeper than 200"},
      {std::string(1'000'000, '['), "nested deeper than 200 levels"}};
  for (const auto& [text, message] : cases) {
    std::string error;
    EXPECT_FALSE(valueFromJsonText(text, error)) << text.substr(0, 50);
    EXPECT_THAT(error, HasSubstr(message));
  }
  valueOfJson(std::string(200, '[') + std::string(200, ']'));
}

}  // namespace
}  // namespace vesprun
