# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

# Run at the time of installation: writes the file `source` to `destination`, with `bindir` become the
# programs' full path and the text of `hardening_file` where it asks for it.
get_filename_component(prefix "${CMAKE_INSTALL_PREFIX}" ABSOLUTE)
foreach(path bindir destination)
  get_filename_component(${path} "${${path}}" ABSOLUTE BASE_DIR "${prefix}")
endforeach()
file(READ "${hardening_file}" hardening)
message(STATUS "Installing: $ENV{DESTDIR}${destination}")
configure_file("${source}" "$ENV{DESTDIR}${destination}" @ONLY
  FILE_PERMISSIONS OWNER_READ OWNER_WRITE GROUP_READ WORLD_READ)
list(APPEND CMAKE_INSTALL_MANIFEST_FILES "${destination}")
