// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// morvend as a service of a real message bus.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <optional>
#include <thread>

#include "end_to_end/Device.h"
#include "support/PrivateBus.h"

namespace end_to_end {
namespace {

using support::BusClient;

// morvend in the background, in service mode or with an option.
class Service {
 public:
  Service(const Device& device, const std::string& bus, const char* option = nullptr) {
    process_ = ::fork();
    if (process_ != 0) return;
    for (const std::string& variable : device.environment(bus))
      ::putenv(::strdup(variable.c_str()));
    ::dup2(::open((folder_ / "log").c_str(), O_WRONLY | O_CREAT | O_APPEND, 0600), STDERR_FILENO);
    ::execl(PROGRAMS "/morvend", "morvend", option, nullptr);
    ::_exit(127);
  }
  ~Service() { outcome(); }

  void send(int signal) const { ::kill(process_, signal); }

  // Waits until it says so.
  void waitFor(const std::string& text) const {
    for (int i = 0; i < 4000; ++i) {
      if (folder_.read("log").find(text) != std::string::npos) return;
      std::this_thread::sleep_for(std::chrono::milliseconds(5));
    }
    ADD_FAILURE() << "never said " << text;
  }

  // Waits for its end.
  const faults::Outcome& outcome() {
    int status = 0;
    if (process_ > 0 && ::waitpid(process_, &status, 0) == process_) {
      process_ = -1;
      outcome_.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
      outcome_.signal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
      outcome_.standardError = folder_.read("log");
    }
    return outcome_;
  }

 private:
  support::TemporaryFolder folder_;
  pid_t process_ = -1;
  faults::Outcome outcome_{};
};

void waitForService(BusClient& client) {
  for (int i = 0; i < 2000 && !client.serviceHasOwner(); ++i) {
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  ASSERT_TRUE(client.serviceHasOwner());
}

Dictionary application(const char* bundle) {
  return {
      {"bundle_id", bundle}, {"version", "2.1"}, {"orlo_id", 9}, {"uuid", plist::Data(16, 0xab)}};
}

TEST(Service, TakesADeliveryIntoTheReportWhileATimerRunsToo) {
  Device device;
  device.fill();
  const support::PrivateBus bus;
  Service service(device, bus.address());
  BusClient client(bus.address());
  waitForService(client);
  client.send({{"operation", 0}});
  client.send({{"operation", 2},
               {"app_data",
                Array{application("com.x"), application("com.y"), Dictionary{{"bundle_id", 5}}}}});
  client.send({{"operation", 2}, {"app_data", "garbage"}});
  client.send({{"operation", 1}, {"value", 5}});
  const auto timer = device.run("morvend", {"-d"}, {}, bus.address());
  EXPECT_EQ(timer.status, 0);
  const auto& outcome = service.outcome();
  EXPECT_EQ(outcome.status, 0);

  const auto logs = device.dailyLogs();
  ASSERT_EQ(logs.size(), 1u);
  const bool timerWasFirst = timer.standardError.find("daily tasks") != std::string::npos;
  const auto* apps = logs[0].array("PLActivatedAppInfo");
  ASSERT_EQ(apps == nullptr, timerWasFirst);
  if (apps != nullptr) {
    ASSERT_EQ(apps->size(), 3u);
    EXPECT_EQ(apps->at(1), Value(Dictionary{{"bundle", "com.y"},
                                            {"version", "2.1"},
                                            {"orloID", 9},
                                            {"arch", 0},
                                            {"uuid", "abababab-abab-abab-abab-abababababab"}}));
  }
  const std::string& log = outcome.standardError;
  EXPECT_NE(log.find("notified of logging status, waiting for activate app info"),
            std::string::npos);
  EXPECT_NE(log.find("morvend got requestedAAI:\n"), std::string::npos);
  EXPECT_NE(log.find("morvend got (unsolicited -- so ignoring) AAI:\n"), std::string::npos);
  EXPECT_EQ(log.find("daily tasks for day 5"), std::string::npos);
  EXPECT_EQ(linesOf(log).back(), "morvend ended");
}

TEST(Service, MovesOnWithoutInfoThatNeverComes) {
  Device device;
  device.fill();
  const support::PrivateBus bus;
  Service service(device, bus.address());
  BusClient client(bus.address());
  waitForService(client);
  client.send({{"operation", 0}});
  service.waitFor("never received requested AAI, so moving along without it");
  service.send(SIGTERM);  // as a supervisor does that saw the name go
  EXPECT_TRUE(ended(service.outcome()));
  ASSERT_EQ(device.dailyLogs().size(), 1u);
  EXPECT_EQ(device.dailyLogs()[0].find("PLActivatedAppInfo"), nullptr);
}

// A wait that goes on, work that is cut short, and work that is begun nevertheless.
TEST(Service, ToldToEndFinishesWhatHasBegunAndOnlyThat) {
  const Dictionary announcement{{"operation", 0}};
  const Dictionary delivery{{"operation", 2}, {"app_data", Array{application("com.x")}}};
  const struct {
    const char* option;
    std::vector<Dictionary> messages;
    const char* said;
    int signal;
    bool done;
  } rows[] = {
      {nullptr, {}, "morvend started", SIGTERM, false},
      {nullptr, {announcement}, "waiting for activate app info", SIGINT, false},
      {nullptr, {announcement, delivery, delivery}, "daily tasks for day", SIGTERM, true},
      {"-d", {}, "daily tasks for day", SIGTERM, true},
      {"-d", {}, "daily tasks for day", SIGINT, true},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    Device device;
    device.fill();
    device.writePropertyList("device/network-usage.plist", Dictionary{{"ReplyDelay", 0.5}});
    const support::PrivateBus bus;
    BusClient client(bus.address());
    Service service(device, bus.address(), row.option);
    if (row.option == nullptr) waitForService(client);
    for (const Dictionary& message : row.messages) client.send(message);
    client.settle();
    service.waitFor(row.said);
    const auto start = std::chrono::steady_clock::now();
    service.send(row.signal);
    const auto& outcome = service.outcome();
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(5));
    EXPECT_TRUE(ended(outcome)) << outcome.signal << outcome.standardError;
    const auto record = device.record("LastCrashLogSerializationDateInDaysSince1970");
    EXPECT_EQ(record, row.done ? std::optional<Value>(device.today() - 1) : std::nullopt);
    EXPECT_EQ(device.dailyLogs().size(), row.done ? 1u : 0u);
    EXPECT_EQ(outcome.standardError.find("unsolicited"), std::string::npos);
    EXPECT_EQ(outcome.standardError.find("never received"), std::string::npos);
  }
}

// Nobody asks: nothing is read or written. With and without a bus, and with one that hangs.
TEST(Service, DoesNothingUnasked) {
  support::PrivateBus bus, hanging;
  hanging.freeze();
  Device devices[3];
  for (Device& device : devices) device.fill();
  const std::string addresses[] = {bus.address(), hanging.address(), ""};
  std::vector<faults::Outcome> outcomes(3);
  std::vector<std::thread> runs;
  const auto start = std::chrono::steady_clock::now();
  for (std::size_t i = 0; i < 3; ++i) {
    runs.emplace_back([&, i] { outcomes[i] = devices[i].run("morvend", {}, {}, addresses[i]); });
  }
  for (auto& run : runs) run.join();
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(60)) << "hangs";
  for (std::size_t i = 0; i < 3; ++i) {
    EXPECT_EQ(outcomes[i].status, 0);
    const Lines lines = linesOf(outcomes[i].standardError);
    EXPECT_EQ(lines.front(), "morvend started") << i;
    EXPECT_EQ(lines.back(), "morvend ended") << i;
    EXPECT_TRUE(i == 1 || lines.size() == 2) << outcomes[i].standardError;
    EXPECT_FALSE(std::filesystem::exists(devices[i].root() / "var/run"));
  }
}

}  // namespace
}  // namespace end_to_end
