// The FTL statistics: from the controller's buffer to the whitelisted dictionary.

#include <cstring>
#include <memory>
#include <new>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/controller/DriverHandles.h"

namespace NANDInfo {

using plist::Dictionary;

std::optional<Dictionary> gatherZMCFTLData(const Services& services, FTLParser parser,
                                           FTLSource source, std::uint32_t argument) {
  const OpenExporter exporter(services);
  if (exporter.get() == nullptr) {
    SetAPIErrorMessage("gatherZMCFTLData: Could not get nand_exporter_t");
    return std::nullopt;
  }
  if (exporter->io_connection == 0) {
    SetAPIErrorMessage("gatherZMCFTLData: No io_connection exist");
    return std::nullopt;
  }
  const bool statistics = source == FTLSource::statistics;
  const auto getter = statistics ? exporter->getStatsSelectors : exporter->getReadStatsSelectors;
  if (getter == nullptr) {
    SetAPIErrorMessage("gatherZMCFTLData: No %s exist",
                       statistics ? "getStatsSelectors" : "getReadStatsSelectors");
    return std::nullopt;
  }
  TunnelCommandBlock block{.argument = statistics ? 0 : argument};
  Buffer buffer;
  if (!executeTunnelCommand(services, exporter->io_connection, exporter.get(), getter(), block,
                            buffer)) {
    return std::nullopt;
  }

  const std::unique_ptr<GenericParserCxt> context(new (std::nothrow) GenericParserCxt);
  if (context == nullptr) {
    SetAPIErrorMessage("gatherZMCFTLData: Could not allocate memory for pcxt.ftlData");
    return std::nullopt;
  }
  const auto parse = parser == FTLParser::statKey ? exporter->parseFTLStatKey : exporter->parseFTL;
  if (parse(context.get(), buffer) == 0) {
    SetAPIErrorMessage("gatherZMCFTLData: parseFTL failed");
    return std::nullopt;
  }
  Dictionary counters = CreateDictFromCxt(*context);
  counters.set(kNANDInfoIsQRT1Controller,
               std::strcmp(exporter->className, "ZMCStorage") == 0 ? 1 : 0);
  const bool hasMagazine = counters.find("magazineFWVersion_1") != nullptr;
  counters.set(kNANDInfoIsStatMagSupported, hasMagazine ? 1 : 0);
  if (!hasMagazine) SetAPIErrorMessage("Stat Magazine not supported");
  return counters;
}

std::optional<Dictionary> CopyWhitelistedNANDFTLInfo(const Services& services, bool round) {
  Dictionary counters;
  if (auto ftl = gatherZMCFTLData(services, FTLParser::named, FTLSource::statistics, 0)) {
    counters = std::move(*ftl);
    addEntries(gatherZMCFTLOtherData(services, &counters), counters);
  } else {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other FTL fields");
  }
  Dictionary result = CreateFilteredDict_SigDig(std::move(counters),
                                                &WhitelistedRawNANDFTLCounters_SigDigDict(), round);
  result.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return result;
}

std::optional<Dictionary> CopyNANDFTLInfo(const Services& services, bool statKeys, bool enabled) {
  if (!enabled) return std::nullopt;
  const auto parser = statKeys ? FTLParser::statKey : FTLParser::named;
  Dictionary result =
      gatherZMCFTLData(services, parser, FTLSource::statistics, 0).value_or(Dictionary());
  if (result.empty()) {
    SetAPIErrorMessage("CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas");
  }
  result.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return result;
}

std::optional<Dictionary> CopyWhitelistedNANDFTLCountersInfo() { return std::nullopt; }

}  // namespace NANDInfo
