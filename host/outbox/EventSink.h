// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The analytics event sink: events as JSON Lines in var/spool/morvend/events.jsonl. A file that
// would grow beyond kMaxFile becomes events.jsonl.1 first, that .2, and so on; of more than
// kKept the oldest is removed, with a line in the log. A number that is taken by anything but a
// file is passed over, with a line too. While a run is on, its events wait; no more than kMaxFile.
//
// device/analytics.plist says which events are used ("UsedEvents", an array of names; missing: all)
// and whether the device has the lazy-send operation ("Available"; default true). It is read when
// it is first needed.
#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <unordered_set>
#include <vector>

#include "base/Result.h"
#include "host/files/DeviceFile.h"
#include "host/files/Pending.h"
#include "host/outbox/LineFiles.h"
#include "platform/Clock.h"
#include "platform/Eventra.h"
#include "platform/SystemLog.h"
#include "plist/PropertyList.h"

namespace host {

class EventSink final : public platform::Eventra {
 public:
  // Events beyond this number of waiting ones aren't queued.
  static constexpr std::size_t kMaxQueued = 65536;

  static constexpr std::uint64_t kMaxFile = std::uint64_t{16} << 20;
  static constexpr int kKept = 4;

  // All are borrowed; the clock is asked on the sender's thread, the log used on both. The run
  // begins and ends while nothing is queued.
  EventSink(const DeviceRoot& root, platform::Clock& clock, platform::SystemLog& log,
            const PendingRun& run)
      : root_(root),
        clock_(clock),
        log_(log),
        run_(run),
        file_(root, log, "device/analytics.plist") {}

  // Drains.
  ~EventSink() override;

  bool offersLazySend() override;
  bool EventraIsEventUsed(std::string_view event) override;

  // The sink's thread starts with the first event. The time of an event is when it was sent.
  bool EventraSendEventLazy(std::string_view event, PayloadProducer producer) override;

  // Writes every event that was sent, and ends the thread until another is sent. Events that can't
  // be written are dropped; the first failure is logged. For one thread at a time, and not for
  // producers.
  void drain();

  // Drains, and brings to disk what waits for the end of the run.
  base::Result<void> synchronise();

  // Lets what waits leave, or drops it. Nothing is queued.
  base::Result<void> settle(const Leaves& leaves);

 private:
  struct Event {
    std::string name;
    plist::Date time;
    PayloadProducer producer;
  };
  struct Configuration {
    struct Hash : std::hash<std::string_view> {
      using is_transparent = void;
    };
    bool available = true;
    std::optional<std::unordered_set<std::string, Hash, std::equal_to<>>> used;
  };

  const Configuration& configuration();
  bool isServing();
  void serve();
  void write(const std::vector<Event>& events);
  base::Result<void> append(const std::string& lines);
  base::Result<void> makeRoom(int folder, const std::string& file, std::uint64_t bytes);

  const DeviceRoot& root_;
  platform::Clock& clock_;
  platform::SystemLog& log_;
  const PendingRun& run_;

  DeviceFile file_;  // the configuration's
  std::once_flag configured_;
  Configuration configuration_;

  std::mutex mutex_;  // over all that follows
  std::condition_variable changed_;
  std::vector<Event> queue_;
  bool serving_ = false;   // a thread looks at the queue
  bool draining_ = false;  // it ends when the queue is empty
  std::thread thread_;     // empty while nothing is served, and while somebody waits for its end

  bool failed_ = false;  // the sink's thread's
};

}  // namespace host
