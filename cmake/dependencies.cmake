# Third-party pieces: SQLite, GoogleTest, and the header-only CLI11 and
# nlohmann/json of the command-line tool.
#
# Every build, Linux and Windows alike, compiles the one pinned SQLite
# amalgamation that the npm package better-sqlite3 ships under deps/sqlite3/:
# the builds then test the same SQLite, and a process never holds two copies
# (two copies break each other's POSIX locks). The package is fetched once per
# machine into a cache folder outside the build trees and its sha256 checked
# at every configure; the system's sqlite3 package is only the shell that
# tests use to read databases back.

set(AS_SQLITE_PACKAGE "better-sqlite3@12.9.0")
set(AS_SQLITE_TGZ_NAME "better-sqlite3-12.9.0.tgz")
set(AS_SQLITE_TGZ_URL "https://registry.npmjs.org/better-sqlite3/-/${AS_SQLITE_TGZ_NAME}")
set(AS_SQLITE_TGZ_SHA256 "ad0e29650140c49d0335b1d356596aa8166f12b758f418a98446130e3278f250")
set(AS_SQLITE_C_SHA256 "391855ddc7af04001364430884d263cbe8638f852c83865823a2d08358f6b87d")

if(DEFINED ENV{XDG_CACHE_HOME} AND NOT "$ENV{XDG_CACHE_HOME}" STREQUAL "")
  set(as_cache_default "$ENV{XDG_CACHE_HOME}/alertsummary")
else()
  set(as_cache_default "$ENV{HOME}/.cache/alertsummary")
endif()
set(ALERTSUMMARY_DEPS_CACHE "${as_cache_default}" CACHE PATH
  "Folder that keeps fetched third-party packages across build trees")

function(as_fetch_sqlite_package out)
  set(cache "${ALERTSUMMARY_DEPS_CACHE}")
  set(tgz "${cache}/${AS_SQLITE_TGZ_NAME}")
  file(MAKE_DIRECTORY "${cache}")
  # Build trees configured side by side must not fetch into each other.
  file(LOCK "${cache}/fetch.lock" GUARD FUNCTION TIMEOUT 600)
  if(EXISTS "${tgz}")
    file(SHA256 "${tgz}" tgz_hash)
    if(NOT tgz_hash STREQUAL AS_SQLITE_TGZ_SHA256)
      message(STATUS "${tgz}: sha256 ${tgz_hash} is not the pinned one; fetching again")
      file(REMOVE "${tgz}")
    endif()
  endif()
  if(NOT EXISTS "${tgz}")
    message(STATUS "Fetching the SQLite amalgamation (${AS_SQLITE_PACKAGE}) into ${cache}")
    # npm honours the machine's registry settings (mirror, proxy); without it
    # the tarball comes straight from the public registry. The hash decides.
    find_program(NPM npm)
    if(NPM)
      execute_process(COMMAND ${NPM} pack ${AS_SQLITE_PACKAGE} --silent
        WORKING_DIRECTORY "${cache}"
        RESULT_VARIABLE fetch_result OUTPUT_QUIET)
    endif()
    if(NOT EXISTS "${tgz}")
      file(DOWNLOAD "${AS_SQLITE_TGZ_URL}" "${tgz}.part" STATUS fetch_status TLS_VERIFY ON)
      list(GET fetch_status 0 fetch_result)
      if(fetch_result EQUAL 0)
        file(RENAME "${tgz}.part" "${tgz}")
      else()
        file(REMOVE "${tgz}.part")
      endif()
    endif()
    if(NOT EXISTS "${tgz}")
      message(FATAL_ERROR "${AS_SQLITE_PACKAGE} could not be fetched with npm nor from ${AS_SQLITE_TGZ_URL}")
    endif()
    file(SHA256 "${tgz}" tgz_hash)
    if(NOT tgz_hash STREQUAL AS_SQLITE_TGZ_SHA256)
      file(REMOVE "${tgz}")
      message(FATAL_ERROR "${AS_SQLITE_TGZ_NAME}: sha256 ${tgz_hash}, expected ${AS_SQLITE_TGZ_SHA256}")
    endif()
  endif()
  set(${out} "${tgz}" PARENT_SCOPE)
endfunction()

set(AS_SQLITE_DIR "${CMAKE_BINARY_DIR}/_deps/sqlite3")
set(as_sqlite_ok FALSE)
if(EXISTS "${AS_SQLITE_DIR}/sqlite3.c" AND EXISTS "${AS_SQLITE_DIR}/sqlite3.h")
  file(SHA256 "${AS_SQLITE_DIR}/sqlite3.c" c_hash)
  if(c_hash STREQUAL AS_SQLITE_C_SHA256)
    set(as_sqlite_ok TRUE)
  endif()
endif()
if(NOT as_sqlite_ok)
  as_fetch_sqlite_package(as_sqlite_tgz)
  set(unpacked "${CMAKE_BINARY_DIR}/_deps/unpacked")
  file(REMOVE_RECURSE "${unpacked}")
  file(ARCHIVE_EXTRACT INPUT "${as_sqlite_tgz}" DESTINATION "${unpacked}"
    PATTERNS package/deps/sqlite3/sqlite3.c package/deps/sqlite3/sqlite3.h)
  file(SHA256 "${unpacked}/package/deps/sqlite3/sqlite3.c" c_hash)
  if(NOT c_hash STREQUAL AS_SQLITE_C_SHA256)
    message(FATAL_ERROR "sqlite3.c: sha256 ${c_hash}, expected ${AS_SQLITE_C_SHA256}")
  endif()
  file(COPY "${unpacked}/package/deps/sqlite3/sqlite3.c" "${unpacked}/package/deps/sqlite3/sqlite3.h"
       DESTINATION "${AS_SQLITE_DIR}")
  file(REMOVE_RECURSE "${unpacked}")
endif()

add_library(as_sqlite3 STATIC "${AS_SQLITE_DIR}/sqlite3.c")
target_include_directories(as_sqlite3 SYSTEM PUBLIC "${AS_SQLITE_DIR}")
target_compile_definitions(as_sqlite3 PRIVATE
  SQLITE_THREADSAFE=1 SQLITE_OMIT_LOAD_EXTENSION SQLITE_DEFAULT_FOREIGN_KEYS=0)
target_compile_options(as_sqlite3 PRIVATE -w)
if(NOT WIN32)
  find_package(Threads REQUIRED)
  target_link_libraries(as_sqlite3 PUBLIC Threads::Threads ${CMAKE_DL_LIBS} m)
endif()
add_library(AlertSummary::sqlite3 ALIAS as_sqlite3)

if(ALERTSUMMARY_TESTS)
  if(CMAKE_CROSSCOMPILING)
    # Debian's GoogleTest sources, built with the cross compiler.
    set(gtest_force_shared_crt OFF CACHE BOOL "" FORCE)
    set(INSTALL_GTEST OFF CACHE BOOL "" FORCE)
    set(BUILD_GMOCK OFF CACHE BOOL "" FORCE)
    add_subdirectory(/usr/src/googletest/googletest "${CMAKE_BINARY_DIR}/_deps/googletest" EXCLUDE_FROM_ALL)
    if(NOT TARGET GTest::gtest_main)
      add_library(GTest::gtest ALIAS gtest)
      add_library(GTest::gtest_main ALIAS gtest_main)
    endif()
  else()
    find_package(GTest REQUIRED)
  endif()
endif()

# Header-only libraries of the tool. The Windows builds see them through an
# include folder of their own, never through the whole Linux include tree.
set(AS_TOOL_INCLUDE "${CMAKE_BINARY_DIR}/_deps/tool-include")
foreach(dir CLI nlohmann)
  if(EXISTS "/usr/include/${dir}" AND NOT EXISTS "${AS_TOOL_INCLUDE}/${dir}")
    file(COPY "/usr/include/${dir}" DESTINATION "${AS_TOOL_INCLUDE}")
  endif()
endforeach()
