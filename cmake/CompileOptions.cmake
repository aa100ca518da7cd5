# morvane_options: what every target of this project is compiled and linked with.
add_library(morvane_options INTERFACE)

target_compile_options(morvane_options INTERFACE
  -Wall -Wextra -Werror
  -Wconversion -Wsign-conversion -Wshadow -Wold-style-cast -Wcast-qual -Wcast-align
  -Wformat=2 -Wnon-virtual-dtor -Woverloaded-virtual -Wundef -Wimplicit-fallthrough)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  target_compile_options(morvane_options INTERFACE
    -Wduplicated-cond -Wduplicated-branches -Wlogical-op)
else()
  # What stands in for a class's functions, in tests, need not use its members.
  target_compile_options(morvane_options INTERFACE -Wno-unused-private-field)
endif()

if(MORVANE_HARDENED)
  target_compile_options(morvane_options INTERFACE
    -fstack-protector-strong -U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2 -ffile-prefix-map=${CMAKE_SOURCE_DIR}=.)
  if(CMAKE_SYSTEM_PROCESSOR MATCHES "86")
    target_compile_options(morvane_options INTERFACE -fcf-protection)
  endif()
  if(NOT CMAKE_SYSTEM_PROCESSOR STREQUAL "aarch64" OR CMAKE_CXX_COMPILER_ID STREQUAL "GNU") # Clang 14 has none there
    target_compile_options(morvane_options INTERFACE -fstack-clash-protection)
  endif()
  target_link_options(morvane_options INTERFACE -Wl,-z,relro,-z,now,-z,noexecstack,-z,text)
endif()

# Whatever of the C++ runtime nothing calls stays out of the programs: with it would come its need of a new glibc.
if(MORVANE_PORTABLE)
  target_compile_options(morvane_options INTERFACE -ffunction-sections -fdata-sections)
  target_link_options(morvane_options INTERFACE -Wl,--gc-sections,--as-needed)
endif()

if(MORVANE_SANITIZED)
  target_compile_options(morvane_options INTERFACE
    -fsanitize=address,undefined -fno-sanitize-recover=all -fno-omit-frame-pointer)
  target_link_options(morvane_options INTERFACE -fsanitize=address,undefined)
endif()

if(MORVANE_FUZZ)
  set(fuzz_options -fsanitize=address,undefined,fuzzer-no-link -fno-sanitize-recover=all
    -fprofile-instr-generate -fcoverage-mapping)
  target_compile_options(morvane_options INTERFACE ${fuzz_options} -O1 -fno-omit-frame-pointer)
  target_link_options(morvane_options INTERFACE ${fuzz_options})
endif()
