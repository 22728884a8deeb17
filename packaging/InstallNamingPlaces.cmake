# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

# Run at the time of installation: writes the file `source`.in to `destination`, with `bindir` and
# `datadir` become full paths, and the text of the .conf file beside it where it asks for one.
get_filename_component(prefix "${CMAKE_INSTALL_PREFIX}" ABSOLUTE)
foreach(path bindir datadir destination)
  get_filename_component(${path} "${${path}}" ABSOLUTE BASE_DIR "${prefix}")
endforeach()
get_filename_component(folder "${source}" DIRECTORY)
foreach(part device hardening)
  if(EXISTS "${folder}/${part}.conf")
    file(READ "${folder}/${part}.conf" ${part})
    string(STRIP "${${part}}" ${part})
  endif()
endforeach()
message(STATUS "Installing: $ENV{DESTDIR}${destination}")
configure_file("${source}.in" "$ENV{DESTDIR}${destination}" @ONLY
  FILE_PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)
list(APPEND CMAKE_INSTALL_MANIFEST_FILES "${destination}")
