# Makes faults that are left harder to exploit, as far as compiler and linker can.
include(CheckCXXCompilerFlag)
include(CheckLinkerFlag)
include(CheckPIESupported)

check_pie_supported(LANGUAGES C CXX)

foreach(flag -fstack-protector-strong -fstack-clash-protection -fcf-protection)
  string(MAKE_C_IDENTIFIER MORWICK_HAS${flag} known)
  check_cxx_compiler_flag(${flag} ${known})
  add_compile_options($<$<BOOL:${${known}}>:${flag}>)
endforeach()

foreach(flag relro now noexecstack)
  check_linker_flag(CXX -Wl,-z,${flag} MORWICK_HAS_z_${flag})
  add_link_options($<$<BOOL:${MORWICK_HAS_z_${flag}}>:-Wl,-z,${flag}>)
endforeach()

# _FORTIFY_SOURCE needs optimised code. It replaces calls, and sanitizers see more in the original ones.
if(NOT CMAKE_CXX_FLAGS MATCHES "-fsanitize|-O0|_FORTIFY_SOURCE")
  set(optimised $<CONFIG:Release,RelWithDebInfo,MinSizeRel>)
  add_compile_options($<${optimised}:-U_FORTIFY_SOURCE> $<${optimised}:-D_FORTIFY_SOURCE=2>)
endif()
