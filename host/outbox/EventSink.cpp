#include "host/outbox/EventSink.h"

#include <fcntl.h>
#include <sys/stat.h>

#include <cerrno>
#include <system_error>

#include "host/files/Files.h"
#include "plist/JSON.h"
#include "plist/PropertyList.h"

namespace host {

namespace {

constexpr char kConfiguration[] = "/device/analytics.plist";
constexpr char kFolder[] = "/var/spool/morvend";
constexpr char kName[] = "events.jsonl";

// Lines are written together up to about this size.
constexpr std::size_t kBatch = std::size_t{256} << 10;

}  // namespace

EventSink::~EventSink() { drain(); }

const EventSink::Configuration& EventSink::configuration() {
  std::call_once(configured_, [this] {
    const FileDescriptor file = root_.openForReading(kConfiguration);
    if (!file && errno == ENOENT) return;
    auto bytes =
        file ? readRegularFile(file.get(), plist::kMaxSize + 1) : base::Error{errorText(errno)};
    const auto value = std::move(bytes).and_then(plist::read);
    if (!value) {
      log_.log(platform::LogLevel::error, "Could not read %s: %s",
               root_.hostPath(kConfiguration).c_str(), value.error().text.c_str());
      return;
    }
    const auto* entries = value->as<plist::Dictionary>();
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
  if (queue_.size() >= kMaximumQueued || !isServing()) return false;
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
    const std::string error = append(lines);
    if (!error.empty() && !failed_) {
      log_.log(platform::LogLevel::error, "Could not write %s; events are dropped", error.c_str());
      failed_ = true;
    }
    lines.clear();
  }
}

// Both return the empty text, or the path of the file that is in the way, and why.
std::string EventSink::append(const std::string& lines) {
  const FileDescriptor folder = root_.openFolder(kFolder, DeviceRoot::Missing::create);
  int error = errno;
  if (folder) {
    const FileLock lock(folder.get());  // another process may roll the file over, too
    if (std::string why = makeRoom(folder.get(), lines.size()); !why.empty()) return why;
    error = appendLines(folder.get(), kName, lines);
  }
  return error == 0 ? "" : root_.hostPath(kFolder, kName) + ": " + errorText(error);
}

std::string EventSink::makeRoom(int folder, std::uint64_t bytes) {
  // What is not a file of ours, or can't be looked at, is the append's to refuse.
  struct stat status;
  if (::fstatat(folder, kName, &status, AT_SYMLINK_NOFOLLOW) != 0) return {};
  const auto size = static_cast<std::uint64_t>(status.st_size);
  if (!S_ISREG(status.st_mode) || size == 0 || size + bytes <= kMaximumFile) return {};
  const RolledOver rolled = rollOver(folder, kName, kKept);
  const std::string at = root_.hostPath(kFolder, rolled.at);
  if (rolled.error != 0) return at + ": " + errorText(rolled.error);
  if (!rolled.at.empty()) {
    log_.log(platform::LogLevel::standard, "Dropped the events of %s: there are newer ones",
             at.c_str());
  }
  for (const std::string& name : rolled.inTheWay) {
    log_.log(platform::LogLevel::error, "Passed over %s: %s", root_.hostPath(kFolder, name).c_str(),
             errorText(EINVAL));
  }
  return {};
}

}  // namespace host
