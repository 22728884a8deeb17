# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

# A room is a folder that is one target. Its users see its headers and nothing else: each room's
# headers stand, as links, in an include folder of their own, so that an include which a target's
# dependencies don't allow finds no file.

add_library(morvend_options INTERFACE)
target_compile_options(morvend_options INTERFACE
  -Wall -Wextra -Wpedantic -Wconversion -Wshadow
  # Doubles come out the same on every machine.
  -ffp-contract=off
  -fvisibility=hidden
  # GCC 12 takes the inlined concatenation of strings for overlapping copies.
  $<$<CXX_COMPILER_ID:GNU>:-Wno-restrict>)
target_link_libraries(morvend_options INTERFACE $<$<CONFIG:Release,RelWithDebInfo>:-Wl,-O1>)
include(cmake/Hardening.cmake)
if(MORVEND_SANITIZE)
  target_compile_options(morvend_options INTERFACE
    -fsanitize=${MORVEND_SANITIZE} -fno-sanitize-recover=all -fno-omit-frame-pointer
    # Instrumented moves of variants look uninitialized to GCC 12; the release build keeps the check.
    $<$<CXX_COMPILER_ID:GNU>:-Wno-maybe-uninitialized>)
  target_link_options(morvend_options INTERFACE -fsanitize=${MORVEND_SANITIZE})
endif()

# room_headers(TARGET FOLDER): shows the headers of FOLDER (as in the source tree) to TARGET's users.
function(room_headers target folder)
  set(shown ${CMAKE_BINARY_DIR}/rooms/${target})
  file(GLOB headers CONFIGURE_DEPENDS RELATIVE ${CMAKE_SOURCE_DIR} ${CMAKE_SOURCE_DIR}/${folder}/*.h)
  file(REMOVE_RECURSE ${shown}/${folder})
  file(MAKE_DIRECTORY ${shown}/${folder})
  foreach(header IN LISTS headers)
    file(CREATE_LINK ${CMAKE_SOURCE_DIR}/${header} ${shown}/${header} SYMBOLIC)
  endforeach()
  target_include_directories(${target} PUBLIC $<BUILD_INTERFACE:${shown}>)
endfunction()

# add_room(TARGET FOLDER [EXCEPT file...] [USES target...] [LIBRARIES target...]): a static library
# of the sources in FOLDER. USES are other rooms, LIBRARIES what only the room itself sees.
function(add_room target folder)
  cmake_parse_arguments(ROOM "" "" "EXCEPT;USES;LIBRARIES" ${ARGN})
  file(GLOB sources CONFIGURE_DEPENDS ${CMAKE_SOURCE_DIR}/${folder}/*.cpp)
  foreach(file IN LISTS ROOM_EXCEPT)
    list(REMOVE_ITEM sources ${CMAKE_SOURCE_DIR}/${folder}/${file})
  endforeach()
  add_library(${target} STATIC ${sources})
  room_headers(${target} ${folder})
  target_link_libraries(${target} PUBLIC ${ROOM_USES} PRIVATE morvend_options ${ROOM_LIBRARIES})
endfunction()
