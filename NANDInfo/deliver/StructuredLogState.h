// What a dump of the diagnostic lists works out before it fetches them, for its handlers. It holds
// until the next dump.
#pragma once

namespace NANDInfo {

inline bool gForceCollectionSet =
    false;  // the validity list is wanted always; nothing here sets it
inline bool gNeedValidityList = false;
inline double gCurrentUserWamp = 0;  // write amplification, as WriteAmplification.h has it
inline double gCurrentSysWamp = 0;   // the same of the intermediate blocks

// Sets all to what they are when the process begins.
inline void ResetStructuredLogState() {
  gForceCollectionSet = gNeedValidityList = false;
  gCurrentUserWamp = gCurrentSysWamp = 0;
}

}  // namespace NANDInfo
