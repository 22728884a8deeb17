# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

# NANDInfo::NANDInfo, the storage library: shared, or static if NANDInfo_USE_STATIC_LIBS is set.
if(NOT NANDInfo_USE_STATIC_LIBS)
  include(${CMAKE_CURRENT_LIST_DIR}/NANDInfoShared.cmake)
  return()
endif()

include(CMakeFindDependencyMacro)
foreach(dependency SQLite3 EXPAT Threads PkgConfig)
  find_dependency(${dependency})
endforeach()
foreach(module systemd md)
  if(NOT TARGET PkgConfig::${module})
    pkg_check_modules(${module} REQUIRED IMPORTED_TARGET lib${module})
  endif()
endforeach()
include(${CMAKE_CURRENT_LIST_DIR}/NANDInfoStatic.cmake)
