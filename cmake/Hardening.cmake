# SPDX-License-Identifier: Apache-2.0
# Copyright the morvend authors

# What makes a fault harder to exploit, in the builds that are installed; tests/hardened.sh looks for
# each in what was built.
include(CheckPIESupported)
check_pie_supported(LANGUAGES C CXX)  # programs are position-independent

set(hardening -fstack-protector-strong -fstack-clash-protection -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=3)
if(CMAKE_SYSTEM_PROCESSOR MATCHES "x86_64|AMD64|i.86")
  list(APPEND hardening -fcf-protection=full)
elseif(CMAKE_SYSTEM_PROCESSOR MATCHES "aarch64|arm64")
  list(APPEND hardening -mbranch-protection=standard)
endif()
target_compile_options(morvend_options INTERFACE "$<$<CONFIG:Release,RelWithDebInfo>:${hardening}>")
target_link_options(morvend_options INTERFACE
  "$<$<CONFIG:Release,RelWithDebInfo>:-Wl,-z,relro,-z,now,-z,noexecstack>")
