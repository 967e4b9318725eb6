# Shared steps of the end-to-end scripts. Each script works in its own folder, made afresh: ${root}, with the
# install folder ${install} and the settings tree ${E2E_SETTINGS} (the tool's --settings-root on Linux).
# Run by itself with -DCONDITIONS, this file is the waiter that feeds the host's "wait" steps (e2e_host).
set(E2E_COMMON "${CMAKE_CURRENT_LIST_FILE}")
if(WINDOWS)
  set(wine_prefix "$ENV{HOME}/.wine-alertsummary")
  if(DEFINED ENV{WINEPREFIX})
    set(wine_prefix "$ENV{WINEPREFIX}")
  endif()
  set(E2E_LOG_DIR "${wine_prefix}/drive_c/AlertSummaryDbg")
  set(E2E_HOST_NAME testhost.exe)
else()
  set(E2E_LOG_DIR "/var/log/AlertSummaryDbg")
  set(E2E_HOST_NAME testhost)
endif()

if(DEFINED CONDITIONS)
  # One line to the host's input as each condition holds, in turn: "log:TEXT" (the log holds TEXT) or
  # "marked:N" (N alert files below the install folder have their PROC_ name). The deadline is a safety net
  # against a hang only: the host then reads the end of its input and goes on, and the test fails on what it sees.
  string(TIMESTAMP deadline "%s")
  math(EXPR deadline "${deadline} + 100")
  string(REPLACE "|" ";" CONDITIONS "${CONDITIONS}")
  foreach(condition IN LISTS CONDITIONS)
    set(found -1)
    while(found LESS 0)
      string(TIMESTAMP now "%s")
      if(now GREATER deadline)
        return()
      elseif(condition MATCHES "^log:(.*)" AND EXISTS "${E2E_LOG_DIR}/ErrorLog.txt")
        file(READ "${E2E_LOG_DIR}/ErrorLog.txt" log)
        string(FIND "${log}" "${CMAKE_MATCH_1}" found)
      elseif(condition MATCHES "^marked:(.*)")
        file(GLOB_RECURSE marked "${INSTALL}/PROC_*.eml")
        list(LENGTH marked count)
        math(EXPR found "${count} - ${CMAKE_MATCH_1}")
      endif()
      if(found LESS 0)
        execute_process(COMMAND ${CMAKE_COMMAND} -E sleep 0.1)
      endif()
    endwhile()
    execute_process(COMMAND ${CMAKE_COMMAND} -E echo held RESULT_VARIABLE r)
    if(NOT r EQUAL 0)
      return()
    endif()
  endforeach()
  return()
endif()

set(root "${WORK}/${CASE}")
set(install "${root}/install")
set(E2E_SETTINGS "${root}/settings")
file(REMOVE_RECURSE "${root}")
file(MAKE_DIRECTORY "${install}" "${E2E_SETTINGS}")

function(e2e_fail text)
  e2e_log_end()
  message(FATAL_ERROR "${text}")
endfunction()

# At the top level of a script: switches the library's debug log on, empty (or skips the test where the folder
# cannot be made); e2e_log_end (and e2e_fail) switch it off again when this script switched it on.
macro(e2e_log_begin)
  if(NOT EXISTS "${E2E_LOG_DIR}")
    file(MAKE_DIRECTORY "${E2E_LOG_DIR}")
    if(NOT EXISTS "${E2E_LOG_DIR}")
      message(STATUS "SKIPPED: cannot create the debug log folder ${E2E_LOG_DIR} (run as root)")
      return()
    endif()
    file(WRITE "${root}/created-log-dir" "")
  endif()
  file(REMOVE "${E2E_LOG_DIR}/ErrorLog.txt")
endmacro()

function(e2e_log_end)
  if(EXISTS "${root}/created-log-dir")
    file(REMOVE_RECURSE "${E2E_LOG_DIR}" "${root}/created-log-dir")
  endif()
endfunction()

# At the top level of a script: skips the test, with one line, when a program it needs is missing.
macro(e2e_need var program why)
  find_program(${var} ${program})
  if(NOT ${var})
    message(STATUS "SKIPPED: no ${program} on this machine; ${why}")
    if(CMAKE_VERSION VERSION_GREATER_EQUAL 3.29)
      cmake_language(EXIT 77)  # ctest's SKIP_RETURN_CODE; older CMake skips by the line above
    endif()
    return()
  endif()
endmacro()

# Runs the host in ${install} with the steps given; its "wait" steps wait for the conditions of E2E_AWAIT
# (separated by "|"), which the waiter above watches beside it.
function(e2e_host out rc)
  execute_process(COMMAND ${CMAKE_COMMAND} -DWINDOWS=${WINDOWS} "-DINSTALL=${install}" "-DCONDITIONS=${E2E_AWAIT}"
      -P "${E2E_COMMON}"
    COMMAND ${EMULATOR} "${install}/${E2E_HOST_NAME}" ${ARGN}
    WORKING_DIRECTORY "${install}" OUTPUT_VARIABLE o ERROR_VARIABLE e RESULT_VARIABLE r TIMEOUT 130)
  set(${out} "${o}${e}" PARENT_SCOPE)
  set(${rc} "${r}" PARENT_SCOPE)
endfunction()

# Fails unless every alert file below `dir` has its PROC_ name.
function(e2e_expect_all_marked dir)
  file(GLOB_RECURSE left "${dir}/*.eml*")
  list(FILTER left EXCLUDE REGEX "/PROC_[^/]*$")
  if(left)
    e2e_fail("files left unprocessed: ${left}")
  endif()
endfunction()

# Runs the support tool; its output lands in tool_out, its stderr in tool_stderr.
macro(tool rc)
  execute_process(COMMAND ${EMULATOR} "${TOOL}" ${ARGN}
    OUTPUT_VARIABLE tool_out ERROR_VARIABLE tool_stderr RESULT_VARIABLE ${rc} TIMEOUT 100)
endmacro()

function(expect_tool expected_rc expected_regex)
  tool(rc ${ARGN})
  if(NOT rc EQUAL expected_rc OR NOT tool_out MATCHES "${expected_regex}")
    e2e_fail("alertsummary ${ARGN}: exit ${rc}, output:\n${tool_out}${tool_stderr}\n"
      "expected exit ${expected_rc} and /${expected_regex}/")
  endif()
  set(tool_out "${tool_out}" PARENT_SCOPE)
  set(tool_stderr "${tool_stderr}" PARENT_SCOPE)
endfunction()

# Fails unless the tool refuses the arguments (separated by "|") with exit 2, one line on stderr and no output.
function(expect_usage args)
  string(REPLACE "|" ";" args "${args}")
  tool(rc ${args} ${ARGN})
  if(NOT rc EQUAL 2 OR NOT tool_out STREQUAL "" OR NOT tool_stderr MATCHES "^alertsummary: [^\n]*\n$")
    e2e_fail("alertsummary ${args} ${ARGN}: exit ${rc}, stdout '${tool_out}', stderr '${tool_stderr}'")
  endif()
endfunction()

# Runs the tool while another process holds the collector lock: flock on Linux; under Wine LockFileEx, which
# Wine keeps as a POSIX record lock, as CMake's file(LOCK) takes it.
function(tool_lock_held rc)
  if(WINDOWS)
    file(LOCK "${install}/Alert_Summary/AlertSummaryDB.collector.lock" GUARD FUNCTION TIMEOUT 10)
    tool(r ${ARGN})
  else()
    find_program(FLOCK flock REQUIRED)
    execute_process(COMMAND ${FLOCK} --nonblock "${install}/Alert_Summary/AlertSummaryDB.collector.lock" "${TOOL}"
      ${ARGN} OUTPUT_VARIABLE tool_out ERROR_VARIABLE tool_stderr RESULT_VARIABLE r TIMEOUT 100)
  endif()
  set(${rc} "${r}" PARENT_SCOPE)
  set(tool_out "${tool_out}" PARENT_SCOPE)
endfunction()

# Fails unless each "key/key…=value" holds in the JSON; a last key LENGTH reads the length of what it follows.
# Booleans read ON/OFF, null reads "".
function(expect_json json)
  foreach(check IN LISTS ARGN)
    string(REGEX MATCH "^([^=]*)=(.*)$" check "${check}")
    set(expected "${CMAKE_MATCH_2}")
    string(REPLACE "/" ";" keys "${CMAKE_MATCH_1}")
    set(how GET)
    if(keys MATCHES ";LENGTH$")
      list(POP_BACK keys)
      set(how LENGTH)
    endif()
    string(JSON got ERROR_VARIABLE error ${how} "${json}" ${keys})
    if(NOT "${got}" STREQUAL "${expected}")
      e2e_fail("JSON ${check}: got '${got}' ${error} in\n${json}")
    endif()
  endforeach()
endfunction()

# The retention settings the tool reads: files below --settings-root on Linux, the registry under Wine.
set(E2E_SUITE_KEY "HKLM\\software\\Varnholt Suite\\Varnholt Suite")
function(set_retention enabled days)
  foreach(pair "Sch_Retention;${enabled}" "Sch_Retention_Val;${days}")
    list(GET pair 0 name)
    list(GET pair 1 value)
    if(WINDOWS)
      execute_process(COMMAND ${EMULATOR} reg add "${E2E_SUITE_KEY}\\${name}" /v ${name} /d "${value}" /f
        OUTPUT_QUIET ERROR_QUIET)
    else()
      file(WRITE "${E2E_SETTINGS}/software/Varnholt Suite/Varnholt Suite/${name}/${name}" "${value}")
    endif()
  endforeach()
endfunction()

function(clear_retention)
  file(REMOVE_RECURSE "${E2E_SETTINGS}")
  file(MAKE_DIRECTORY "${E2E_SETTINGS}")
  foreach(name Sch_Retention Sch_Retention_Val)
    if(WINDOWS)
      execute_process(COMMAND ${EMULATOR} reg delete "${E2E_SUITE_KEY}\\${name}" /f OUTPUT_QUIET ERROR_QUIET)
    endif()
  endforeach()
endfunction()

# Runs statements with the sqlite3 program (found by e2e_need(SQLITE3 sqlite3 …)).
function(sqlite out db sql)
  execute_process(COMMAND ${SQLITE3} "${db}" "${sql}" OUTPUT_VARIABLE o ERROR_VARIABLE e RESULT_VARIABLE r
    OUTPUT_STRIP_TRAILING_WHITESPACE)
  if(NOT r EQUAL 0)
    e2e_fail("sqlite3 ${sql}: ${e}")
  endif()
  set(${out} "${o}" PARENT_SCOPE)
endfunction()
