#include "NANDInfo/sets/StatisticsGathering.h"

#include <cstring>
#include <memory>
#include <new>
#include <string>

#include "NANDInfo/controller/Controller.h"
#include "NANDInfo/controller/TunnelCommand.h"
#include "NANDInfo/parsers/ErrorMessages.h"
#include "NANDInfo/parsers/GenericParserCxt.h"
#include "NANDInfo/sets/FilteredDict.h"

namespace vesprun {
namespace {

struct ReleaseInterfaces {
  void operator()(nand_exporter_t* exporter) const { ReleaseIOInterfaces(*exporter); }
};

/// The controller that `findNandExporterNew` opens, closed with the pointer; null if none opens.
std::unique_ptr<nand_exporter_t, ReleaseInterfaces> openExporter() {
  nand_exporter_t* exporter = nullptr;
  const bool isOpen = findNandExporterNew(exporter);
  return std::unique_ptr<nand_exporter_t, ReleaseInterfaces>(isOpen ? exporter : nullptr);
}

struct Answer {
  TunnelBuffer buffer;
  std::uint64_t length = 0;

  std::span<const std::uint8_t> bytes() const { return buffer.bytes(length); }
};

bool fetch(RegistryHandle connection, const nand_exporter_t& exporter,
           nand_exporter_t::SelectorGetter getSelector, std::uint32_t argument, Answer& answer) {
  TunnelRequest request{.argument = argument};
  return executeTunnelCommand(connection, exporter,
                              getSelector != nullptr ? getSelector() : nullptr, request,
                              answer.buffer, answer.length);
}

/// Up to `kMaxMSPs`.
std::uint32_t countMSPs(const nand_exporter_t& exporter) {
  constexpr std::uint32_t kMaxMSPs = 10;
  std::uint32_t count = 0;
  const auto answers = [&] {
    Answer answer;
    return fetch(exporter.connection, exporter, exporter.getMspStatsSelectors, count, answer);
  };
  while (count < kMaxMSPs && answers()) {
    ++count;
  }
  return count;
}

}  // namespace

bool gatherFTLFields(bool useStatKeyParser, bool useStatsSelector, std::uint32_t argument,
                     const std::function<void(const FTLFields&)>& take) {
  const auto exporter = openExporter();
  if (!exporter) {
    SetAPIErrorMessage("gatherORUFTLData: Could not get nand_exporter_t");
    return false;
  }
  if (exporter->connection == 0) {
    SetAPIErrorMessage("gatherORUFTLData: No io_connection exist");
    return false;
  }
  const nand_exporter_t::SelectorGetter getSelector =
      useStatsSelector ? exporter->getStatsSelectors : exporter->getReadStatsSelectors;
  if (getSelector == nullptr) {
    SetAPIErrorMessage("gatherORUFTLData: No %s exist",
                       useStatsSelector ? "getStatsSelectors" : "getReadStatsSelectors");
    return false;
  }
  Answer answer;
  if (!fetch(exporter->connection, *exporter, getSelector, useStatsSelector ? 0 : argument,
             answer)) {
    return false;
  }
  const std::unique_ptr<GenericParserCxt> context(new (std::nothrow) GenericParserCxt());
  if (!context) {
    SetAPIErrorMessage("gatherORUFTLData: Could not allocate memory for pcxt.ftlData");
    return false;
  }
  const auto parse = useStatKeyParser ? exporter->parseFTLStatKey : exporter->parseFTL;
  if (parse(*context, answer.bytes()) == 0) {
    SetAPIErrorMessage("gatherORUFTLData: parseFTL failed");
    return false;
  }
  bool hasMagazine = false;
  context->forEach([&hasMagazine](const GenericParserCxt::Field& field) {
    hasMagazine = hasMagazine || field.name == "magazineFWVersion_1";
  });
  take({*context, std::strcmp(exporter->name, "ORUStorage") == 0, hasMagazine});
  exporter->releaseGenericCxt(*context);
  if (!hasMagazine) {
    SetAPIErrorMessage("Stat Magazine not supported");
  }
  return true;
}

std::optional<PropertyDict> gatherORUFTLData(bool useStatKeyParser, bool useStatsSelector,
                                             std::uint32_t argument) {
  std::optional<PropertyDict> dict;
  gatherFTLFields(useStatKeyParser, useStatsSelector, argument, [&dict](const FTLFields& ftl) {
    dict = CreateDictFromCxt(ftl.fields);
    dict->set("com.quill.NANDInfo.IsQNS1Controller", std::int32_t{ftl.isQNS1Controller});
    dict->set(kIsStatMagSupportedKey, std::int32_t{ftl.isStatMagSupported});
  });
  return dict;
}

std::optional<PropertyDict> gatherORUMSPData(const FieldTable* digits, bool round) {
  const auto exporter = openExporter();
  if (!exporter) {
    SetAPIErrorMessage("gatherORUMSPData: Could not get nand_exporter_t");
    return std::nullopt;
  }
  if (exporter->getMspStatsSelectors == nullptr || exporter->parseMSP == nullptr) {
    SetAPIErrorMessage("gatherORUMSPData: Controller does not support MSP data");
    return std::nullopt;
  }
  if (exporter->connection == 0) {
    SetAPIErrorMessage("gatherORUMSPData: No io_connection exist");
    return std::nullopt;
  }
  const std::uint32_t count = countMSPs(*exporter);
  if (count == 0) {
    SetAPIErrorMessage("CopyWhitelistedNANDMSPInfo: Unable to gather any NAND MSP fields");
    return std::nullopt;
  }
  const std::unique_ptr<GenericParserCxt[]> contexts(new (std::nothrow) GenericParserCxt[count]);
  if (!contexts) {
    SetAPIErrorMessage("gatherORUMSPData: Could not allocate memory for genericPCxt");
    return std::nullopt;
  }
  PropertyDict fieldsByIndex;
  for (std::uint32_t index = 0; index < count; ++index) {
    Answer answer;
    if (!fetch(exporter->connection, *exporter, exporter->getMspStatsSelectors, index, answer)) {
      SetAPIErrorMessage("gatherORUMSPData: getNANDMSPBuffer tunnel command failed !");
      break;
    }
    if (exporter->parseMSP(contexts[index], answer.bytes()) == 0) {
      SetAPIErrorMessage("gatherORUMSPData: parseMSP failed !");
      break;
    }
    fieldsByIndex.set(std::to_string(index),
                      CreateFilteredDict_SigDig(contexts[index], digits, round));
    exporter->releaseGenericCxt(contexts[index]);
  }
  return fieldsByIndex;
}

bool GatherNANDStats(nand_exporter_t*& exporter, ORUStatsContext& context) {
  Controller controller;
  exporter = &controller.exporter();
  if (!controller.open()) {
    return false;
  }
  Answer answer;
  const bool parsed =
      fetch(controller.connection(), *exporter, exporter->getStatsSelectors, 0, answer) &&
      exporter->parseStats != nullptr && exporter->parseStats(context, answer.bytes());
  return controller.close() && parsed;
}

}  // namespace vesprun
