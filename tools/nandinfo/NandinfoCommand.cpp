#include "tools/nandinfo/NandinfoCommand.h"

namespace nandinfo {

int runNandinfo(const CommandServices&, int, char**) { return 2; }

}  // namespace nandinfo
