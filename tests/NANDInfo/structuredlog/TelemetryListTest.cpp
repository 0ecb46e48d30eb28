#include "NANDInfo/structuredlog/TelemetryList.h"

#include "buffers/DeviceBuffers.h"
#include "common/TextForm.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

PropertyDict characteristics(PropertyValue chip, PropertyValue manufacturer, PropertyValue buses) {
  return {{"chip-id", std::move(chip)},
          {"manufacturer-id", std::move(manufacturer)},
          {"num-bus", std::move(buses)}};
}

TEST(TelemetryList, PicksTheLayoutByChipAndManufacturer) {
  // Number of entries, then readStage[8] and readStage[19], then the last key.
  const std::string sandisk = "127 265 301 readStage19NumOfErrorsBin[11]";
  const std::string hynix = "127 263 297 readStage19NumOfErrorsBin[11]";
  const std::string other = "127 265 303 readStage19NumOfErrorsBin[11]";
  const std::string cases[][3] = {{"KX3", "4582603A5700", "135 8 37 algoNANDAccessesBin[7]"},
                                  {"KX4", "AD8252232100", "175 0 27 retentionIndication[11]"},
                                  {"KX31", "4582603A5700", sandisk},
                                  {"kx4", "458260de57FF", sandisk},
                                  {"", "AD8252232100", hynix},
                                  {"KX3 ", "AD82522321A5", hynix},
                                  {"other", "AD8252232200", other},
                                  {"other", "4582603A57", other},
                                  {"other", "45", other},
                                  {"other", "", other}};
  TestDevice device;
  std::size_t number = 0;
  for (const auto& [chip, manufacturer, expected] : cases) {
    const PropertyValue dictionary = characteristics(chip, manufacturer, 1);
    ASSERT_TRUE(LogNANDTelemetryList(telemetryList(1), &dictionary, "ORUStorage"));
    const PropertyDict line = device.lines("records.jsonl").at(number++);
    const PropertyDict& record = *line.find("record")->dict();
    EXPECT_EQ(std::to_string(record.size()) + ' ' + textForm(*record.find("readStage[8]")) + ' ' +
                  textForm(*record.find("readStage[19]")) + ' ' + (record.end() - 1)->first,
              expected)
        << chip << ", " << manufacturer;
  }
}

TEST(TelemetryList, SaysWhatCannotBeUsed) {
  struct Case {
    std::optional<PropertyValue> properties;
    std::string text;  ///< empty: it can be used
    std::size_t length = 8256;
  };
  const std::string longest(63, 'x');
  const std::string beyond = "Attempting to parse beyond the bounds of the buffer";
  const Case cases[] = {
      {std::nullopt, "Could not parse the Device Characteristics dictionary"},
      {PropertyValue("KX3"), "Could not parse the Device Characteristics dictionary"},
      {PropertyDict{}, "Could not determine the chip-id"},
      {characteristics(3, "0", 1), "chip-id is not stored as a PVStringTypeID"},
      {characteristics(longest + 'x', "0", 1),
       "Unable to obtain chip-id as conversion from the UniChar contents of PVString failed, or "
       "the buffer of 64 bytes is too small"},
      {PropertyDict{{"chip-id", longest}}, "Could not determine the manufacturer-id"},
      {characteristics("KX3", 45, 1), "manufacturer-id is NULL"},
      {PropertyDict{{"chip-id", "KX3"}, {"manufacturer-id", "0"}},
       "could not determine the number of channels"},
      {characteristics("KX3", "0", "1"), "could not determine the number of channels"},
      {characteristics("KX3", "0", true), "could not determine the number of channels"},
      {characteristics("KX3", "0", 2), beyond, 8255},
      {characteristics("KX3", "0", 2'147'483'647), beyond},
      {characteristics("KX3", "0", 0), "", 0},
      {characteristics("KX3", "0", -1), "", 0},
  };
  TestDevice device;
  for (const Case& each : cases) {
    Bytes buffer = telemetryList(2);
    buffer.resize(each.length);
    buffer.shrink_to_fit();
    testing::internal::CaptureStderr();
    EXPECT_EQ(LogNANDTelemetryList(buffer, each.properties ? &*each.properties : nullptr, ""),
              each.text.empty());
    EXPECT_EQ(testing::internal::GetCapturedStderr(),
              each.text.empty() ? "" : "ERROR: " + each.text + '\n');
  }
  EXPECT_FALSE(device.exists("outbox/records.jsonl"));
}

}  // namespace
}  // namespace vesprun
