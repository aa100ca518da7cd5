# HbaApi::HbaApi: the SNIA HBA API library. The header is Debian's libhbaapi-dev for every word size.
find_path(HBAAPI_INCLUDE_DIR hbaapi.h REQUIRED)

# For a program that is to start on hosts without the library: the same functions, which load it when the first of them
# is called.
add_library(hba_library STATIC EXCLUDE_FROM_ALL fc/hba_library/hba_library.cpp)
target_include_directories(hba_library PUBLIC ${CMAKE_SOURCE_DIR})
target_include_directories(hba_library SYSTEM PUBLIC ${HBAAPI_INCLUDE_DIR})
target_link_libraries(hba_library PRIVATE morvane_options ${CMAKE_DL_LIBS})
if(MORVANE_PORTABLE)
  add_library(HbaApi::HbaApi ALIAS hba_library)
  return()
endif()

# The i386 and amd64 packages of the library own the same file names and cannot be installed side by side, so a
# 32-bit build links the i386 package that `./dev` unpacked into its build folder, and finds it there again
# at run time by a path relative to the program.
if(CMAKE_SIZEOF_VOID_P EQUAL 4)
  set(HBAAPI_LIBRARY ${CMAKE_BINARY_DIR}/packages/libhbaapi2/usr/lib/libHBAAPI.so.2)
  set(CMAKE_BUILD_RPATH_USE_ORIGIN ON)
  # CMake puts the separator of a run path's elements behind the last one, too, and the loader takes an empty element
  # for the working directory. There is one element, a folder: a slash may stand behind it.
  set(CMAKE_EXECUTABLE_RUNTIME_CXX_FLAG_SEP "/")
  if(NOT EXISTS ${HBAAPI_LIBRARY})
    message(FATAL_ERROR "No 32-bit libHBAAPI in ${CMAKE_BINARY_DIR}/packages/libhbaapi2: build with ./dev build i386")
  endif()
else()
  find_library(HBAAPI_LIBRARY HBAAPI REQUIRED)
endif()

add_library(HbaApi::HbaApi SHARED IMPORTED)
set_target_properties(HbaApi::HbaApi PROPERTIES
  IMPORTED_LOCATION ${HBAAPI_LIBRARY}
  INTERFACE_INCLUDE_DIRECTORIES ${HBAAPI_INCLUDE_DIR})
