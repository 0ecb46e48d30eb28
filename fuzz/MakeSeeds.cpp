// Makes the inputs that the fuzz targets start from: MakeSeeds FOLDER writes FOLDER/TARGET/NAME.
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/parsers/MSPRecord.h"
#include "buffers/DeviceBuffers.h"
#include "platform/host/messages/MessageFraming.h"

using namespace vesprun;

namespace {

struct Seed {
  const char* name;
  Bytes bytes;
};

Bytes bytesOf(std::string_view text) { return {text.begin(), text.end()}; }

std::vector<Seed> statisticsSeeds() {
  return {
      {"everything", everyStatistic([](const ORUStatKey& key) {
         return std::vector<std::uint64_t>(key.count, key.id);
       })},
      {"lengths", StatisticsBufferBuilder()
                      .add(11, {1, 2})
                      .add(113, {1})
                      .add(113, {})
                      .add(90, {1, 2})
                      .bytes()},
      {"summary", StatisticsBufferBuilder().add(53, {1}).add(265, {1, 2, 3, 4, 5}).bytes()},
      {"unknown", StatisticsBufferBuilder().add(900, {1}).add(0x30000000, {1, 2}).bytes()},
      {"invalid", StatisticsBufferBuilder().add(4, {1}).add(0x30000001, {}).add(7, {1}).bytes()},
      {"no id", StatisticsBufferBuilder().add(65535, {}).add(4, {1}).add(65535, {1}).bytes()},
      {"cut", StatisticsBufferBuilder().add(4, {1}).addHeader(7, 2).addWord(1).bytes()},
  };
}

std::vector<Seed> mspSeeds() {
  return {
      {"everything", everyMSPStatistic([](const ORUMSPKey& key) {
         return std::vector<std::uint64_t>(key.count, key.key);
       })},
      {"lengths", MSPBufferBuilder().add(4120, {1, 2}).add(12303, {1}).add(4096, {1, 2}).bytes()},
      {"marks", MSPBufferBuilder()
                    .add(4096, {1})
                    .addHeader(MSPRecordHeader::kFiller, 3)
                    .addBytes(3)
                    .addHeader(MSPRecordHeader::kEndMarker, 0)
                    .add(16385, {1, 2, 3, 4, 5})
                    .addHeader(MSPRecordHeader::kEndMarker, 4)
                    .bytes()},
      {"cut", MSPBufferBuilder().add(4096, {1}).addHeader(4121, 16).addBytes(15).bytes()},
  };
}

std::vector<Seed> snapshotSeeds() {
  return {
      {"thread", SnapshotBuilder().thread(1, "VM_swapout", 1).bytes},
      {"nested", SnapshotBuilder()
                     .item(0x30, Bytes(8))
                     .begin(1)
                     .name("task")
                     .thread(2, "other", 1)
                     .begin(3)
                     .written(1)
                     .name("VM_swapout")
                     .end(3)
                     .end(1)
                     .bufferEnd()
                     .bytes},
      {"nameless", SnapshotBuilder().begin(1).begin(2).end(2).name("VM_swapout").end(1).bytes},
  };
}

std::vector<Seed> ptreeSeeds() {
  const auto in = [](const std::string& value) {
    return bytesOf("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<ptree version=\"1.0\">" + value +
                   "</ptree>\n");
  };
  return {
      {"everything",
       in("<dict><key>s</key><string>a &lt; b &#x20AC;</string><key>n</key><array><integer>-5"
          "</integer><integer>18446744073709551615</integer><real>0.1</real><real>-inf</real>"
          "<true/><false/></array><key>d</key><data>AQID</data><key>t</key>"
          "<date>2024-03-05T09:15:02.25Z</date><key>e</key><dict/></dict>")},
      {"string", in("<string> \t </string>")},
      {"nan", in("<real>nan</real>")},
      {"repeated", in("<dict><key>a</key><true/><key>a</key><false/></dict>")},
  };
}

std::vector<Seed> messageSeeds() {
  const auto message = [](const std::string& content) {
    return *messageFrame("<ptree version=\"1.0\"><dict><key>operation</key>" + content +
                         "</dict></ptree>");
  };
  const std::string apps = message(
      "<integer>2</integer><key>uuid</key><data>AAAAAAAAAAAAAAAAAAAAAA==</data><key>data</key>"
      "<array><dict><key>bundle_id</key><string>a</string></dict></array>");
  return {{"logging", bytesOf(message("<integer>0</integer>"))},
          {"apps", bytesOf(apps)},
          {"two", bytesOf(apps + message("<integer>1</integer>"))},
          {"cut", bytesOf(apps.substr(0, 40))}};
}

std::vector<Seed> descriptionSeeds() {
  return {{"everything", bytesOf(R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC",
      "logLevel": "info", "system": {"buildVersion": "2B"},
      "properties": {"InternalBuild": false, "DiskUsage": null, "InverseDeviceID": "f"},
      "userVolume": {"blockSize": 4096, "blocks": 9, "available": 3}, "logBlacklist": ["115"],
      "submission": {"enabled": true, "fails": false}, "purgeable": {"a": 1},
      "events": {"available": true, "used": ["a"], "fails": []},
      "apps": [{"bundle": "a", "user": true}], "languages": {"preferred": ["en"], "country": null},
      "supportLibrary": {"available": true, "missing": ["a"]},
      "kernel": {"pageSize": 4096, "ticks": {"value": 1, "numerator": 1, "denominator": 1},
                 "variables": {"a": {"u32": 1}, "b": {"u64": 1}, "c": "t", "d": {"data": "AQ=="}},
                 "snapshot": "s.bin", "eccError": 2},
      "registry": [{"class": "A", "conformsTo": ["B"], "matching": true, "properties": {},
                    "children": [], "userClient": {"openError": 0, "closeError": 0,
          "tunnel": [{"opcode": 13, "argument": 0, "kind": 0, "file": "f", "size": 4, "length": 4,
                      "sizeError": 0, "dataError": 0}],
          "contentDeletion": {"value": 1, "length": 4, "error": 0},
          "scalarMethods": {"3": {"LPEM": 1}}}}],
      "channels": [{"name": "c", "value": 3, "format": 1, "categories": 256}],
      "usage": {"records": [{"procName": "p", "since": {"date": "2024-03-05T00:00:00Z"}}],
                "delaySeconds": 0.5}})")},
          {"values", bytesOf(R"([1, -1, 2.5, {"real": "nan"}, {"float": 0.25}, {"data": "AQID"},
                                {"date": "2024-03-05T09:15:02Z"}, true, "\u20ac", {}])")}};
}

std::vector<Seed> counterLineSeeds() {
  return {{"both", bytesOf("scalar\t19787\ta.b\t-5\nsample\t19787\ta.b\t0.25\t3600\n"
                           "sample\t19787\ta.b\tinf\t-1\nscalar\t-2\tc\t9223372036854775807\n")}};
}

std::vector<Seed> exportedLineSeeds() {
  return {{"line",
           bytesOf(R"({"version":2,"device":"d","day":19787,"revision":1,"build":null,"model":"m",)"
                   R"("created":{"date":"2024-03-05T09:15:02.25Z"},"whitelist":"w",)"
                   R"("scalars":{"a":-5},"distributions":{"b":[1.0,2.5,1.5,0.5,2]},)"
                   R"("histograms":{"b":{"(-inf, 10]":2}}})")}};
}

std::vector<Seed> figureSeeds() {
  return {{"number", bytesOf("41000\n")},
          {"many", bytesOf("1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16 17\n")},
          {"hexadecimal", bytesOf("0x0b\n")},
          {"labels", bytesOf("cpu 1 2.5 3\nMemAvailable: 4000000 kB\nsome avg10=0.00 total=5\n")}};
}

bool write(const std::filesystem::path& folder, const std::vector<Seed>& seeds) {
  std::filesystem::create_directories(folder);
  for (const Seed& seed : seeds) {
    std::ofstream file(folder / seed.name, std::ios::binary);
    file.write(reinterpret_cast<const char*>(seed.bytes.data()),
               static_cast<std::streamsize>(seed.bytes.size()));
    file.close();
    if (!file) {
      std::fprintf(stderr, "MakeSeeds: %s cannot be written\n", (folder / seed.name).c_str());
      return false;
    }
  }
  return true;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::fprintf(stderr, "usage: MakeSeeds FOLDER\n");
    return 2;
  }
  const std::filesystem::path folder = argv[1];
  const bool written = write(folder / "BaseStatisticsFuzzer", statisticsSeeds()) &&
                       write(folder / "FTLStatisticsFuzzer", statisticsSeeds()) &&
                       write(folder / "FTLStatKeysFuzzer", statisticsSeeds()) &&
                       write(folder / "MSPStatisticsFuzzer", mspSeeds()) &&
                       write(folder / "CounterLayoutsFuzzer", {{"counting", telemetryList(1)}}) &&
                       write(folder / "KernelSnapshotFuzzer", snapshotSeeds()) &&
                       write(folder / "PtreeReaderFuzzer", ptreeSeeds()) &&
                       write(folder / "MessageFuzzer", messageSeeds()) &&
                       write(folder / "DeviceDescriptionFuzzer", descriptionSeeds()) &&
                       write(folder / "CounterLinesFuzzer", counterLineSeeds()) &&
                       write(folder / "ExportedLineFuzzer", exportedLineSeeds()) &&
                       write(folder / "FiguresFuzzer", figureSeeds());
  return written ? 0 : 1;
}
