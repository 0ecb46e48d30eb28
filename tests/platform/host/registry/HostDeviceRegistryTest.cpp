#include "platform/host/registry/HostDeviceRegistry.h"

#include "platform/RegistryObject.h"
#include "support/ControllerTest.h"

namespace vesprun {
namespace {

class HostDeviceRegistryTest : public ControllerTest {
 protected:
  DeviceRegistry& registry() { return device().platform().deviceRegistry(); }
  RegistryObject matching(const std::string& className) {
    return RegistryObject(registry().DevRegServiceGetMatchingService(className));
  }
  RegistryHandle opened(const std::string& className) {
    RegistryHandle connection = 0;
    EXPECT_EQ(registry().DevRegServiceOpen(matching(className).get(), connection), 0u);
    return connection;
  }
};

TEST_F(HostDeviceRegistryTest, DriverChecksWhatItIsSent) {
  const std::string answers =
      R"({"opcode": 13, "argument": 2, "kind": 3, "file": "statistics.bin"})";
  start(controller("ORUStorage", answers, R"(, "contentDeletion": {"value": 258, "length": 2})") +
        ',' + controller("QuillQNS3NVMeController", answers) + ',' +
        controller("Own", answers, R"(, "contentDeletion": {"value": 1})"));
  const RegistryHandle storage = opened("ORUStorage");
  const RegistryHandle express = opened("QuillQNS3NVMeController");
  const RegistryHandle own = opened("Own");
  const auto request = [](std::uint8_t flags, std::uint8_t argument) {
    Bytes bytes(24);
    bytes[0] = 13;
    bytes[4] = flags;
    bytes[8] = argument;
    bytes[12] = bytes[16] = 0xAA;  // not looked at
    return bytes;
  };
  constexpr std::uint8_t kKind = 3 << 2;
  struct Case {
    RegistryHandle connection;
    std::uint32_t method;
    Bytes input;
    std::size_t capacity;
    Bytes output{};  ///< its beginning; empty when the call is refused
    std::uint64_t length = 9;
  };
  constexpr RegistryResult kBad = 0xE00002C2;
  const std::string file = device().read("statistics.bin");
  const Bytes size{48, 0, 0, 0};
  const Bytes content(file.begin(), file.end());
  const Case cases[] = {
      {storage, 8, request(kKind | 1, 2), 4, size, 4},
      {storage, 8, request(kKind | 3, 2), 100, size, 4},  // the flag in bit 1 selects nothing
      {storage, 8, request(kKind, 2), 48, content, 48},
      {storage, 8, request(kKind, 2), 64, content, 48},
      {express, 9, request(kKind | 1, 2), 4, size, 4},
      {storage, 5, {}, 4, {2, 1, 0, 0}, 2},
      {storage, 8, request(kKind | 1, 2), 3},
      {storage, 8, request(kKind, 2), 47},
      {storage, 8, Bytes(23), 4},
      {storage, 8, Bytes(25), 4},
      {storage, 9, request(kKind | 1, 2), 4},
      {express, 8, request(kKind | 1, 2), 4},
      {own, 8, request(kKind | 1, 2), 4},
      {storage, 5, {}, 3},
      {storage, 5, {1}, 4},
      {express, 5, {}, 4},
      {own, 5, {}, 4},
      {4711, 8, request(kKind | 1, 2), 4}};
  for (const Case& call : cases) {
    Bytes output(call.capacity);
    std::uint64_t length = 9;
    EXPECT_EQ(registry().DevRegConnectCallStructMethod(call.connection, call.method, call.input,
                                                       output, length),
              call.output.empty() ? kBad : 0);
    EXPECT_EQ(length, call.length) << &call - cases;
    EXPECT_TRUE(std::equal(call.output.begin(), call.output.end(), output.begin()));
  }
  for (const RegistryHandle connection : {storage, express, own}) {
    EXPECT_EQ(registry().DevRegServiceClose(connection), 0u);
  }
}

TEST_F(HostDeviceRegistryTest, HandlesAreCounted) {
  start(R"({"class": "Bare"}, )" + controller("ORUStorage", "", R"(, "closeError": 7)") + ", " +
        controller("Refusing", "", R"(, "openError": 8)"));
  HostDeviceRegistry& described = device().platform().describedRegistry();
  RegistryHandle connection = 5;
  EXPECT_EQ(registry().DevRegServiceOpen(matching("Bare").get(), connection), 0xE00002C2);
  EXPECT_EQ(registry().DevRegServiceOpen(matching("Refusing").get(), connection), 8u);
  EXPECT_EQ(connection, 0u);
  connection = opened("ORUStorage");
  EXPECT_EQ(described.openConnections(), 1u);
  EXPECT_EQ(registry().DevRegServiceClose(connection), 7u);
  EXPECT_EQ(described.openConnections(), 0u);
  EXPECT_NE(registry().DevRegServiceClose(0), 0u);
  {
    const RegistryObject first = matching("Bare");
    const RegistryObject second = matching("Bare");
    EXPECT_NE(first.get(), second.get());
    EXPECT_EQ(described.openObjects(), 2u);
  }
  registry().DevRegObjectRelease(0);

  HostDeviceRegistry other({}, device().platform().directory(), device().platform().systemLog());
  other.DevRegServiceClose(connection);
  other.DevRegObjectRelease(connection);
  EXPECT_EQ(other.falseReleases(), 2u);
}

}  // namespace
}  // namespace vesprun
