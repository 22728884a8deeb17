// The program under test of the fault tests: one small piece of work on a device root, named on the
// command line. Its exit status says whether the work was acknowledged (0) or reported as failed
// (1).

#include <fcntl.h>
#include <sqlite3.h>
#include <sys/stat.h>
#include <sys/uio.h>
#include <unistd.h>

#include <cstdio>
#include <functional>
#include <map>
#include <string>

#include "faults/Subject.h"
#include "platform/host/EventSink.h"
#include "platform/host/HostPropertyListCodec.h"
#include "platform/host/PreferenceFiles.h"
#include "platform/host/ServitaLogFiles.h"
#include "platform/host/StructuredLogFiles.h"
#include "platform/host/SubmissionSpool.h"

namespace {

using namespace platform;
using namespace platform::host;

// Counts the failures to write; that a file couldn't be read doesn't make the work fail.
class FailureCounter final : public SystemLog {
 public:
  FailureCounter() : SystemLog(LogLevel::debug) {}
  int failures = 0;

 private:
  void write(LogLevel level, std::string_view message) override {
    if (level == LogLevel::error && !message.starts_with("Could not read")) ++failures;
    std::fprintf(stderr, "%.*s\n", static_cast<int>(message.size()), message.data());
  }
};

class FixedClock final : public Clock {
 public:
  Date now() override { return {subject::kNow}; }
};

struct Host {
  explicit Host(const char* path) : root(path) {}
  DeviceRoot root;
  HostPropertyListCodec codec;
  FixedClock clock;
  FailureCounter log;
};

// Two keys of a domain, set together.
int preferences(Host& host) {
  PreferenceFiles files(host.root, host.codec, host.log);
  const Value value(subject::kNewValue);
  files.QNSPreferencesSetValue("a", &value, subject::kDomain);
  files.QNSPreferencesSetValue("b", &value, subject::kDomain);
  files.QNSPreferencesSynchronize(subject::kDomain);
  return host.log.failures;
}

int submission(Host& host) {
  PreferenceFiles files(host.root, host.codec, host.log);
  SubmissionSpool spool(host.root, host.codec, files, host.clock, host.log);
  const Dictionary options{{"previous_os_version", "<unknown>"}};
  const bool done = spool.QNSWriteLogForSubmission(
      "193", "log", &options, [](LogHandle& log) { log.write(subject::kLogBytes); });
  return done ? 0 : 1;
}

int structuredLogs(Host& host) {
  StructuredLogFiles logs(host.root, host.clock, host.log);
  logs.logStructuredData(176, {});
  logs.dumpAllOldStructuredDataLogs();
  return host.log.failures;
}

int rollOver(Host& host) {
  ServitaLogFiles(host.root, host.log).rollServitaLogs();
  return host.log.failures;
}

int events(Host& host) {
  {
    EventSink sink(host.root, host.codec, host.clock, host.log);
    sink.EventraSendEventLazy("event", [] { return Dictionary{}; });
  }
  return host.log.failures;
}

// One row in a database in write-ahead mode, brought into the file.
int database(Host& host) {
  sqlite3* handle = nullptr;
  int error = sqlite3_open((host.root.path() + "/test.db").c_str(), &handle);
  if (error == SQLITE_OK) {
    error = sqlite3_exec(handle,
                         "PRAGMA journal_mode=WAL; CREATE TABLE t(v); INSERT INTO t VALUES(1);"
                         "PRAGMA wal_checkpoint(TRUNCATE)",
                         nullptr, nullptr, nullptr);
  }
  sqlite3_close(handle);
  return error == SQLITE_OK ? 0 : 1;
}

// Nine calls that count, and some that don't.
int calls(Host& host) {
  const std::string folder = host.root.path() + "/folder";
  const std::string file = host.root.path() + "/file", other = host.root.path() + "/other";
  int failed = 0;
  const auto check = [&failed](long result) { failed += result < 0 ? 1 : 0; };
  check(::mkdir(folder.c_str(), 0700));
  const int made = ::open(file.c_str(), O_RDWR | O_CREAT, 0600);
  check(made);
  check(::write(made, "12345678", 8));
  iovec parts[] = {{const_cast<char*>("abcd"), 4}, {const_cast<char*>("ef"), 2}};
  check(::writev(made, parts, 2));
  check(::pwrite(made, "0", 1, 0));
  check(::fsync(made));
  check(::ftruncate(made, 20));
  check(::rename(file.c_str(), other.c_str()));
  int ends[2];
  check(::pipe(ends));
  check(::write(ends[1], "x", 1));
  check(::write(STDERR_FILENO, "x", 1));
  check(::open(other.c_str(), O_RDONLY));
  check(::rmdir(folder.c_str()));
  return failed;
}

}  // namespace

int main(int argc, char** argv) {
  static const std::map<std::string, std::function<int(Host&)>> works = {
      {"calls", calls},           {"database", database},
      {"events", events},         {"preferences", preferences},
      {"rollOver", rollOver},     {"structuredLogs", structuredLogs},
      {"submission", submission},
  };
  if (argc != 3 || !works.contains(argv[1])) return 2;
  Host host(argv[2]);
  return works.at(argv[1])(host) == 0 ? 0 : 1;
}
