# LibArchive::LibArchive, which unpacks logs. Linked statically, with the four libraries that have the formats of packed
# logs: its shared library needs ten more, of forty megabytes, for formats that no log comes in.
add_library(LibArchive::LibArchive INTERFACE IMPORTED)
foreach(name archive z bz2 lzma zstd)
  if(CMAKE_SIZEOF_VOID_P EQUAL 4 AND NOT CMAKE_CROSSCOMPILING) # what ./dev unpacked, as libHBAAPI
    file(GLOB LIBARCHIVE_${name} ${CMAKE_BINARY_DIR}/packages/*/usr/lib/i386-linux-gnu/lib${name}.a)
  else()
    find_library(LIBARCHIVE_${name} lib${name}.a)
  endif()
  if(NOT LIBARCHIVE_${name})
    message(FATAL_ERROR "No lib${name}.a: build with ./dev")
  endif()
  target_link_libraries(LibArchive::LibArchive INTERFACE ${LIBARCHIVE_${name}})
endforeach()

if(MORVANE_PORTABLE AND CMAKE_SIZEOF_VOID_P EQUAL 4)
  add_library(old_symbols STATIC ${CMAKE_SOURCE_DIR}/packaging/sysroot/old_symbols.cpp)
  target_link_libraries(LibArchive::LibArchive INTERFACE -Wl,--wrap=fcntl64 old_symbols)
endif()
