// What the program under test and the tests know in common.
#pragma once

namespace subject {

inline constexpr char kDomain[] = "com.example";
inline constexpr char kNewValue[] = "new";
inline constexpr double kNow = 1795320000;  // 2026-11-22T04:00:00Z
inline constexpr char kLogBytes[] = "a log\nof two lines\n";

}  // namespace subject
