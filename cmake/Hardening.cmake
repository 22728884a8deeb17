# What makes a fault harder to exploit, in the builds that are installed; tests/hardened.sh looks for
# each in what was built.
include(CheckCXXCompilerFlag)
include(CheckPIESupported)
check_pie_supported(LANGUAGES C CXX)  # programs are position-independent

set(hardening -fstack-protector-strong -fstack-clash-protection -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=3)
foreach(flag -fcf-protection=full -mbranch-protection=standard)  # x86; ARM
  string(MAKE_C_IDENTIFIER "MORVEND_HAS${flag}" has)
  check_cxx_compiler_flag(${flag} ${has})
  if(${has})
    list(APPEND hardening ${flag})
  endif()
endforeach()
target_compile_options(morvend_options INTERFACE "$<$<CONFIG:Release,RelWithDebInfo>:${hardening}>")
target_link_options(morvend_options INTERFACE
  "$<$<CONFIG:Release,RelWithDebInfo>:-Wl,-z,relro,-z,now,-z,noexecstack>")
