# Shared steps of the end-to-end scripts, each of which works in its own folder made afresh: ${root}, with the
# install folder ${install} and the settings tree ${E2E_SETTINGS} (the tool's --settings-root on Linux).
# Run by itself with -DCONDITIONS, this file is the waiter that feeds the host's "wait" steps (e2e_host).
set(E2E_COMMON "${CMAKE_CURRENT_LIST_FILE}")
set(E2E_LOG_DIR "/var/log/AlertSummaryDbg")
if(WINDOWS)
  set(E2E_LOG_DIR "$ENV{WINEPREFIX}/drive_c/AlertSummaryDbg")
endif()
if(DEFINED CONDITIONS)
  # A line to the host as each condition holds, in turn: "log:TEXT" (the log holds TEXT) or "marked:N" (N files
  # below the install folder have their PROC_ name). At the deadline, a safety net against a hang, the host reads
  # the end of its input instead and goes on, and the test fails on what it then finds.
  string(TIMESTAMP deadline "%s")
  math(EXPR deadline "${deadline} + 100")
  string(REPLACE "|" ";" CONDITIONS "${CONDITIONS}")
  foreach(condition IN LISTS CONDITIONS)
    set(found -1)
    while(found LESS 0)
      execute_process(COMMAND ${CMAKE_COMMAND} -E sleep 0.1)
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
    endwhile()
    execute_process(COMMAND ${CMAKE_COMMAND} -E echo held)
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

# At a script's top level: skips the test, with one line, when a program it needs is missing.
macro(e2e_need var program why)
  find_program(${var} ${program})
  if(NOT ${var})
    message(STATUS "SKIPPED: no ${program} on this machine; ${why}")
    return()
  endif()
endmacro()

# At a script's top level: switches the library's debug log on, empty (or skips the test where the folder cannot be
# made); e2e_log_end (and e2e_fail) switch it off again if this script switched it on.
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

# Runs the host in ${install} with the steps given; its "wait" steps wait for the conditions of E2E_AWAIT
# (separated by "|"), which the waiter above watches beside it.
function(e2e_host out rc)
  file(GLOB host "${install}/testhost*")
  execute_process(COMMAND ${CMAKE_COMMAND} -DWINDOWS=${WINDOWS} "-DINSTALL=${install}" "-DCONDITIONS=${E2E_AWAIT}"
      -P "${E2E_COMMON}" COMMAND ${EMULATOR} ${host} ${ARGN}
    WORKING_DIRECTORY "${install}" OUTPUT_VARIABLE o ERROR_VARIABLE e RESULT_VARIABLE r TIMEOUT 130)
  set(${out} "${o}${e}" PARENT_SCOPE)
  set(${rc} "${r}" PARENT_SCOPE)
endfunction()

# Runs the support tool (under `prefix`, e.g. a lock holder); tool_out and tool_stderr hold what it wrote.
macro(tool rc)
  execute_process(COMMAND ${prefix} ${EMULATOR} "${TOOL}" ${ARGN}
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

# Fails unless the tool refuses the arguments (separated by "|", then ARGN) with exit 2, one stderr line, no output.
function(expect_usage args)
  string(REPLACE "|" ";" args "${args}")
  tool(rc ${args} ${ARGN})
  if(NOT rc EQUAL 2 OR NOT tool_out STREQUAL "" OR NOT tool_stderr MATCHES "^alertsummary: [^\n]*\n$")
    e2e_fail("alertsummary ${args} ${ARGN}: exit ${rc}, stdout '${tool_out}', stderr '${tool_stderr}'")
  endif()
endfunction()

# Runs the tool while another process holds the collector lock: flock on Linux; under Wine, LockFileEx, which Wine
# keeps as a POSIX record lock, as CMake's file(LOCK) takes it.
function(tool_lock_held rc)
  set(lock "${install}/Alert_Summary/AlertSummaryDB.collector.lock")
  if(WINDOWS)
    file(LOCK "${lock}" GUARD FUNCTION TIMEOUT 10)
  else()
    set(prefix flock --nonblock "${lock}")
  endif()
  tool(r ${ARGN})
  set(${rc} "${r}" PARENT_SCOPE)
  set(tool_out "${tool_out}${tool_stderr}" PARENT_SCOPE)
endfunction()

# Fails unless each "key/key…=value" holds in the JSON (a last key LENGTH reads the length of what it follows).
# Booleans read ON/OFF, null reads "".
function(expect_json json)
  foreach(check IN LISTS ARGN)
    string(REGEX MATCH "^([^=]*)=(.*)$" check "${check}")
    set(expected "${CMAKE_MATCH_2}")
    string(REPLACE "/" ";" keys "${CMAKE_MATCH_1}")
    set(how GET)
    if(keys MATCHES "(.*);LENGTH$")
      set(how LENGTH)
      set(keys "${CMAKE_MATCH_1}")
    endif()
    string(JSON got ERROR_VARIABLE error ${how} "${json}" ${keys})
    if(NOT "${got}" STREQUAL "${expected}")
      e2e_fail("JSON ${check}: got '${got}' ${error} in\n${json}")
    endif()
  endforeach()
endfunction()

# The retention settings the tool reads: files below --settings-root on Linux, the registry under Wine. No
# arguments: none set.
function(set_retention)
  file(REMOVE_RECURSE "${E2E_SETTINGS}")
  set(names Sch_Retention Sch_Retention_Val)
  foreach(i 0 1)
    list(GET names ${i} name)
    set(value "${ARGV${i}}")
    set(key "HKLM\\software\\Varnholt Suite\\Varnholt Suite\\${name}")
    if(WINDOWS AND ARGV)
      execute_process(COMMAND ${EMULATOR} reg add "${key}" /v ${name} /d "${value}" /f OUTPUT_QUIET ERROR_QUIET)
    elseif(WINDOWS)
      execute_process(COMMAND ${EMULATOR} reg delete "${key}" /f OUTPUT_QUIET ERROR_QUIET)
    elseif(ARGV)
      file(WRITE "${E2E_SETTINGS}/software/Varnholt Suite/Varnholt Suite/${name}/${name}" "${value}")
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
