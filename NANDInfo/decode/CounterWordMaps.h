// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Where the words of the common counter layout lie in each vendor's block.
#pragma once

#include <cstdint>

namespace NANDInfo::word_maps {

// So many consecutive words of the record, copied from consecutive words of the block. Ordered by
// output; words that no row names are not written.
struct WordRun {
  std::uint16_t output;
  std::uint16_t input;  // or kZero: zeroes are written
  std::uint16_t count;
};

inline constexpr std::uint16_t kZero = 0xFFFF;

// clang-format off
inline constexpr WordRun k1y[] = {
    {0, 256, 8},
    {8, 265, 1},
    {9, 267, 10},
    {19, 303, 1},
    {20, 390, 2},
    {22, 372, 1},
    {33, 278, 8},
    {41, 277, 1},
    {42, 290, 1},
    {43, 371, 1},
    {44, 393, 1},
    {45, 392, 1},
    {56, 292, 8},
    {65, 21, 1},
    {66, 305, 2},
    {68, 313, 5},
    {73, 370, 1},
    {74, 15, 1},
    {75, 531, 2},
    {103, 318, 20},
    {125, 338, 20},
    {145, 373, 12},
};

inline constexpr WordRun k1xSandisk[] = {
    {0, 256, 6},
    {6, kZero, 2},
    {8, 265, 1},
    {9, 267, 7},
    {16, kZero, 1},
    {17, 275, 2},
    {19, 301, 1},
    {20, kZero, 3},
    {33, 278, 6},
    {39, kZero, 2},
    {41, 277, 1},
    {42, 288, 1},
    {43, kZero, 3},
    {56, 290, 8},
    {65, 16, 1},
    {66, 303, 2},
    {68, 311, 5},
    {73, kZero, 1},
    {74, 10, 1},
    {75, kZero, 2},
};

inline constexpr WordRun k1xHynix[] = {
    {0, 256, 4},
    {4, kZero, 4},
    {8, 263, 1},
    {9, 265, 7},
    {16, kZero, 1},
    {17, 273, 2},
    {19, 297, 1},
    {20, kZero, 3},
    {33, 276, 4},
    {37, kZero, 4},
    {41, 275, 1},
    {42, 284, 1},
    {43, kZero, 3},
    {56, 286, 8},
    {65, 16, 1},
    {66, 299, 2},
    {68, 307, 5},
    {73, kZero, 1},
    {74, 10, 1},
    {75, kZero, 2},
};

inline constexpr WordRun kAlgoGeneric[] = {
    {0, 0, 19},
    {19, 37, 1},
    {20, 117, 2},
    {22, 91, 1},
    {33, 20, 8},
    {41, 19, 1},
    {42, 116, 1},
    {43, 90, 1},
    {44, 120, 1},
    {45, 119, 1},
    {56, 28, 8},
    {65, 104, 1},
    {66, 38, 7},
    {73, 89, 1},
    {74, 105, 1},
    {75, 114, 2},
    {103, 45, 20},
    {125, 67, 20},
    {145, 92, 12},
    {157, 106, 8},
};

inline constexpr WordRun kAlgoGenericQ8[] = {
    {0, 0, 8},
    {8, kZero, 1},
    {9, 9, 10},
    {19, 27, 1},
    {20, 105, 2},
    {22, 79, 1},
    {23, kZero, 2},
    {25, 115, 4},
    {29, 8, 1},
    {30, 120, 2},
    {32, 110, 1},
    {33, kZero, 8},
    {41, 19, 1},
    {42, 104, 1},
    {43, 78, 1},
    {44, 108, 1},
    {45, 107, 1},
    {46, 122, 1},
    {56, 20, 3},
    {59, kZero, 1},
    {60, 23, 3},
    {63, kZero, 1},
    {65, 92, 1},
    {66, 28, 2},
    {68, kZero, 6},
    {74, 93, 1},
    {75, 102, 2},
    {77, kZero, 1},
    {78, 30, 3},
    {81, 77, 1},
    {82, 112, 3},
    {85, 126, 1},
    {86, 123, 1},
    {87, 94, 5},
    {92, kZero, 1},
    {93, 99, 3},
    {96, 109, 1},
    {97, 111, 1},
    {98, 45, 4},
    {102, 26, 1},
    {103, 33, 12},
    {115, kZero, 8},
    {125, 55, 20},
    {145, 80, 12},
    {165, kZero, 2},
    {167, 75, 2},
    {169, kZero, 8},
};
// clang-format on

}  // namespace NANDInfo::word_maps
