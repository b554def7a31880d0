# Flags and helpers that our targets share. Nothing here leaks to whoever links us.

# Installed programs find the libraries beside them, wherever the tree has been moved to.
file(RELATIVE_PATH libraries_from_programs ${CMAKE_INSTALL_FULL_SBINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set(CMAKE_INSTALL_RPATH "$ORIGIN/${libraries_from_programs}")

# Every target of ours: warnings, hidden visibility.
add_library(velk_flags INTERFACE)
target_compile_options(velk_flags INTERFACE -Wall -Wextra -Wpedantic -Wshadow
  $<$<COMPILE_LANGUAGE:CXX>:-Wnon-virtual-dtor>
  -fvisibility=hidden $<$<COMPILE_LANGUAGE:CXX>:-fvisibility-inlines-hidden>
  $<$<BOOL:${VELK_WARNINGS_ARE_ERRORS}>:-Werror>)
# GCC 12 gives false alarms for "text" + string when it optimizes.
if(CMAKE_CXX_COMPILER_ID STREQUAL GNU AND CMAKE_CXX_COMPILER_VERSION VERSION_LESS 13)
  target_compile_options(velk_flags INTERFACE $<$<COMPILE_LANGUAGE:CXX>:-Wno-restrict>)
endif()

# Targets that know where things live, by velk_paths.h. A header, so that only the files that include
# it are compiled anew for another place.
set(VELK_PATHS_TEMPLATE "${CMAKE_CURRENT_LIST_DIR}/velk_paths.h.in")
configure_file("${VELK_PATHS_TEMPLATE}" "${PROJECT_BINARY_DIR}/generated/velk_paths.h" @ONLY)
add_library(velk_paths INTERFACE)
target_include_directories(velk_paths INTERFACE "${PROJECT_BINARY_DIR}/generated")

# velk_shared_library(NAME MAP): what all our shared libraries have in common. The version map
# decides what leaves the library, and whatever it needs must be named.
function(velk_shared_library name map)
  # Clang's sanitizers leave their own symbols to the program.
  if(NOT (CMAKE_CXX_COMPILER_ID STREQUAL Clang AND CMAKE_CXX_FLAGS MATCHES -fsanitize))
    target_link_options(${name} PRIVATE -Wl,--no-undefined)
  endif()
  target_link_options(${name} PRIVATE -Wl,--version-script=${map} -Wl,-z,relro -Wl,-z,now)
  set_target_properties(${name} PROPERTIES INSTALL_RPATH "$ORIGIN" LINK_DEPENDS ${map})
  install(TARGETS ${name} EXPORT velksharing-targets LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
endfunction()

# velk_platform_library(NAME SOURCES ... [LIBRARIES ...]): one shared library of the platform,
# which exports what its header under velk/ marks and nothing else.
function(velk_platform_library name)
  cmake_parse_arguments(PARSE_ARGV 1 arg "" "" "SOURCES;LIBRARIES")
  add_library(${name} SHARED ${arg_SOURCES})
  target_include_directories(${name} PUBLIC
    $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}/platform/include>
    $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}>)
  target_link_libraries(${name} PRIVATE $<BUILD_INTERFACE:velk_flags>
                        $<BUILD_INTERFACE:velk_paths> ${arg_LIBRARIES})
  set_target_properties(${name} PROPERTIES VERSION 1.0.0 SOVERSION 1)
  velk_shared_library(${name} ${PROJECT_SOURCE_DIR}/platform/exports.map)
endfunction()

# velk_platform_program(NAME): one of the programs that the library runs, at VELK_ROOT/bin. A local
# root gets it as soon as it is built.
function(velk_platform_program name)
  file(RELATIVE_PATH libraries "${VELK_ROOT}/bin" "${CMAKE_INSTALL_FULL_LIBDIR}")
  set_target_properties(${name} PROPERTIES INSTALL_RPATH "$ORIGIN/${libraries}")
  target_compile_definitions(${name} PRIVATE VELKSHARING_VERSION="${PROJECT_VERSION}")
  install(TARGETS ${name} RUNTIME DESTINATION "${VELK_ROOT}/bin")
  if(VELK_ROOT_IS_LOCAL)
    add_custom_command(TARGET ${name} POST_BUILD VERBATIM
      COMMAND ${CMAKE_COMMAND} -E make_directory "${VELK_ROOT}/bin"
      COMMAND ${CMAKE_COMMAND} -E copy_if_different "$<TARGET_FILE:${name}>" "${VELK_ROOT}/bin")
  endif()
endfunction()
