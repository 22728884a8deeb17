// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/MSPInfo.h"

#include <cstdint>
#include <memory>
#include <new>
#include <string>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/collect/FTLInfo.h"
#include "NANDInfo/collect/Recorded.h"
#include "NANDInfo/controller/StorageController.h"

namespace NANDInfo {

using base::Error;
using plist::Dictionary;

namespace {

constexpr std::uint32_t kMaxMSPs = 10;

// An MSP's buffer; none when it doesn't answer.
std::optional<TunnelAnswer> getNANDMSPBuffer(const StorageController& controller,
                                             std::uint32_t index) {
  return recorded(fetchStatistics(controller, controller.exporter->getMSPStatsSelectors(), index));
}

// The number of MSPs that answer.
std::uint32_t countMSPs(const StorageController& controller) {
  std::uint32_t count = 0;
  while (count < kMaxMSPs && getNANDMSPBuffer(controller, count)) ++count;
  return count;
}

// All counters of each MSP under its index, as far as they could be read. The count is taken first:
// a controller that stops answering in between is seen as such.
Dictionary readMSPs(const StorageController& controller) {
  Dictionary msps;
  const std::uint32_t count = countMSPs(controller);
  if (count == 0) {
    SetAPIErrorMessage("CopyWhitelistedNANDMSPInfo: Unable to gather any NAND MSP fields");
    return msps;
  }
  const std::unique_ptr<GenericParserCxt> context(new (std::nothrow) GenericParserCxt);
  if (context == nullptr) {
    SetAPIErrorMessage("gatherZMCMSPData: Could not allocate memory for genericPCxt");
    return msps;
  }
  for (std::uint32_t index = 0; index < count; ++index) {
    const auto answer = getNANDMSPBuffer(controller, index);
    if (!answer) {
      SetAPIErrorMessage("gatherZMCMSPData: getNANDMSPBuffer tunnel command failed !");
      break;
    }
    if (controller.exporter->parseMSP(context.get(), answer->delivered()) == 0) {
      SetAPIErrorMessage("gatherZMCMSPData: parseMSP failed !");
      break;
    }
    msps.set(std::to_string(index), CreateDictFromCxt(*context));
    controller.exporter->releaseGeneric(context.get());
  }
  return msps;
}

// The four parts of the firmware version, 16 bits each, the lowest first.
Dictionary firmwareVersion(const Dictionary& counters) {
  const auto* identifier = counters.number(kTLM_MSP_fw_version_identifier);
  if (identifier == nullptr) return {};
  const auto part = [bits = identifier->uint64Value()](int place) {
    return static_cast<std::int64_t>(bits >> 16 * place & 0xFFFF);
  };
  return {{kTLM_MSP_fw_version_identifier_0, part(0)},
          {kTLM_MSP_fw_version_identifier_1, part(1)},
          {kTLM_MSP_fw_version_identifier_2, part(2)},
          {kTLM_MSP_fw_version_identifier_3, part(3)}};
}

}  // namespace

base::Result<Dictionary> readMSPStatistics(const ControllerServices& services) {
  const auto controller = openController(services);
  if (!controller) return Error{"gatherZMCMSPData: Could not get nand_exporter_t"};
  const nand_exporter_t& exporter = *controller->exporter;
  if (exporter.getMSPStatsSelectors == nullptr || exporter.parseMSP == nullptr) {
    return Error{"gatherZMCMSPData: Controller does not support MSP data"};
  }
  if (!controller->service.isOpen()) return Error{"gatherZMCMSPData: No io_connection exist"};
  return readMSPs(*controller);
}

Dictionary reportedMSP(const Dictionary& counters, const Dictionary& shared, bool round) {
  Dictionary msp =
      CreateFilteredDict_SigDig(counters, &WhitelistedRawNANDMSPCounters_SigDigDict(), round);
  addEntries(shared, msp);
  addEntries(firmwareVersion(counters), msp);
  return msp;
}

Dictionary whitelistedMSPInfo(const CollectServices& services, bool round) {
  Dictionary info;
  if (const auto msps = recorded(readMSPStatistics(services.controller),
                                 "CopyWhitelistedNANDMSPInfo: Unable to gather MSP fields")) {
    const Dictionary shared = fieldsAlong(services);
    for (const auto& [index, counters] : *msps) {
      info.set(index, reportedMSP(*counters.as<Dictionary>(), shared, round));
    }
  }
  info.set(kTLM_APIErrorMessage, GetAPIErrorMessage());
  return info;
}

}  // namespace NANDInfo
