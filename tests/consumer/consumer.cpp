// A program of somebody else's that loads the storage library.
#include <NANDInfo/NANDInfo.h>
#include <platform/Platform.h>
#include <platform/host/HostPlatform.h>

int main() {
  const auto platform = platform::host::makeHostPlatform();
  platform->log.log(platform::LogLevel::debug, "not shown");
  platform->streams.writeOutput(description(platform::Value(NANDInfo::GetDiskInfo(*platform))) +
                                "\n");
  platform->counters.PLClientAddValueForScalarKey("consumer", 5);
  if (platform::host::PLIsInternalDevice()) platform->streams.writeOutput("internal\n");
}
