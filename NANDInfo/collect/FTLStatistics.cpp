// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/FTLStatistics.h"

#include <memory>
#include <new>
#include <string_view>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/collect/Recorded.h"
#include "NANDInfo/controller/StorageController.h"

namespace NANDInfo {

using base::Error;
using plist::Dictionary;

namespace {

constexpr std::string_view kQRT1 = "ZMCStorage";

void addKindOfController(std::string_view className, Dictionary& counters) {
  const bool hasMagazine = counters.find("magazineFWVersion_1") != nullptr;
  counters.set(kNANDInfoIsQRT1Controller, className == kQRT1 ? 1 : 0);
  counters.set(kNANDInfoIsStatMagSupported, hasMagazine ? 1 : 0);
  if (!hasMagazine) SetAPIErrorMessage("Stat Magazine not supported");
}

}  // namespace

base::Result<Dictionary> readFTLStatistics(const ControllerServices& services, FTLParser parser,
                                           FTLSource source, std::uint32_t argument) {
  const auto controller = openController(services);
  if (!controller) return Error{"gatherZMCFTLData: Could not get nand_exporter_t"};
  if (!controller->service.isOpen()) return Error{"gatherZMCFTLData: No io_connection exist"};
  const nand_exporter_t* const exporter = controller->exporter;
  const bool statistics = source == FTLSource::statistics;
  const auto getter = statistics ? exporter->getStatsSelectors : exporter->getReadStatsSelectors;
  if (getter == nullptr) {
    return Error{statistics ? "gatherZMCFTLData: No getStatsSelectors exist"
                            : "gatherZMCFTLData: No getReadStatsSelectors exist"};
  }
  const auto answer = fetchStatistics(*controller, getter(), statistics ? 0 : argument);
  if (!answer) return answer.error();
  const std::unique_ptr<GenericParserCxt> context(new (std::nothrow) GenericParserCxt);
  if (context == nullptr) {
    return Error{"gatherZMCFTLData: Could not allocate memory for pcxt.ftlData"};
  }
  const auto parse = parser == FTLParser::statKey ? exporter->parseFTLStatKey : exporter->parseFTL;
  if (parse(context.get(), answer->delivered()) == 0) {
    return Error{"gatherZMCFTLData: parseFTL failed"};
  }
  Dictionary counters = CreateDictFromCxt(*context);
  addKindOfController(exporter->className, counters);
  return counters;
}

std::optional<Dictionary> ftlStatistics(const ControllerServices& services, const char* missing) {
  return recorded(readFTLStatistics(services, FTLParser::named, FTLSource::statistics, 0), missing);
}

}  // namespace NANDInfo
