#include "NANDInfo/EAN.h"
#include "NANDInfo/Keys.h"

namespace NANDInfo {

namespace {

constexpr EANQuery kQueries[] = {
    {kEAN_imageSize_BIC, GetEANImageSize, 0x64424943},                 // dBIC
    {kEAN_imageSize_LTH, GetEANImageSize, 0x644C5448},                 // dLTH
    {kEAN_updateCount_FW, GetEANUpdateCount, 0x69667731},              // ifw1
    {kEAN_updateCount_BIC, GetEANUpdateCount, 0x64424943},             // dBIC
    {kEAN_updateCount_LTH, GetEANUpdateCount, 0x644C5448},             // dLTH
    {kEAN_updateCount_dConfig, GetEANUpdateCount, 0x64436667},         // dCfg
    {kEAN_updateCount_fConfig, GetEANUpdateCount, 0x66436667},         // fCfg
    {kEAN_updateCount_NonEssentialFW, GetEANUpdateCount, 0x6E656677},  // nefw
    {kEAN_updateCount_LowPowerEM, GetEANUpdateCount, 0x4C50454D},      // LPEM
};

}  // namespace

std::span<const EANQuery> EANQueries() { return kQueries; }

}  // namespace NANDInfo
