// morvend as a service of a real message bus.

#include <gtest/gtest.h>

#include <chrono>
#include <filesystem>
#include <thread>

#include "end_to_end/Device.h"
#include "support/PrivateBus.h"

namespace end_to_end {
namespace {

using support::BusClient;

// morvend in service mode, in the background.
class Service {
 public:
  Service(const Device& device, const std::string& bus)
      : thread_([this, &device, bus] { outcome_ = device.run("morvend", {}, {}, bus); }) {}

  // Waits for its end.
  const faults::Outcome& outcome() {
    if (thread_.joinable()) thread_.join();
    return outcome_;
  }
  ~Service() { outcome(); }

 private:
  faults::Outcome outcome_;
  std::thread thread_;
};

void waitForService(BusClient& client) {
  for (int i = 0; i < 2000 && !client.serviceHasOwner(); ++i) {
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
  }
  ASSERT_TRUE(client.serviceHasOwner());
}

Dictionary application(const char* bundle) {
  return {{"bundle_id", bundle},
          {"version", "2.1"},
          {"orlo_id", 9},
          {"uuid", platform::Data(16, 0xab)}};
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
  if (timerWasFirst) {
    EXPECT_EQ(apps, nullptr);
  } else {
    ASSERT_NE(apps, nullptr);
    const std::string uuid = "abababab-abab-abab-abab-abababababab";
    auto entry = [&](const char* bundle) {
      return Dictionary{
          {"bundle", bundle}, {"version", "2.1"}, {"orloID", 9}, {"arch", 0}, {"uuid", uuid}};
    };
    EXPECT_EQ(
        *apps,
        (Array{entry("com.x"), entry("com.y"),
               Dictionary{
                   {"bundle", ""}, {"version", ""}, {"orloID", 0}, {"arch", 0}, {"uuid", ""}}}));
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
  const auto& outcome = service.outcome();
  EXPECT_EQ(outcome.status, 0);
  EXPECT_NE(outcome.standardError.find("never received requested AAI, so moving along without it"),
            std::string::npos);
  ASSERT_EQ(device.dailyLogs().size(), 1u);
  EXPECT_EQ(device.dailyLogs()[0].find("PLActivatedAppInfo"), nullptr);
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
