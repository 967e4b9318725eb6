# Shared steps of the end-to-end scripts. Each works in its own folder, made afresh: ${root}, with the install
# folder ${install} and the settings tree ${E2E_SETTINGS} (the tool's --settings-root on Linux).
set(E2E_COMMON "${CMAKE_CURRENT_LIST_FILE}")
set(E2E_LOG_DIR "/var/log/AlertSummaryDbg")
if(WINDOWS)
  set(E2E_LOG_DIR "$ENV{WINEPREFIX}/drive_c/AlertSummaryDbg")
endif()
if(DEFINED CONDITIONS)
  # Run by e2e_host beside the host: a line to the host as each condition holds, in turn: "log:TEXT" (the log
  # holds TEXT) or "marked:N" (N files below the install folder have their PROC_ name). The deadline is a safety
  # net only: the host then goes on at once, and the test fails on what it finds.
  string(TIMESTAMP now "%s")
  math(EXPR deadline "${now} + 100")
  string(REPLACE "|" ";" CONDITIONS "${CONDITIONS}")
  foreach(condition IN LISTS CONDITIONS)
    set(found -1)
    while(found LESS 0 AND now LESS deadline)
      execute_process(COMMAND ${CMAKE_COMMAND} -E sleep 0.1)
      string(TIMESTAMP now "%s")
      if(condition MATCHES "^log:(.*)" AND EXISTS "${E2E_LOG_DIR}/ErrorLog.txt")
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
file(MAKE_DIRECTORY "${install}")
find_program(SQLITE3 sqlite3 REQUIRED)

# At a script's top level: switches the library's debug log on, empty, or skips the test where it cannot.
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

function(e2e_log_end)  # switches the log off again if e2e_log_begin switched it on
  if(EXISTS "${root}/created-log-dir")
    file(REMOVE_RECURSE "${E2E_LOG_DIR}" "${root}/created-log-dir")
  endif()
endfunction()

function(e2e_fail text)
  e2e_log_end()
  message(FATAL_ERROR "${text}")
endfunction()

# Runs the host in ${install} with the steps given; its "wait" steps wait for the conditions of E2E_AWAIT
# ("|" between them), which this file watches beside it.
function(e2e_host out rc)
  file(GLOB host "${install}/testhost*")
  execute_process(COMMAND ${CMAKE_COMMAND} -DWINDOWS=${WINDOWS} "-DINSTALL=${install}" "-DCONDITIONS=${E2E_AWAIT}"
      -P "${E2E_COMMON}" COMMAND ${EMULATOR} ${host} ${ARGN}
    WORKING_DIRECTORY "${install}" OUTPUT_VARIABLE o ERROR_VARIABLE e RESULT_VARIABLE r TIMEOUT 130)
  set(${out} "${o}${e}" PARENT_SCOPE)
  set(${rc} "${r}" PARENT_SCOPE)
endfunction()

# Runs the support tool into tool_out; fails unless it exits `expected_rc` (2: with one line on stderr and nothing
# else) and its output, stderr after stdout, matches `regex`. With `locked` on, another process holds the collector
# lock meanwhile: flock on Linux; under Wine LockFileEx, which Wine keeps as a POSIX record lock, as file(LOCK) does.
function(expect_tool expected_rc regex)
  set(lock "${install}/Alert_Summary/AlertSummaryDB.collector.lock")
  if(locked AND WINDOWS)
    file(LOCK "${lock}" GUARD FUNCTION TIMEOUT 10)
  elseif(locked)
    set(EMULATOR flock --nonblock "${lock}")
  endif()
  execute_process(COMMAND ${EMULATOR} "${TOOL}" ${ARGN} OUTPUT_VARIABLE out ERROR_VARIABLE err RESULT_VARIABLE rc)
  if(NOT rc EQUAL expected_rc OR NOT "${out}${err}" MATCHES "${regex}" OR expected_rc EQUAL 2 AND
      (NOT out STREQUAL "" OR NOT err MATCHES "^alertsummary: [^\n]*\n$"))
    e2e_fail("alertsummary ${ARGN}: exit ${rc}, output:\n${out}${err}\nexpected exit ${expected_rc} and /${regex}/")
  endif()
  set(tool_out "${out}" PARENT_SCOPE)
endfunction()

# Fails unless each "key/key…=value" holds in the JSON (a last key LENGTH reads the length of what it follows).
# Booleans read ON/OFF, null reads "".
function(expect_json json)
  foreach(check IN LISTS ARGN)
    string(REGEX MATCH "^(([^=]*)/LENGTH|[^=]*)=(.*)$" check "${check}")
    set(how GET)
    set(keys "${CMAKE_MATCH_1}")
    if(NOT "${CMAKE_MATCH_2}" STREQUAL "")
      set(how LENGTH)
      set(keys "${CMAKE_MATCH_2}")
    endif()
    string(REPLACE "/" ";" keys "${keys}")
    string(JSON got ERROR_VARIABLE error ${how} "${json}" ${keys})
    if(NOT "${got}" STREQUAL "${CMAKE_MATCH_3}")
      e2e_fail("JSON ${check}: got '${got}' ${error} in\n${json}")
    endif()
  endforeach()
endfunction()

# The retention settings the tool reads (none without arguments): files below --settings-root on Linux, the
# registry under Wine.
function(set_retention)
  file(REMOVE_RECURSE "${E2E_SETTINGS}")
  set(names Sch_Retention Sch_Retention_Val)
  foreach(name value IN ZIP_LISTS names ARGV)
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

function(sqlite out db sql)
  execute_process(COMMAND ${SQLITE3} "${db}" "${sql}" OUTPUT_VARIABLE o OUTPUT_STRIP_TRAILING_WHITESPACE
    COMMAND_ERROR_IS_FATAL ANY)
  set(${out} "${o}" PARENT_SCOPE)
endfunction()
