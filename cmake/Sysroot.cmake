# Toolchain of the builds that run on every server of a processor, MORVANE_PROCESSOR (x86_64, i686, ...): Clang, with
# the headers and libraries that ./dev dist unpacked into build/sysroot.
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES MORVANE_PROCESSOR)
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR ${MORVANE_PROCESSOR})
cmake_path(GET CMAKE_CURRENT_LIST_DIR PARENT_PATH root)
set(CMAKE_SYSROOT ${root}/build/sysroot/${MORVANE_PROCESSOR})
set(CMAKE_CXX_COMPILER clang++-14)
string(REGEX REPLACE "^ppc" "powerpc" name ${MORVANE_PROCESSOR}) # as the cross linkers are called
set(CMAKE_CXX_COMPILER_TARGET ${name}-linux-gnu)
set(CMAKE_STRIP /usr/bin/llvm-strip-14) # for every processor the same
foreach(kind EXE MODULE) # the sysroot has no shared C++ runtime; a program that is all static takes no -no-pie
  set(CMAKE_${kind}_LINKER_FLAGS_INIT "-static-libstdc++ -static-libgcc -Wno-unused-command-line-argument")
endforeach()
foreach(kind LIBRARY INCLUDE PACKAGE)
  set(CMAKE_FIND_ROOT_PATH_MODE_${kind} ONLY)
endforeach()
