# What a site may choose. There is no run-time setting for any of this.

set(VELK_ROOT "/usr/velk" CACHE STRING
    "Where the database, the schema scripts and the platform's programs live")
set(VELK_SYSTEM_UID "1" CACHE STRING
    "User id that owns the database; 'builder' means whoever runs this build")
set(VELK_SYSTEM_GID "1" CACHE STRING
    "Group id that owns the database; 'builder' means whoever runs this build")
set(VELK_SASLAUTHD_SOCKET "/run/saslauthd/mux" CACHE STRING
    "saslauthd's socket, asked for account passwords where it answers")
option(VELK_BUILD_TESTS "Build the tests" OFF)
option(VELK_BUILD_FUZZ_TARGETS "Build the fuzz targets; needs clang" OFF)
option(VELK_WARNINGS_ARE_ERRORS "Treat warnings in our own code as errors" OFF)

foreach(kind uid gid)
  string(TOUPPER "VELK_SYSTEM_${kind}" setting)
  if("${${setting}}" STREQUAL "builder")
    string(SUBSTRING "${kind}" 0 1 flag)
    execute_process(COMMAND id -${flag} OUTPUT_VARIABLE ${setting}
                    OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
  endif()
endforeach()

# A root inside the build folder is ours to lay out, so that everything runs without an install.
cmake_path(IS_PREFIX CMAKE_BINARY_DIR "${VELK_ROOT}" NORMALIZE VELK_ROOT_IS_LOCAL)

if(NOT CMAKE_BUILD_TYPE AND NOT CMAKE_CONFIGURATION_TYPES)
  set(CMAKE_BUILD_TYPE Release CACHE STRING "Kind of build" FORCE)
endif()

set(CMAKE_CXX_STANDARD 20)
set(CMAKE_CXX_STANDARD_REQUIRED ON)
set(CMAKE_CXX_EXTENSIONS OFF)
set(CMAKE_C_STANDARD 11)
set(CMAKE_EXPORT_COMPILE_COMMANDS ON)
set(CMAKE_ARCHIVE_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/lib")
set(CMAKE_LIBRARY_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/lib")
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY "${CMAKE_BINARY_DIR}/bin")

find_package(PkgConfig REQUIRED)
pkg_check_modules(SQLITE3 REQUIRED IMPORTED_TARGET sqlite3>=3.38)
