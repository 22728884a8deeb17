// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The keys of the library's dictionaries.
#pragma once

namespace NANDInfo {

// The basic dictionary: numbers of 32 or 64 bits, as the controller counts them.
inline constexpr char kNANDInfoExportVersionKey[] = "com.norba.NANDInfo.ExportVersion";
inline constexpr char kNANDInfoDriverVersionKey[] = "com.norba.NANDInfo.DriverVersion";
inline constexpr char kNANDInfoDemoModeKey[] = "com.norba.NANDInfo.DemoMode";
inline constexpr char kNANDInfoNumVirtualBlocksKey[] = "com.norba.NANDInfo.NumVirtualBlocks";
inline constexpr char kNANDInfoPagesPerVirtualBlockKey[] =
    "com.norba.NANDInfo.PagesPerVirtualBlock";
inline constexpr char kNANDInfoBytesPerPageKey[] = "com.norba.NANDInfo.BytesPerPage";
inline constexpr char kNANDInfoNumLogicalReadsKey[] = "com.norba.NANDInfo.NumLogicalReads";
inline constexpr char kNANDInfoNumLogicalWritesKey[] = "com.norba.NANDInfo.NumLogicalWrites";
inline constexpr char kNANDInfoNumFreeVirtualBlocksKey[] =
    "com.norba.NANDInfo.NumFreeVirtualBlocks";
inline constexpr char kNANDInfoNumWearLevelOpsKey[] = "com.norba.NANDInfo.NumWearLevelOps";
inline constexpr char kNANDInfoNumPhysicalReadsKey[] = "com.norba.NANDInfo.NumPhysicalReads";
inline constexpr char kNANDInfoNumPhysicalWritesKey[] = "com.norba.NANDInfo.NumPhysicalWrites";
inline constexpr char kNANDInfoNumPhysicalErasesKey[] = "com.norba.NANDInfo.NumPhysicalErases";
inline constexpr char kNANDInfoNumNodesFreeKey[] = "com.norba.NANDInfo.NodesFree";
inline constexpr char kNANDInfoNumNodesTotalKey[] = "com.norba.NANDInfo.NodesTotal";
inline constexpr char kNANDInfoFormatWeeksSince2000Key[] = "com.norba.NANDInfo.formatDaysSince2000";
inline constexpr char kNANDInfoNumSleepOpsKey[] = "com.norba.NANDInfo.NumSleepOps";
inline constexpr char kNANDInfoHighEnduranceBlockEraseCountKey[] =
    "com.norba.NANDInfo.HighEnduranceBlockEraseCount";
inline constexpr char kNANDInfoBlocksPerVirtualBlock[] = "com.norba.NANDInfo.BlocksPerVirtualBlock";
inline constexpr const char* kNANDInfoReadsBeforeErasureKeys[] = {
    "com.norba.NANDInfo.ReadsBeforeErasure0", "com.norba.NANDInfo.ReadsBeforeErasure50000",
    "com.norba.NANDInfo.ReadsBeforeErasure100000", "com.norba.NANDInfo.ReadsBeforeErasure150000",
    "com.norba.NANDInfo.ReadsBeforeErasure200000"};
inline constexpr char kNANDInfoIntermediatePartitionSizeKey[] =
    "com.norba.NANDInfo.IntermediatePartitionSize";
inline constexpr char kNANDInfoNumMaintenanceRequestsKey[] =
    "com.norba.NANDInfo.NumMaintenanceRequests";
inline constexpr char kNANDInfoMaintenanceFailedReadKey[] =
    "com.norba.NANDInfo.MaintenanceRequestsFailedRead";
inline constexpr char kNANDInfoMaintenanceFailedProgKey[] =
    "com.norba.NANDInfo.MaintenanceRequestsFailedProg";
inline constexpr char kNANDInfoMaintenanceFailedEraseKey[] =
    "com.norba.NANDInfo.MaintenanceRequestsFailedErase";
inline constexpr char kNANDInfoSpacereapTotalPurgeableKey[] =
    "com.norba.NANDInfo.Spacereap.TotalPurgeableBytes";
inline constexpr char kNANDInfoSpacereapTotalNonPurgeableKey[] =
    "com.norba.NANDInfo.Spacereap.TotalNonPurgeableBytes";

// What a dictionary holds instead when there is nothing to be had, or beside it.
inline constexpr char kNANDInfoErrorKey[] = "com.norba.NANDInfo.Error";
inline constexpr char kNANDInfoErrorMessageKey[] = "com.norba.NANDInfo.ErrorMessage";

// What the FTL collector adds: 1 or 0.
inline constexpr char kNANDInfoIsQRT1Controller[] = "com.norba.NANDInfo.IsQRT1Controller";
inline constexpr char kNANDInfoIsStatMagSupported[] = "com.norba.NANDInfo.IsStatMagSupported";

// For users of the library; nothing here writes them.
inline constexpr char kNANDInfoPrndPlaceholder[] = "prnd.key.placeholder";
inline constexpr char kNANDInfoLogEVOnly[] = "log.only.to.EV";
inline constexpr char kNANDInfoVMFreezerErrorKey[] = "com.norba.NANDInfo.VMFreezer.Error";
inline constexpr char kNANDInfoVMFreezerErrorMessageKey[] =
    "com.norba.NANDInfo.VMFreezer.ErrorMessage";

// The swap-out thread's writes, beside kTLM_VMFreezer_bytesWritten.
inline constexpr char kNANDInfoVMFreezerNumPhysicalWritesKey[] =
    "com.norba.NANDInfo.VMFreezer.NumPhysicalWrites";

// The derived FTL fields.
inline constexpr char kTLM_Spacereap_totalPurgeable[] = "TLM_Spacereap_totalPurgeable";
inline constexpr char kTLM_Spacereap_totalNonPurgeable[] = "TLM_Spacereap_totalNonPurgeable";
inline constexpr char kTLM_VMFreezer_bytesWritten[] = "TLM_VMFreezer_bytesWritten";
inline constexpr char kTLM_DQ_Capacity_GB[] = "TLM_DQ_Capacity_GB";
inline constexpr char kTLM_DQ_Diskfullness_BP[] = "TLM_DQ_Diskfullness_BP";
inline constexpr char kTLM_DQ_AmountDataAvailable_MB[] = "TLM_DQ_AmountDataAvailable_MB";
inline constexpr char kTLM_Capacity_GB[] = "TLM_Capacity_GB";
inline constexpr char kTLM_Diskfullness_BP[] = "TLM_Diskfullness_BP";
inline constexpr char kTLM_UserCapacity_MB[] = "TLM_UserCapacity_MB";
inline constexpr char kTLM_storeDemoMode[] = "TLM_storeDemoMode";
inline constexpr char kTLM_intermediatePartitionSize[] = "TLM_intermediatePartitionSize";
inline constexpr char kTLM_formatWeeksSince2000[] = "TLM_formatWeeksSince2000";
inline constexpr char kTLM_averageSLCPECycles[] = "TLM_averageSLCPECycles";
inline constexpr char kTLM_averageTLCPECycles[] = "TLM_averageTLCPECycles";
inline constexpr char kTLM_hostWrites[] = "TLM_hostWrites";
inline constexpr char kTLM_powerOnHours[] = "TLM_powerOnHours";
inline constexpr char kTLM_powerOnSeconds[] = "TLM_powerOnSeconds";
inline constexpr char kTLM_numBootBlockRefreshes_max[] = "TLM_numBootBlockRefreshes_max";
inline constexpr char kTLM_mspBootBlockReadFails_main[] = "TLM_mspBootBlockReadFails_main";
inline constexpr char kTLM_mspBootBlockReadFails_backup[] = "TLM_mspBootBlockReadFails_backup";
inline constexpr char kTLM_mspBootBlockProgFails_main[] = "TLM_mspBootBlockProgFails_main";
inline constexpr char kTLM_mspBootBlockProgFails_backup[] = "TLM_mspBootBlockProgFails_backup";
inline constexpr char kTLM_mspBootBlockEraseFails_main[] = "TLM_mspBootBlockEraseFails_main";
inline constexpr char kTLM_mspBootBlockEraseFails_backup[] = "TLM_mspBootBlockEraseFails_backup";

// Of the stats magazine: a snapshot's time in seconds, the distance of two snapshots in days, and
// the write amplification of garbage collection in each of the last six windows of four hours.
inline constexpr char kTLM_magazineTimeStamp[] = "TLM_magazineTimeStamp";
inline constexpr char kTLM_SM_deltaDays[] = "TLM_SM_deltaDays";
inline constexpr const char* kTLM_instantaneous_gc_wamp_array[] = {
    "TLM_instantaneous_gc_wamp_0", "TLM_instantaneous_gc_wamp_1", "TLM_instantaneous_gc_wamp_2",
    "TLM_instantaneous_gc_wamp_3", "TLM_instantaneous_gc_wamp_4", "TLM_instantaneous_gc_wamp_5"};

// In every whitelisted result.
inline constexpr char kTLM_APIErrorMessage[] = "TLM_APIErrorMessage";

// The disk information.
inline constexpr const char* kDiskInfo_TLM_DQ_Capacity_GB = kTLM_DQ_Capacity_GB;
inline constexpr const char* kDiskInfo_TLM_DQ_Diskfullness_BP = kTLM_DQ_Diskfullness_BP;
inline constexpr const char* kDiskInfo_TLM_DQ_AmountDataAvailable_MB =
    kTLM_DQ_AmountDataAvailable_MB;
inline constexpr const char* kDiskInfo_TLM_Capacity_GB = kTLM_Capacity_GB;
inline constexpr const char* kDiskInfo_TLM_Diskfullness_BP = kTLM_Diskfullness_BP;
inline constexpr const char* kDiskInfo_TLM_UserCapacity_MB = kTLM_UserCapacity_MB;

// Of each MSP.
inline constexpr char kTLM_MSP_fw_version_identifier[] = "fw_version_identifier";
inline constexpr char kTLM_MSP_fw_version_identifier_0[] = "fw_version_identifier_0";
inline constexpr char kTLM_MSP_fw_version_identifier_1[] = "fw_version_identifier_1";
inline constexpr char kTLM_MSP_fw_version_identifier_2[] = "fw_version_identifier_2";
inline constexpr char kTLM_MSP_fw_version_identifier_3[] = "fw_version_identifier_3";
inline constexpr char kTLM_MSP_msp_index[] = "msp_index";
inline constexpr char kTLM_MSP_total_nof_msps[] = "total_nof_msps";

// The EAN values of the storage statistics.
inline constexpr char kEAN_imageSize_BIC[] = "EAN_imageSize_BIC";
inline constexpr char kEAN_imageSize_LTH[] = "EAN_imageSize_LTH";
inline constexpr char kEAN_updateCount_FW[] = "EAN_updateCount_FW";
inline constexpr char kEAN_updateCount_BIC[] = "EAN_updateCount_BIC";
inline constexpr char kEAN_updateCount_LTH[] = "EAN_updateCount_LTH";
inline constexpr char kEAN_updateCount_dConfig[] = "EAN_updateCount_dConfig";
inline constexpr char kEAN_updateCount_fConfig[] = "EAN_updateCount_fConfig";
inline constexpr char kEAN_updateCount_NonEssentialFW[] = "EAN_updateCount_NonEssentialFW";
inline constexpr char kEAN_updateCount_LowPowerEM[] = "EAN_updateCount_LowPowerEM";

// The health figures, and their common prefix.
inline constexpr char kNANDHealthInfoPrefix[] = "com.norba.NANDInfo.Health.";
inline constexpr char kNANDHealthInfoMaxPercentUsed[] =
    "com.norba.NANDInfo.Health.MaxPercentageNANDUsed";
inline constexpr char kNANDHealthInfoMaxE2EErrors[] = "com.norba.NANDInfo.Health.MaxE2EErrors";
inline constexpr char kNANDHealthInfoHostReadErrors[] = "com.norba.NANDInfo.Health.HostReadErrors";
inline constexpr char kNANDHealthInfoNumGrownBadBlocks[] =
    "com.norba.NANDInfo.Health.NumGrownBadBlocks";
inline constexpr char kNANDHealthInfoSpareAvailablePercent[] =
    "com.norba.NANDInfo.Health.SpareAvailablePercent";
inline constexpr char kNANDHealthInfoNumDieFailures[] = "com.norba.NANDInfo.Health.NumDieFailures";
inline constexpr char kNANDHealthInfoIsNANDRetirable[] =
    "com.norba.NANDInfo.Health.IsNANDRetirable";

}  // namespace NANDInfo
