// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/EventSink.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <optional>
#include <system_error>

#include "host/files/Files.h"
#include "host/files/SystemError.h"
#include "plist/JSON.h"
#include "plist/PropertyList.h"

namespace host {

namespace {

constexpr char kFolder[] = "/var/spool/morvend";
constexpr char kName[] = "events.jsonl";

// Lines are written together up to about this size.
constexpr std::size_t kBatch = std::size_t{256} << 10;

}  // namespace

EventSink::~EventSink() { drain(); }

const EventSink::Configuration& EventSink::configuration() {
  std::call_once(configured_, [this] {
    const plist::Dictionary* entries = file_.dictionary();
    if (entries == nullptr) return;
    if (const plist::Number* available = entries->number("Available")) {
      configuration_.available = available->boolValue();
    }
    if (const plist::Array* names = entries->array("UsedEvents")) {
      auto& used = configuration_.used.emplace();
      for (const plist::Value& name : *names) {
        if (const auto* text = name.as<std::string>()) used.insert(*text);
      }
    }
  });
  return configuration_;
}

bool EventSink::offersLazySend() { return configuration().available; }

bool EventSink::EventraIsEventUsed(std::string_view event) {
  const auto& used = configuration().used;
  return !used || used->contains(event);
}

bool EventSink::EventraSendEventLazy(std::string_view event, PayloadProducer producer) {
  if (!offersLazySend() || !EventraIsEventUsed(event)) return false;
  Event sent{std::string(event), clock_.now(), std::move(producer)};
  const std::scoped_lock lock(mutex_);
  if (queue_.size() >= kMaxQueued || !isServing()) return false;
  queue_.push_back(std::move(sent));
  changed_.notify_one();
  return true;
}

// Whether there is a thread that will see the queue, started if need be. The mutex is held.
bool EventSink::isServing() {
  if (serving_) return true;
  draining_ = false;
  try {
    thread_ = std::thread([this] { serve(); });
  } catch (const std::system_error&) {
    return false;
  }
  return serving_ = true;
}

void EventSink::drain() {
  std::thread ending;
  {
    const std::scoped_lock lock(mutex_);
    draining_ = true;
    ending.swap(thread_);
    changed_.notify_one();
  }
  if (ending.joinable()) ending.join();
}

void EventSink::serve() {
  std::unique_lock lock(mutex_);
  for (;;) {
    changed_.wait(lock, [this] { return draining_ || !queue_.empty(); });
    if (queue_.empty()) break;
    std::vector<Event> events;
    events.swap(queue_);
    lock.unlock();
    write(events);
    events.clear();
    lock.lock();
  }
  serving_ = false;
}

void EventSink::write(const std::vector<Event>& events) {
  std::string lines;
  for (const Event& event : events) {
    plist::appendJSON(
        lines, plist::Dictionary{
                   {"event", event.name}, {"time", event.time}, {"payload", event.producer()}});
    lines += '\n';
    if (lines.size() < kBatch && &event != &events.back()) continue;
    const auto appended = append(lines);
    if (!appended && !failed_) {
      log_.log(platform::LogLevel::error, "Could not write %s; events are dropped",
               appended.error().text.c_str());
      failed_ = true;
    }
    lines.clear();
  }
}

base::Result<void> EventSink::append(const std::string& lines) {
  const std::string path = root_.hostPath(kFolder, kName);
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::create);
  if (!folder) return folder.error().at(path);
  const std::string name = run_.nameFor(kName);
  std::optional<FileLock> rollingOver;  // which another process may do, too, but to what waits
  if (!run_.isOn()) {
    auto lock = FileLock::take(folder->get(), {log_, root_.hostPath(kFolder)});
    if (!lock) return lock.error().at(path);
    rollingOver.emplace(*std::move(lock));
  }
  if (auto room = makeRoom(folder->get(), name, lines.size()); !room) return room;
  const auto append = [&] { return appendLines(folder->get(), name, lines, {log_, path}); };
  return root_.patience()(append).at(path);
}

base::Result<void> EventSink::synchronise() {
  drain();
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(kFolder));
  return synchronisePending(folder->get()).at(root_.hostPath(kFolder));
}

base::Result<void> EventSink::settle(const Leaves& leaves) {
  const auto folder = root_.openFolder(kFolder, DeviceRoot::Missing::fails);
  if (!folder) return unlessMissing(folder.error(), root_.hostPath(kFolder));
  const LockWait wait{log_, root_.hostPath(kFolder)};
  const auto lock = FileLock::take(folder->get(), wait);
  if (!lock) return lock.error().at(wait.path);
  return settleLines(
             folder->get(), leaves,
             [&](const std::string& name, std::uint64_t bytes) {
               return makeRoom(folder->get(), name, bytes);
             },
             wait)
      .at(root_.hostPath(kFolder));
}

base::Result<void> EventSink::makeRoom(int folder, const std::string& file, std::uint64_t bytes) {
  // What is not a file of ours, or can't be looked at, is the append's to refuse.
  struct stat status;
  if (::fstatat(folder, file.c_str(), &status, AT_SYMLINK_NOFOLLOW) != 0) return {};
  const auto size = static_cast<std::uint64_t>(status.st_size);
  if (!S_ISREG(status.st_mode) || size == 0 || size + bytes <= kMaxFile) return {};
  // What waits can't roll over; of what leaves, only this file does.
  if (file != kName) return systemError(EFBIG).at(root_.hostPath(kFolder, kName));
  const auto rolled = rollOver(folder, root_.hostPath(kFolder), kName, kKept);
  if (!rolled) return rolled.error();
  if (!rolled->dropped.empty()) {
    log_.log(platform::LogLevel::standard, "Dropped the events of %s: there are newer ones",
             root_.hostPath(kFolder, rolled->dropped).c_str());
  }
  for (const std::string& name : rolled->inTheWay) {
    log_.log(platform::LogLevel::error, "Passed over %s: %s", root_.hostPath(kFolder, name).c_str(),
             notRegular().text.c_str());
  }
  return {};
}

}  // namespace host
