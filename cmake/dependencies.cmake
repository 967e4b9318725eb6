# Third-party pieces: SQLite, GoogleTest, and the header-only CLI11 and
# nlohmann/json of the command-line tool.
#
# Linux uses Debian's packages. The Windows builds compile SQLite from its
# amalgamation, which the npm package better-sqlite3 ships under deps/sqlite3/;
# the configure step fetches the pinned package with npm and checks its sha256.

set(AS_SQLITE_PACKAGE "better-sqlite3@12.9.0")
set(AS_SQLITE_TGZ_SHA256 "ad0e29650140c49d0335b1d356596aa8166f12b758f418a98446130e3278f250")
set(AS_SQLITE_C_SHA256 "391855ddc7af04001364430884d263cbe8638f852c83865823a2d08358f6b87d")

if(WIN32)
  set(AS_SQLITE_DIR "${CMAKE_BINARY_DIR}/_deps/sqlite3")
  set(AS_SQLITE_TGZ "${CMAKE_BINARY_DIR}/_deps/better-sqlite3-12.9.0.tgz")
  if(NOT EXISTS "${AS_SQLITE_DIR}/sqlite3.c")
    file(MAKE_DIRECTORY "${CMAKE_BINARY_DIR}/_deps")
    if(NOT EXISTS "${AS_SQLITE_TGZ}")
      find_program(NPM npm REQUIRED)
      message(STATUS "Fetching the SQLite amalgamation (${AS_SQLITE_PACKAGE})")
      execute_process(COMMAND ${NPM} pack ${AS_SQLITE_PACKAGE} --silent
        WORKING_DIRECTORY "${CMAKE_BINARY_DIR}/_deps"
        RESULT_VARIABLE npm_result OUTPUT_QUIET)
      if(NOT npm_result EQUAL 0)
        message(FATAL_ERROR "npm pack ${AS_SQLITE_PACKAGE} failed (${npm_result})")
      endif()
    endif()
    file(SHA256 "${AS_SQLITE_TGZ}" tgz_hash)
    if(NOT tgz_hash STREQUAL AS_SQLITE_TGZ_SHA256)
      file(REMOVE "${AS_SQLITE_TGZ}")
      message(FATAL_ERROR "${AS_SQLITE_TGZ}: sha256 ${tgz_hash}, expected ${AS_SQLITE_TGZ_SHA256}")
    endif()
    file(ARCHIVE_EXTRACT INPUT "${AS_SQLITE_TGZ}" DESTINATION "${CMAKE_BINARY_DIR}/_deps/unpacked"
      PATTERNS package/deps/sqlite3/sqlite3.c package/deps/sqlite3/sqlite3.h)
    file(SHA256 "${CMAKE_BINARY_DIR}/_deps/unpacked/package/deps/sqlite3/sqlite3.c" c_hash)
    if(NOT c_hash STREQUAL AS_SQLITE_C_SHA256)
      message(FATAL_ERROR "sqlite3.c: sha256 ${c_hash}, expected ${AS_SQLITE_C_SHA256}")
    endif()
    file(COPY "${CMAKE_BINARY_DIR}/_deps/unpacked/package/deps/sqlite3/sqlite3.c"
              "${CMAKE_BINARY_DIR}/_deps/unpacked/package/deps/sqlite3/sqlite3.h"
         DESTINATION "${AS_SQLITE_DIR}")
  endif()
  add_library(as_sqlite3 STATIC "${AS_SQLITE_DIR}/sqlite3.c")
  target_include_directories(as_sqlite3 SYSTEM PUBLIC "${AS_SQLITE_DIR}")
  target_compile_definitions(as_sqlite3 PRIVATE
    SQLITE_THREADSAFE=1 SQLITE_OMIT_LOAD_EXTENSION SQLITE_DEFAULT_FOREIGN_KEYS=0)
  target_compile_options(as_sqlite3 PRIVATE -w)
  add_library(AlertSummary::sqlite3 ALIAS as_sqlite3)
else()
  find_package(SQLite3 REQUIRED)
  add_library(AlertSummary::sqlite3 ALIAS SQLite::SQLite3)
endif()

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
