// What the library keeps for the life of the process, as it is when a process begins. For tests and
// fuzz targets, which are many processes in one; programs can't reach it.
#pragma once

namespace NANDInfo {

// Forgets the first error message.
void ResetAPIErrorMessage();

// Sets the table of controller drivers to its first state.
void ResetExporters();

}  // namespace NANDInfo
