// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// key, group, options {bucket interval, significant figures}, typical value, day by day
#include "tools/mkdevice/Vocabulary.h"

namespace mkdevice {

namespace {

using enum Group;
using enum Daily;

// clang-format off
constexpr ScalarRow kScalars[] = {
    {"com.norba.battery.charge_cycles", battery, {}, 412, growing},
    {"com.norba.battery.full_charge_capacity_mah", battery, {.bucketInterval = 10}, 3046, constant},
    {"com.norba.battery.design_capacity_mah", battery, {}, 3227, constant},
    {"com.norba.battery.plugged_in_minutes", battery, {.bucketInterval = 15}, 342, weekends},
    {"com.norba.battery.plug_ins", battery, {}, 3, workdays},
    {"com.norba.battery.wireless_charges", battery, {}, 1, weekends},
    {"com.norba.battery.discharge_mah", battery, {.significantFigures = 2}, 2860, workdays},
    {"com.norba.battery.low_power_minutes", battery, {.bucketInterval = 15}, 48, workdays},
    {"com.norba.battery.unexpected_shutdowns", battery, {}, 1, rare},
    {"com.norba.battery.thermal_pauses", battery, {}, 4, rare},
    {"com.norba.battery.optimized_charges", battery, {}, 1, steady},
    {"com.norba.battery.peak_current_ma", battery, {.bucketInterval = 50, .significantFigures = 2}, 1874, steady},

    {"com.norba.display.on_minutes", display, {.bucketInterval = 10}, 287, weekends},
    {"com.norba.display.wakes", display, {.significantFigures = 2}, 96, workdays},
    {"com.norba.display.wakes_by_raise", display, {.significantFigures = 2}, 41, workdays},
    {"com.norba.display.unlocks", display, {.significantFigures = 2}, 78, workdays},
    {"com.norba.display.always_on_minutes", display, {.bucketInterval = 10}, 652, steady},
    {"com.norba.display.dark_mode_minutes", display, {.bucketInterval = 10}, 118, weekends},
    {"com.norba.display.night_tint_minutes", display, {.bucketInterval = 10}, 94, steady},
    {"com.norba.display.rotations", display, {.significantFigures = 1}, 17, weekends},
    {"com.norba.display.dropped_frames", display, {.bucketInterval = 10, .significantFigures = 2}, 1263, workdays},
    {"com.norba.display.panel_resets", display, {}, 2, rare},

    {"com.norba.radio.wifi.joins", radio, {}, 9, workdays},
    {"com.norba.radio.wifi.join_failures", radio, {}, 2, rare},
    {"com.norba.radio.wifi.roams", radio, {.bucketInterval = 5}, 23, workdays},
    {"com.norba.radio.wifi.connected_minutes", radio, {.bucketInterval = 30}, 934, weekends},
    {"com.norba.radio.wifi.received_kib", radio, {.significantFigures = 2}, 1864200, weekends},
    {"com.norba.radio.wifi.sent_kib", radio, {.significantFigures = 2}, 214800, weekends},
    {"com.norba.radio.bluetooth.connections", radio, {}, 6, workdays},
    {"com.norba.radio.bluetooth.dropouts", radio, {}, 3, rare},
    {"com.norba.radio.bluetooth.audio_minutes", radio, {.bucketInterval = 10}, 83, workdays},
    {"com.norba.radio.airplane_mode_minutes", radio, {.bucketInterval = 30}, 390, rare},
    {"com.norba.radio.cell.registrations", none, {}, 14, workdays},
    {"com.norba.radio.cell.handovers", none, {}, 126, workdays},
    {"com.norba.radio.cell.received_kib", none, {}, 286400, workdays},
    {"com.norba.radio.cell.sent_kib", none, {}, 42700, workdays},
    {"com.norba.radio.cell.no_service_minutes", none, {}, 12, workdays},
    {"com.norba.radio.cell.calls", none, {}, 5, workdays},
    {"com.norba.radio.cell.calls_dropped", none, {}, 1, rare},
    {"com.norba.radio.cell.band1.minutes", none, {}, 211, workdays},
    {"com.norba.radio.cell.band3.minutes", none, {}, 438, workdays},
    {"com.norba.radio.cell.band7.minutes", none, {}, 87, workdays},
    {"com.norba.radio.cell.band20.minutes", none, {}, 322, weekends},
    {"com.norba.radio.cell.band28.minutes", none, {}, 64, weekends},

    {"com.norba.storage.written_mib", storage, {.significantFigures = 2}, 6430, workdays},
    {"com.norba.storage.read_mib", storage, {.significantFigures = 2}, 18260, workdays},
    {"com.norba.storage.trimmed_mib", storage, {.significantFigures = 2}, 3120, workdays},
    {"com.norba.storage.free_mib", storage, {.bucketInterval = 256}, 41870, steady},
    {"com.norba.storage.files_created", storage, {.significantFigures = 2}, 12840, workdays},
    {"com.norba.storage.purges", storage, {}, 2, rare},
    {"com.norba.storage.purged_mib", storage, {.bucketInterval = 64}, 860, rare},
    {"com.norba.storage.checks_failed", storage, {}, 1, rare},
    {"com.norba.storage.slow_writes", storage, {.significantFigures = 1}, 34, workdays},
    {"com.norba.storage.low_space_warnings", storage, {}, 1, rare},
    {"com.norba.storage.snapshots", storage, {}, 4, steady},
    {"com.norba.storage.journal_replays", storage, {}, 1, rare},

    {"com.norba.system.boots", system, {}, 1, rare},
    {"com.norba.system.panics", system, {}, 1, rare},
    {"com.norba.system.sleeps", system, {.significantFigures = 2}, 318, steady},
    {"com.norba.system.awake_minutes", system, {.bucketInterval = 10}, 496, workdays},
    {"com.norba.system.low_memory_kills", system, {}, 7, workdays},
    {"com.norba.system.watchdog_resets", system, {}, 1, rare},
    {"com.norba.system.thermal_warnings", system, {}, 2, rare},
    {"com.norba.system.interrupts_per_second", system, {.significantFigures = 2}, 1460, workdays},
    {"com.norba.system.context_switches_million", system, {.significantFigures = 2}, 128, workdays},
    {"com.norba.system.compressed_mib", system, {.bucketInterval = 16}, 742, workdays},
    {"com.norba.system.clock_corrections", system, {}, 2, steady},
    {"com.norba.applications.launches", system, {.bucketInterval = 5}, 143, workdays},
    {"com.norba.applications.resumes", system, {.bucketInterval = 5}, 268, workdays},
    {"com.norba.applications.crashes", system, {}, 3, rare},
    {"com.norba.applications.hangs", system, {}, 4, rare},
    {"com.norba.applications.installs", system, {}, 2, rare},
    {"com.norba.applications.removals", system, {}, 1, rare},
    {"com.norba.applications.updates", system, {}, 6, weekends},
    {"com.norba.applications.background_refreshes", system, {.significantFigures = 2}, 214, steady},
    {"com.norba.applications.notifications", system, {.significantFigures = 2}, 173, workdays},
    {"com.norba.applications.foreground.camera", none, {}, 19, weekends},
    {"com.norba.applications.foreground.maps", none, {}, 31, weekends},
    {"com.norba.applications.foreground.reader", none, {}, 44, workdays},
    {"com.norba.applications.foreground.music", none, {}, 72, workdays},
    {"com.norba.applications.foreground.notes", none, {}, 12, workdays},
    {"com.norba.applications.foreground.games", none, {}, 38, weekends},

    {"com.norba.experiments.predictive_wake.hits", experiments, {}, 52, workdays},
    {"com.norba.experiments.predictive_wake.misses", experiments, {}, 9, workdays},
    {"com.norba.experiments.adaptive_refresh.switches", experiments, {.significantFigures = 2}, 1370, workdays},
    {"com.norba.experiments.adaptive_refresh.saved_mah", experiments, {.bucketInterval = 5}, 64, workdays},
    {"com.norba.experiments.quiet_sync.runs", experiments, {}, 11, steady},

    {"com.norba.internal.assertions_logged", internalTesting, {}, 27, workdays},
    {"com.norba.internal.verbose_log_mib", internalTesting, {}, 185, workdays},
    {"com.norba.internal.dogfood_builds_installed", internalTesting, {}, 1, rare},
    {"com.norba.internal.test_hooks_fired", internalTesting, {}, 640, workdays},

    {"com.norba.messages.sent", none, {}, 37, workdays},
    {"com.norba.messages.received", none, {}, 52, workdays},
    {"com.norba.messages.attachments", none, {}, 4, weekends},
    {"com.norba.contacts.count", none, {}, 286, growing},
    {"com.norba.contacts.favorites_called", none, {}, 3, weekends},
    {"com.norba.photos.taken", none, {}, 12, weekends},
    {"com.norba.photos.shared", none, {}, 3, weekends},
    {"com.norba.photos.library_count", none, {}, 14820, growing},
    {"com.norba.health.steps", none, {}, 7340, workdays},
    {"com.norba.health.stairs", none, {}, 11, workdays},
    {"com.norba.health.stand_hours", none, {}, 10, workdays},
    {"com.norba.location.visits", none, {}, 6, weekends},
    {"com.norba.location.places_learned", none, {}, 58, growing},
    {"com.norba.keyboard.words_typed", none, {}, 1240, workdays},
    {"com.norba.keyboard.corrections", none, {}, 88, workdays},
    {"com.norba.keyboard.learned_words", none, {}, 2380, growing},
    {"com.norba.browser.pages_opened", none, {}, 64, weekends},
    {"com.norba.browser.bookmarks", none, {}, 143, growing},
    {"com.norba.wallet.payments", none, {}, 2, workdays},
    {"com.norba.voice.requests", none, {}, 5, workdays},
    {"com.norba.alarms.snoozed", none, {}, 2, workdays},
    {"com.norba.calendar.events", none, {}, 4, workdays},
};
// clang-format on

}  // namespace

std::span<const ScalarRow> scalarTable() { return kScalars; }

}  // namespace mkdevice
