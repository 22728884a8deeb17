// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// key, group, options {histogram bounds}, typical value, spread, shape, samples a day, day by day
#include "tools/mkdevice/Vocabulary.h"

namespace mkdevice {

namespace {

using enum Group;
using enum Daily;
using enum Shape;

constexpr double kPercent[] = {10, 20, 35, 50, 65, 80, 95};
constexpr double kCelsius[] = {15, 20, 25, 30, 35, 40, 45};
constexpr double kMilliamperes[] = {50, 100, 250, 500, 1000, 2000};
constexpr double kNits[] = {2, 10, 50, 100, 200, 400, 800};
constexpr double kFrameMilliseconds[] = {8.5, 16.7, 33.4, 50, 100};
constexpr double kDecibels[] = {-110, -100, -90, -80, -70, -60, -50};
constexpr double kSeconds[] = {0.5, 1, 2, 5, 10, 30, 60};
constexpr double kMicroseconds[] = {100, 250, 500, 1000, 2500, 10000};
constexpr double kMilliseconds[] = {100, 200, 400, 800, 1600, 3200};
constexpr double kMegabytes[] = {64, 128, 256, 512, 1024};

// clang-format off
constexpr DistributionRow kDistributions[] = {
    {"com.norba.battery.level_percent", battery, {.intervals = kPercent}, 54, 0.8, even, 144, steady},
    {"com.norba.battery.temperature_celsius", battery, {.intervals = kCelsius}, 28, 0.13, bell, 144, workdays},
    {"com.norba.battery.discharge_current_ma", battery, {.intervals = kMilliamperes}, 210, 0.8, longTail, 288, workdays},
    {"com.norba.battery.voltage_mv", battery, {}, 3870, 0.04, bell, 144, steady},
    {"com.norba.display.brightness_nits", display, {.intervals = kNits}, 120, 0.8, longTail, 220, weekends},
    {"com.norba.display.session_seconds", display, {}, 95, 0.9, longTail, 96, weekends},
    {"com.norba.display.frame_time_ms", display, {.intervals = kFrameMilliseconds}, 14, 0.6, longTail, 300, steady},
    {"com.norba.display.ambient_lux", display, {}, 180, 0.9, longTail, 180, weekends},
    {"com.norba.radio.wifi.signal_dbm", radio, {.intervals = kDecibels}, -62, 0.16, bell, 240, steady},
    {"com.norba.radio.wifi.join_seconds", radio, {.intervals = kSeconds}, 1.4, 0.9, longTail, 50, workdays},
    {"com.norba.radio.wifi.round_trip_ms", radio, {}, 24, 0.8, longTail, 200, steady},
    {"com.norba.radio.cell.signal_dbm", none, {}, -94, 0.09, bell, 240, steady},
    {"com.norba.radio.cell.round_trip_ms", none, {}, 52, 0.8, longTail, 150, steady},
    {"com.norba.radio.cell.attach_seconds", none, {}, 2.8, 0.8, longTail, 50, workdays},
    {"com.norba.storage.write_latency_us", storage, {.intervals = kMicroseconds}, 420, 0.9, longTail, 300, steady},
    {"com.norba.storage.read_latency_us", storage, {.intervals = kMicroseconds}, 180, 0.9, longTail, 300, steady},
    {"com.norba.storage.queue_depth", storage, {}, 3, 0.7, longTail, 180, workdays},
    {"com.norba.system.free_memory_mib", system, {.intervals = kMegabytes}, 340, 0.25, bell, 288, workdays},
    {"com.norba.system.processor_load_percent", system, {.intervals = kPercent}, 17, 0.85, longTail, 288, workdays},
    {"com.norba.applications.launch_ms", system, {.intervals = kMilliseconds}, 520, 0.7, longTail, 140, workdays},
    {"com.norba.experiments.predictive_wake.lead_ms", experiments, {}, 240, 0.25, bell, 60, workdays},
    {"com.norba.internal.test_hook_us", internalTesting, {.intervals = kMicroseconds}, 300, 0.9, longTail, 120, workdays},
    {"com.norba.messages.typing_seconds", none, {}, 11, 0.8, longTail, 60, workdays},
    {"com.norba.health.heart_rate_bpm", none, {}, 71, 0.15, bell, 288, steady},
    {"com.norba.location.speed_kmh", none, {}, 19, 0.9, longTail, 110, weekends},
};
// clang-format on

}  // namespace

std::span<const DistributionRow> distributionTable() { return kDistributions; }

}  // namespace mkdevice
