#include "daemon/DailyTelemetry.h"

namespace morvend {

void CollectDailyTelemetry(platform::Platform&, DeviceContext&) {}

}  // namespace morvend
