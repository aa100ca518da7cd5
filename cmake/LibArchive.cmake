# LibArchive::LibArchive, which unpacks logs. The library itself is linked statically: the shared one needs ten more, of
# forty megabytes, for formats that no log comes in. The four that have the formats of packed logs are part of every
# Debian, and shared but in a portable build.
add_library(LibArchive::LibArchive INTERFACE IMPORTED)
foreach(name archive z bz2 lzma zstd)
  if(name STREQUAL "archive" OR MORVANE_PORTABLE)
    set(file lib${name}.a)
  else()
    set(file lib${name}.so)
  endif()
  if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND NOT MORVANE_PORTABLE)
    # What ./dev unpacked, as libHBAAPI, in one folder for the run path.
    string(REPLACE .so .so.* file ${file})
    file(GLOB found ${CMAKE_BINARY_DIR}/packages/*/lib/i386-linux-gnu/${file}
      ${CMAKE_BINARY_DIR}/packages/*/usr/lib/i386-linux-gnu/${file})
    if(NOT found)
      message(FATAL_ERROR "No 32-bit lib${name} in ${CMAKE_BINARY_DIR}/packages: build with ./dev build i386")
    endif()
    file(COPY ${found} DESTINATION ${CMAKE_BINARY_DIR}/packages/unpacking FOLLOW_SYMLINK_CHAIN)
    list(GET found 0 first)
    cmake_path(GET first FILENAME file)
    set(LIBARCHIVE_${name} ${CMAKE_BINARY_DIR}/packages/unpacking/${file})
  else()
    find_library(LIBARCHIVE_${name} ${file} REQUIRED)
  endif()
  target_link_libraries(LibArchive::LibArchive INTERFACE ${LIBARCHIVE_${name}})
endforeach()

if(MORVANE_PORTABLE AND CMAKE_SIZEOF_VOID_P EQUAL 4)
  add_library(old_symbols STATIC ${CMAKE_SOURCE_DIR}/packaging/sysroot/old_symbols.cpp)
  target_link_libraries(LibArchive::LibArchive INTERFACE -Wl,--wrap=fcntl64 old_symbols)
endif()
