// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The extraction: what each event may carry, and whole runs of the steps over a device that has it
// all, or lacks one thing.

#include "NANDInfo/Extraction.h"

#include <gtest/gtest.h>

#include <cstring>
#include <functional>

#include "NANDInfo/Events.h"
#include "NANDInfo/deliver/ExtractionSteps.h"
#include "platform/testing/FaultInjector.h"
#include "support/FreshErrors.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using plist::Dictionary, plist::Value;
using support::StorageDevice;
using u64 = std::uint64_t;

constexpr std::string_view kPrefix = "com.norba.massStorage.NANDInfo.";

// A device with two MSPs, a magazine of 720 hours and NVRAM statistics.
struct FullDevice : StorageDevice {
  FullDevice() : StorageDevice(support::kQRT3) {
    setCounters({"magazineFWVersion", {1, 2, 3}});
    for (const std::uint32_t msp : {0U, 1U}) {
      registry.alwaysTunnels(9, 221, msp, support::records({{0x1000, 4, {msp + 12345}}}));
    }
    registry.add(
        {.className = "NvramDiagService",
         .properties = {{"Generation", "12"}, {"Version", 2}},
         .children = {{.className = "child", .properties = {{"CommonUsed", 3}, {"Version", 1}}}}});
  }

  void setCounters(const support::FTLFields::value_type& version) {
    setStatistics({version, {"hostWrites", {1234567891}}, {"vcurve", std::vector<u64>(32, 1)}});
    for (const std::uint32_t hours : {0U, 4U, 8U, 12U, 16U, 20U, 24U, 168U, 720U}) {
      setSnapshot(hours, {version,
                          {"magazineInstanceMeta", {(u64{4000000} - hours * 3600) << 24}},
                          {"hostWrites", {5000 - hours}},
                          {"gcWrites", {1000 - hours}},
                          {"vcurve", std::vector<u64>(32, 1)}});
    }
  }

  // The log, without what finding controllers and images says.
  std::string said() const {
    std::string text;
    for (const std::string& line : log.lines()) {
      if (line.find("findNandExporterNew") == std::string::npos &&
          line.find("EANConnection") == std::string::npos &&
          line.find("GetEAN") == std::string::npos) {
        text += line.substr(std::strlen("default: "));
      }
    }
    return text;
  }

  // The events so far, without their common prefix.
  std::string sent() const {
    std::string text;
    for (const auto& [event, payload] : eventra.events) {
      text += event.starts_with(kPrefix) ? event.substr(kPrefix.size()) + " " : "? " + event;
    }
    return text;
  }
};

Dictionary nvramStatistics() { return {{"commonused", 3}, {"norwrites", "12"}, {"version", 2}}; }

constexpr char kFirstSteps[] =
    "FTLCounters_1 FTLHistograms_1 FTLHistograms_2 MSPCounters_1 MSPCounters_1 StorageStats_1 "
    "NORWrites ";

TEST(Extraction, RunsItsStepsAsFarAsTheDeviceAllows) {
  const std::string windows =
      "SM.Daily.FTLCounters_1 SM.WeeklyMA.FTLCounters_1 SM.Monthly.FTLCounters_1 ";
  const struct {
    const char* what;
    std::function<void(FullDevice&)> alter;
    bool monthly;
    std::uint32_t firstStep;
    std::string events;
    int successes, failures;  // lines of events
  } rows[] = {
      {"all", [](auto&) {}, true, 0, kFirstSteps + windows, 9, 0},
      {"from the magazine on", [](auto&) {}, false, 4,
       "SM.Daily.FTLCounters_1 SM.WeeklyMA.FTLCounters_1 ", 2, 0},
      {"the month alone", [](auto&) {}, true, 6, "SM.Monthly.FTLCounters_1 ", 1, 0},
      {"beyond the last", [](auto&) {}, true, 7, "", 0, 0},
      {"some are unused",
       [](auto& d) {
         d.eventra.unused = {kEventName_massStorage_NANDInfo_FTLHistograms_1,
                             kEventName_massStorage_NANDInfo_MSPCounters_1,
                             kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1};
       },
       false, 0,
       "FTLCounters_1 FTLHistograms_2 StorageStats_1 NORWrites SM.WeeklyMA.FTLCounters_1 ", 4, 4},
      {"the queue is full", [](auto& d) { d.eventra.queuesEvents = false; }, true, 0, "", 0, 9},
      {"no sink", [](auto& d) { d.eventra.hasLazySend = false; }, true, 0, "", 0, 0},
      {"no magazine",
       [](auto& d) {
         d.setCounters({"boots", {1}});
       },
       true, 0, kFirstSteps, 6, 0},
      {"no NVRAM statistics",
       [](auto& d) { d.registry.root->children[1] = {.className = "NvramDiagService"}; }, true, 3,
       windows, 3, 0},
      {"no controller and no NVRAM", [](auto& d) { d.registry.root = std::nullopt; }, true, 0,
       "FTLCounters_1 FTLHistograms_1 FTLHistograms_2 StorageStats_1 ", 4, 0}};
  for (const auto& [what, alter, monthly, firstStep, events, successes, failures] : rows) {
    SCOPED_TRACE(what);
    FullDevice device;
    alter(device);
    const auto summary =
        NandInfoExtractToEV_runAllSteps(device.platform, nullptr, monthly ? 0xFFu : 0xFEu, true,
                                        (std::uint64_t{9} << 32) + firstStep);
    EXPECT_EQ(device.sent(), events);
    EXPECT_EQ(device.log.count("SUCCESS in logging"), successes);
    EXPECT_EQ(device.log.count("FAILED to log"), failures);
    EXPECT_EQ(device.log.count("Skipping Stats Mag Monthly Delta"), monthly ? 0 : 1);
    const int stepsRun = !device.eventra.hasLazySend ? 0 : (monthly ? 7 : 6) - int(firstStep);
    EXPECT_EQ(device.log.count("successfully logged"), stepsRun);
    // What was sent, and the NVRAM statistics whether they were sent or not.
    Dictionary expected = device.eventra.queuesEvents ? Dictionary() : nvramStatistics();
    for (const auto& [event, payload] : device.eventra.events) {
      if (event == kEventName_massStorage_NANDInfo_MSPCounters_1) {
        expected.set(kTLM_MSP_msp_index, payload);
      } else {
        addEntries(payload, expected);
      }
    }
    expected.set(kNANDInfoErrorMessageKey, GetAPIErrorMessage());
    EXPECT_EQ(summary, expected);
  }
}

// The counters have more digits than any rounding would leave them.
TEST(Extraction, SendsWhatEachEventMayCarryAsItIs) {
  FullDevice device;
  NandInfoExtractToEV_runAllSteps(device.platform, nullptr, 1, false, 0);
  const struct {
    std::vector<const char*> keys;
    const char* values;  // "-" for what isn't sent
  } rows[] = {
      {{"hostWrites", "vcurve_1", "TLM_hostWrites", "TLM_APIErrorMessage"}, "1234567891 - - - "},
      {{"vcurve_31", "hostWrites", "TLM_hostWrites"}, "1 - 1234567891 "},
      {{"TLM_hostWrites", "vcurve_1"}, "1234567891 - "},
      {{"msp_index", "passWithTmodeHard"}, "0 12345 "},
      {{"msp_index", "passWithTmodeHard", "total_nof_msps"}, "1 12346 2 "},
      {{"TLM_hostWrites", "EAN_imageSize_BIC"}, "1234567891 0 "},
      {{"norwrites", "commonused", "version", "systemused"}, "12 3 2 - "},
      {{"hostWrites", "TLM_SM_deltaDays", "TLM_instantaneous_gc_wamp_5",
        kNANDInfoIsStatMagSupported},
       "24 1 1.070663811563169 - "},
      {{"hostWrites", "TLM_SM_deltaDays", "TLM_instantaneous_gc_wamp_5"}, "168 7 - "},
      {{"hostWrites", "TLM_SM_deltaDays"}, "720 30 "}};
  const auto& events = device.eventra.events;
  ASSERT_EQ(events.size(), std::size(rows));
  for (std::size_t i = 0; i < events.size(); ++i) {
    const auto& [event, payload] = events[i];
    std::string values;
    for (const char* key : rows[i].keys) {
      const Value* const value = payload.find(key);
      values += (value != nullptr ? description(*value) : "-") + " ";
    }
    EXPECT_EQ(values, rows[i].values) << event;
    const NameTable* const fields = EventraConfigDetails(event);
    for (const auto& [key, value] : payload) {
      EXPECT_TRUE(fields == nullptr || fields->contains(key)) << event << " " << key;
    }
  }
  EXPECT_NE(events[4].second.text("msp_index"), nullptr);
}

TEST(Extraction, SaysWhatItDoes) {
  FullDevice device;
  device.eventra.unused = {kEventName_massStorage_NANDInfo_FTLHistograms_2,
                           kEventName_massStorage_NANDInfo_StorageStats_1,
                           kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1};
  EXPECT_EQ(NandInfoExtractToEV_runAllSteps(device.platform, nullptr, 0, false, 0), std::nullopt);
  EXPECT_EQ(device.said(), R"(NANDInfo: NandInfoExtractToEV_runStep: logging FTL big view
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.FTLCounters_1 enabled=1
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: SUCCESS in logging massStorage_NANDInfo_FTLCounters_1 using EventraSendEventLazy
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.FTLHistograms_1 enabled=1
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: SUCCESS in logging massStorage_NANDInfo_FTLHistograms_1 using EventraSendEventLazy
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.FTLHistograms_2 enabled=0
NANDInfo: createAndLogFTLStatFieldsToEventraForEvent: FAILED to log massStorage_NANDInfo_FTLHistograms_2 using EventraSendEventLazy
NANDInfo: NandInfoExtractToEV_runStep: successfully logged FTL big view
NANDInfo: NandInfoExtractToEV_runStep: logging MSP stats
NANDInfo: createAndLogMSPFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.MSPCounters_1 enabled=1
NANDInfo: createAndLogMSPFieldsToEventraForEvent: SUCCESS in logging massStorage_NANDInfo_MSPCounters_1 using EventraSendEventLazy
NANDInfo: createAndLogMSPFieldsToEventraForEvent: SUCCESS in logging massStorage_NANDInfo_MSPCounters_1 using EventraSendEventLazy
NANDInfo: createAndLogMSPFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.MSPCounters_1 completed (total_nof_msps:2)
NANDInfo: NandInfoExtractToEV_runStep: successfully logged MSP stats
NANDInfo: NandInfoExtractToEV_runStep: logging storage stats
NANDInfo: createAndLogStorageStatsToEventraForEvent: com.norba.massStorage.NANDInfo.StorageStats_1 enabled=0
NANDInfo: createAndLogStorageStatsToEventraForEvent: FAILED to log massStorage_NANDInfo_StorageStats_1 using EventraSendEventLazy
NANDInfo: NandInfoExtractToEV_runStep: successfully logged storage stats
NANDInfo: NandInfoExtractToEV_runStep: logging NVRAM stat
NANDInfo: NandInfoExtractToEV_runStep: successfully logged NVRAM stat
NANDInfo: NandInfoExtractToEV_runStep: logging FTL statsMag daily
NANDInfo: createAndLogSMagFTLFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.SM.Daily.FTLCounters_1 enabled=1
NANDInfo: createAndLogSMagFTLFieldsToEventraForEvent: SUCCESS in logging com.norba.massStorage.NANDInfo.SM.Daily.FTLCounters_1 using EventraSendEventLazy
NANDInfo: NandInfoExtractToEV_runStep: successfully logged FTL statsMag daily
NANDInfo: NandInfoExtractToEV_runStep: logging FTL statsMag weekly
NANDInfo: createAndLogSMagFTLFieldsToEventraForEvent: com.norba.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1 enabled=0
NANDInfo: createAndLogSMagFTLFieldsToEventraForEvent: FAILED to log com.norba.massStorage.NANDInfo.SM.WeeklyMA.FTLCounters_1 using EventraSendEventLazy
NANDInfo: NandInfoExtractToEV_runStep: successfully logged FTL statsMag weekly
Skipping Stats Mag Monthly Delta)");
}

TEST(Extraction, HasNoHandlerBeyondTheMonth) {
  constexpr char kSaid[] =
      "NANDInfo: NandInfoExtractToEV_runStep: logging FTL counters\n"
      "Unexpected step FTL counters"
      "NANDInfo: NandInfoExtractToEV_runStep: unable to log FTL counters\n";
  FullDevice device;
  EXPECT_EQ(NandInfoExtractToEV_runStep(device.platform, 8), std::nullopt);
  EXPECT_EQ(device.said(), "Invalid extraction step 8");
  EXPECT_STREQ(GetAPIErrorMessage(), "NA");
  device.log.clear();
  EXPECT_EQ(NandInfoExtractToEV_runStep(device.platform, 7), std::nullopt);
  EXPECT_EQ(device.said(), kSaid);
  EXPECT_STREQ(GetAPIErrorMessage(), "NANDInfo/NANDInfo: unable to log FTL counters to EV");
  device.eventra.hasLazySend = false;
  EXPECT_EQ(NandInfoExtractToEV_runStep(device.platform, 0),
            (Dictionary{{kNANDInfoErrorMessageKey, "Unable call EV API EventraSendEventLazy"}}));
  EXPECT_EQ(device.said(), kSaid);
}

// A payload that isn't the producer's own would be gone, or another one, by then.
TEST(Extraction, LeavesEachPayloadToTheSinksThread) {
  FullDevice prompt;
  NandInfoExtractToEV_runAllSteps(prompt.platform, nullptr, 1, false, 0);
  FullDevice late;
  late.eventra.defers = true;
  NandInfoExtractToEV_runAllSteps(late.platform, nullptr, 1, false, 0);
  EXPECT_EQ(late.sent(), "");
  late.eventra.deliver();
  EXPECT_EQ(late.eventra.events, prompt.eventra.events);
}

TEST(Extraction, GoesOnAfterAnyFailedCall) {
  FullDevice device;
  platform::fakes::FaultInjector faults(device.platform);
  int calls = 0;
  for (int failing = 0; failing <= calls; ++failing) {
    SCOPED_TRACE(failing);
    device.log.clear();
    device.eventra.events.clear();
    faults.failAt(failing);
    ASSERT_TRUE(NandInfoExtractToEV_runAllSteps(faults.platform(), nullptr, 0, true, 3));
    if (failing == 0) calls = faults.calls();
    EXPECT_EQ(device.log.count("successfully logged"), 3);
    EXPECT_GE(device.eventra.events.size(), 2u);
    for (const auto& [event, payload] : device.eventra.events) {
      EXPECT_FALSE(payload.empty()) << event;
    }
  }
  EXPECT_GE(calls, 80);
}

TEST(ExtractionStep, SaysWhatItCouldNotGatherOrSend) {
  FullDevice device;
  const auto error = [](const char* text) { return Dictionary{{kNANDInfoErrorMessageKey, text}}; };
  for (const std::int32_t type : {-1, 3}) {
    device.log.clear();
    EXPECT_EQ(createAndLogSMagFTLFieldsToEventraForEvent(device.platform, type),
              error("Wrong SM delta type"));
    EXPECT_EQ(device.said(), "Unexpected SM delta type " + std::to_string(type));
  }
  StorageDevice bare;
  EXPECT_EQ(createAndLogSMagFTLFieldsToEventraForEvent(bare.platform, 1),
            error("Stats Magazine not supported"));

  device.log.clear();
  support::freshErrors();
  device.eventra.queuesEvents = false;
  const Dictionary msps{{kTLM_APIErrorMessage, "NA"}, {"0", Dictionary()}};
  EXPECT_EQ(sendMSPStatistics(device.platform.log, device.eventra, msps), Dictionary());
  EXPECT_EQ(createAndLogSMagFTLFieldsToEventraForEvent(device.platform, 0), Dictionary());
  EXPECT_STREQ(GetAPIErrorMessage(),
               "createAndLogMSPFieldsToEventraForEvent: EventraSendEventLazy failed to log to EV");
}

}  // namespace
}  // namespace NANDInfo
