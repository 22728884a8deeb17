// morvend as a whole process: its start, the closed gate, and whole reports of two sizes.

#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

#include "bench/Rows.h"
#include "platform/CivilDate.h"
#include "support/ControllerRoot.h"
#include "support/HostOnRoot.h"
#include "support/TemporaryFolder.h"

namespace {

using platform::Array;
using platform::Dictionary;
using platform::Value;
using Arguments = std::vector<std::string>;

std::string program(const char* name) {
  return std::filesystem::read_symlink("/proc/self/exe").parent_path() / name;
}

struct Finished {
  double nanoseconds, peakKiB;
};

// Runs a program to its end, its output thrown away.
Finished run(const Arguments& arguments) {
  std::vector<char*> argv;
  for (const std::string& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
  argv.push_back(nullptr);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  for (const int fd : {1, 2}) {
    posix_spawn_file_actions_addopen(&actions, fd, "/dev/null", O_WRONLY, 0);
  }
  const auto start = std::chrono::steady_clock::now();
  pid_t pid = 0;
  int status = 0;
  rusage usage{};
  if (::posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ) != 0 ||
      ::wait4(pid, &status, 0, &usage) != pid || status != 0) {
    throw std::runtime_error("can't run " + arguments[0]);
  }
  const std::chrono::duration<double, std::nano> taken = std::chrono::steady_clock::now() - start;
  posix_spawn_file_actions_destroy(&actions);
  return {taken.count(), static_cast<double>(usage.ru_maxrss)};
}

void addStartRows(bench::Table& table) {
  const support::TemporaryFolder root;
  ::setenv("MORVEND_ROOT", root.path().c_str(), 1);
  const Arguments empty{program("empty_program")}, unknown{program("morvend"), "-unknown"},
      gated{program("morvend"), "-d"};
  run(gated);  // closes the gate
  table.compare(
      "start and end, unknown option", "empty program, same libraries", 1.5, 1,
      [&] { run(unknown); }, [&] { run(empty); }, 101);
  table.compare(
      "-d with the gate closed", "empty program, same libraries", 2, 1, [&] { run(gated); },
      [&] { run(empty); }, 101);
  table.compareFigures(
      "-d with the gate closed, peak memory", "empty program, same libraries", 1.5, "KiB",
      [&] { return run(gated).peakKiB; }, [&] { return run(empty).peakKiB; });

  support::writeController(root);
  const Arguments statistics{program("nandinfo"), "ftl", "--round"};
  table.compare(
      "nandinfo ftl, every counter", "empty program, same libraries", 3, 1,
      [&] { run(statistics); }, [&] { run(empty); }, 101);
}

// A device whose history holds three days up to yesterday, and a whitelist that lets it all
// through: a tenth by exact keys, the rest by prefixes, as families of counters are whitelisted;
// with roundings and, for every tenth distribution, a histogram.
class ReportDevice {
 public:
  ReportDevice(int scalars, int distributions, int samples) {
    writePropertyList("var/preferences/mobile/com.norba.quenset.plist",
                      Dictionary{{"DiagnosticLogSubmissionEnabled", true}});
    const Dictionary rounding{{"bucket_interval", 10}, {"sig_fig", 3}};
    const Dictionary counted{{"intervals", Array{Value(100), Value(1000)}}};
    Dictionary scalarKeys, scalarPrefixes, distributionKeys;
    for (int i = 0; i < scalars; i += 10) scalarKeys.set(scalarKey(i), rounding);
    for (int family = 0; family < kFamilies; ++family) {
      scalarPrefixes.set(familyPrefix(family), rounding);
    }
    for (int i = 0; i < distributions; i += 10) distributionKeys.set(distributionKey(i), counted);
    writePropertyList(
        "Library/Application Support/Pelloran/Whitelist_Vrn.plist",
        Dictionary{
            {"Group", Dictionary{{"ScalarKeys", std::move(scalarKeys)},
                                 {"ScalarKeyPrefixes", std::move(scalarPrefixes)},
                                 {"DistributionKeys", std::move(distributionKeys)},
                                 {"DistributionKeyPrefixes",
                                  Dictionary{{"com.example.distribution", Dictionary()}}}}}});
    fill(scalars, distributions, samples);
  }

  // Nanoseconds of one report, each into an empty spool.
  double report() const {
    std::error_code none;
    for (const auto& log :
         std::filesystem::directory_iterator(root_ / "var/spool/morvend/submitted", none)) {
      std::filesystem::remove(log);
    }
    ::setenv("MORVEND_ROOT", root_.path().c_str(), 1);
    return run({program("morvend"), "-f"}).nanoseconds;
  }
  double bareReport() const {
    return run({program("bare_report"), database(), std::to_string(yesterday_), root_ / "bare.xml"})
        .nanoseconds;
  }
  double pythonReport() const {
    return run({"python3", MORVEND_SOURCE_DIR "/bench/yardsticks/python_report.py", database(),
                std::to_string(yesterday_),
                root_ / "Library/Application Support/Pelloran/Whitelist_Vrn.plist",
                root_ / "python.xml"})
        .nanoseconds;
  }

 private:
  static constexpr int kFamilies = 50;

  static std::string familyPrefix(int family) {
    return "com.example.family" + std::to_string(family) + ".";
  }
  static std::string scalarKey(int i) {
    return familyPrefix(i % kFamilies) + "counter" + std::to_string(i);
  }
  static std::string distributionKey(int i) {
    return "com.example.distribution" + std::to_string(i);
  }

  std::string database() const { return root_ / support::kCountersDatabase; }

  void writePropertyList(const char* path, const Dictionary& dictionary) {
    root_.write(path, *host_.platform().propertyLists.writeXML(dictionary));
  }

  void fill(int scalars, int distributions, int samples) {
    using platform::host::CounterChange;
    yesterday_ = platform::dayBefore(host_.counters().PLDaysSince1970());
    std::vector<std::string> keys;
    for (int i = 0; i < scalars; ++i) keys.push_back(scalarKey(i));
    for (int i = 0; i < distributions; ++i) keys.push_back(distributionKey(i));
    std::mt19937_64 random(1);
    for (std::int32_t day = yesterday_ - 2; day <= yesterday_; ++day) {
      std::vector<CounterChange> changes;
      for (int i = 0; i < scalars; ++i) {
        changes.push_back({.kind = CounterChange::Kind::set,
                           .key = keys[static_cast<std::size_t>(i)],
                           .day = day,
                           .amount = static_cast<std::int64_t>(random() % 1000000)});
      }
      for (int i = 0; i < distributions; ++i) {
        for (int sample = 0; sample < samples; ++sample) {
          changes.push_back({.kind = CounterChange::Kind::push,
                             .key = keys[static_cast<std::size_t>(scalars + i)],
                             .day = day,
                             .sample = static_cast<double>(random() % 2000000) / 1000,
                             .seconds = sample});
        }
      }
      if (const auto error = host_.counters().apply(changes); !error.empty()) {
        throw std::runtime_error(error);
      }
    }
    host_.counters().PLClientCheckpoint();
  }

  support::TemporaryFolder root_;
  support::HostOnRoot host_{root_.path()};
  std::int32_t yesterday_ = 0;
};

void addReportRows(bench::Table& table, const std::string& size, const ReportDevice& device,
                   int rounds) {
  table.compareFigures(
      "-f, " + size, "the sum of its parts, bare", 1.6, "ns", [&] { return device.report(); },
      [&] { return device.bareReport(); }, rounds);
  table.compareFigures(
      "-f, " + size, "the same job in Python", 0.1, "ns", [&] { return device.report(); },
      [&] { return device.pythonReport(); }, 7);
}

}  // namespace

void bench::addProcessRows(Table& table) {
  addStartRows(table);
  addReportRows(table, "5,000 keys, 1,000 x 100 samples", ReportDevice(5000, 1000, 100), 31);
  addReportRows(table, "50,000 keys, 1,000 x 1,000 samples", ReportDevice(50000, 1000, 1000), 15);
}
