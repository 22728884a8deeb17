// What the two events of the FTL histograms may carry.
#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr NameRow kFirst[] = {
    {"balanceProportionBucketsHistogram_{0..10}"},
    {"bandsCrossTempHisto_{0..44}"},
    {"bandsDeltaTempHisto_{0..21}"},
    {"bandsLifeTimeTempHisto_{0..29}"},
    {"bandsMaxTempHisto_{0..21}"},
    {"bandsMinTempHisto_{0..21}"},
    {"burstSizeHistogram_{0..9}"},
    {"CacheDepthVsThroughput_{0..255}"},
    {"cbdrInitSent_{0..2}"},
    {"cbdrRefreshedAges_{0..8}"},
    {"cbdrRefreshedAgesSLC_{0..8}"},
    {"cbdrRefreshGrades_{0..9}"},
    {"cbdrScanPct_{0..4}"},
    {"clogFailReason_{0..12}"},
    {"cpuBurstLength{0..7}"},
    {"cpuBurstLength_{0..7}"},
    {"dmReasonsSlc{0..18}"},
    {"dmReasonsSlc_{0..20, 27..31}"},
    {"dmReasonsTlc{0..18}"},
    {"dmReasonsTlc_{0..20, 27..31}"},
    {"E2EDPErrorCounters_{0..11}"},
    {"eanBootReadsHist_{0..9}"},
    {"gcActiveReasons_{0..8}"},
    {"gcSearchPortion{0..15}"},
    {"gcSearchPortion_{0..15}"},
    {"gcSearchTimeHistory{0..9}"},
    {"gcSearchTimeHistory_{0..9}"},
    {"gracefulBootTimeLogMs_{0..7}"},
    {"injDepth_{0..11}"},
    {"maxQosPerCmdQ_{0..9}"},
    {"mspbootBlockRefreshCnt_{0..3}"},
    {"oslcDemandBurstSize_{0..9}"},
    {"oslcNoVotesHw_{0..7}"},
    {"qosPerCmdQ_{0..159}"},
    {"slcDemandBurstDur_{0..9}"},
    {"slcDemandBurstSizeDetected_{0..9}"},
    {"slcDemandBurstSizeSlc_{0..9}"},
    {"TLM_APIErrorCode"},
    {"TLM_averageSLCPECycles"},
    {"TLM_averageTLCPECycles"},
    {"TLM_DQ_Capacity_GB"},
    {"TLM_formatWeeksSince2000"},
    {"TLM_hostWrites"},
    {"ungracefulBootTimeLogMs_{0..7}"},
    {"vcurve_{0..31}"},
    {"wcacheDirtyAtFlush_{0..15}"},
    {"wcacheDS_segsSortedLogSize_{0..9}"},
    {"wcacheDSOverWrLogSizeCnts_{0..9}"},
    {"wcacheWaitLogMs_{0..2, 4..9}"},
    {"Count"},
};

static_assert(countNames(kFirst) == 990);

constexpr NameRow kSecond[] = {
    {"bdrTmpHist_{0..63}"},
    {"failsOnReconstructHisto_{0..7}"},
    {"numOfThrottlingEntriesPerLevel_{0..15}"},
    {"raidReconstructDurationHisto_{0..7}"},
    {"TLM_APIErrorCode"},
    {"TLM_averageSLCPECycles"},
    {"TLM_averageTLCPECycles"},
    {"TLM_DQ_Capacity_GB"},
    {"TLM_DQ_Diskfullness_BP"},
    {"TLM_formatWeeksSince2000"},
    {"TLM_hostWrites"},
    {"Count"},
};

static_assert(countNames(kSecond) == 104);

}  // namespace

std::span<const NameRow> ftlHistograms1EventRows() { return kFirst; }
std::span<const NameRow> ftlHistograms2EventRows() { return kSecond; }

}  // namespace NANDInfo
