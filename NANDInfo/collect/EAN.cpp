// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/EAN.h"
#include "NANDInfo/Keys.h"

namespace NANDInfo {

namespace {

constexpr EANQuery kQueries[] = {
    {kEAN_imageSize_BIC, EANFigure::imageSize, 0x64424943},                 // dBIC
    {kEAN_imageSize_LTH, EANFigure::imageSize, 0x644C5448},                 // dLTH
    {kEAN_updateCount_FW, EANFigure::updateCount, 0x69667731},              // ifw1
    {kEAN_updateCount_BIC, EANFigure::updateCount, 0x64424943},             // dBIC
    {kEAN_updateCount_LTH, EANFigure::updateCount, 0x644C5448},             // dLTH
    {kEAN_updateCount_dConfig, EANFigure::updateCount, 0x64436667},         // dCfg
    {kEAN_updateCount_fConfig, EANFigure::updateCount, 0x66436667},         // fCfg
    {kEAN_updateCount_NonEssentialFW, EANFigure::updateCount, 0x6E656677},  // nefw
    {kEAN_updateCount_LowPowerEM, EANFigure::updateCount, 0x4C50454D},      // LPEM
};

}  // namespace

std::span<const EANQuery> EANQueries() { return kQueries; }

}  // namespace NANDInfo
