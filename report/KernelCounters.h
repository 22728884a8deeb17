// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The kernel values that the report reads as they are: the counter's key, the kernel's name for it.
// Rows stand in the order of the report.
#pragma once

namespace report {

// Both names end with a NUL; a value is whatever the kernel has at the time of the report.
struct KernelCounter {
  const char* key;
  const char* name;
};

// Read, as 32 bits each, when "vm.vmtc_total" is not 0.
inline constexpr KernelCounter kTagCheckCounters[] = {
    {"com.norba.kernel.vmtc_total", "vm.vmtc_total"},
    {"com.norba.kernel.vmtc_one_bit_flip", "vm.vmtc_one_bit_flip"},
    {"com.norba.kernel.vmtc_not_found", "vm.vmtc_not_found"},
    {"com.norba.kernel.vmtc_1_byte", "vm.vmtc_1_byte"},
    {"com.norba.kernel.vmtc_2_byte", "vm.vmtc_2_byte"},
    {"com.norba.kernel.vmtc_4_byte", "vm.vmtc_4_byte"},
    {"com.norba.kernel.vmtc_8_byte", "vm.vmtc_8_byte"},
    {"com.norba.kernel.vmtc_16_byte", "vm.vmtc_16_byte"},
    {"com.norba.kernel.vmtc_32_byte", "vm.vmtc_32_byte"},
    {"com.norba.kernel.vmtc_64_byte", "vm.vmtc_64_byte"},
    {"com.norba.kernel.vmtc_128_byte", "vm.vmtc_128_byte"},
    {"com.norba.kernel.vmtc_256_byte", "vm.vmtc_256_byte"},
    {"com.norba.kernel.vmtc_undiagnosed", "vm.vmtc_undiagnosed"},
};

// Read, as 64 bits each, as percentages of the processes that the freezer considered.
inline constexpr KernelCounter kFreezerErrorCounters[] = {
    {"com.norba.memorystatus_freezer_error_no_compressor_space_count",
     "kern.memorystatus_freezer_error_no_compressor_space_count"},
    {"com.norba.memorystatus_freezer_error_no_swap_space_count",
     "kern.memorystatus_freezer_error_no_swap_space_count"},
    {"com.norba.memorystatus_freezer_error_below_min_pages_count",
     "kern.memorystatus_freezer_error_below_min_pages_count"},
    {"com.norba.memorystatus_freezer_error_low_probability_of_use_count",
     "kern.memorystatus_freezer_error_low_probability_of_use_count"},
    {"com.norba.memorystatus_freezer_error_other_count",
     "kern.memorystatus_freezer_error_other_count"},
};

}  // namespace report
