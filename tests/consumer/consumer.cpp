// A program of somebody else's that loads the storage library.
#include <NANDInfo/NANDInfo.h>
#include <host/HostPlatform.h>
#include <platform/Platform.h>

int main() {
  const auto platform = host::makeHostPlatform();
  platform->log.log(platform::LogLevel::debug, "not shown");
  platform->streams.writeOutput(description(plist::Value(NANDInfo::GetDiskInfo(*platform))) + "\n");
  platform->counters.PLClientAddValueForScalarKey("consumer", 5);
  if (host::PLIsInternalDevice()) platform->streams.writeOutput("internal\n");
}
