# Shared steps of the end-to-end scripts.
#
# e2e_prepare_install(<dir>)  a fresh install folder holding the host and the library
# e2e_log_begin()             switches the library's debug log on, empty
# e2e_log_lines(<var>)        the log's messages, timestamps cut off
# e2e_log_end()               switches the log off again when we switched it on
# e2e_host(<out> <rc> args…)  runs the host with the steps given

if(WINDOWS)
  if(DEFINED ENV{WINEPREFIX})
    set(E2E_LOG_DIR "$ENV{WINEPREFIX}/drive_c/AlertSummaryDbg")
  else()
    set(E2E_LOG_DIR "$ENV{HOME}/.wine-alertsummary/drive_c/AlertSummaryDbg")
  endif()
  set(E2E_HOST_NAME testhost.exe)
else()
  set(E2E_LOG_DIR "/var/log/AlertSummaryDbg")
  set(E2E_HOST_NAME testhost)
endif()

function(e2e_prepare_install dir)
  file(REMOVE_RECURSE "${dir}")
  file(MAKE_DIRECTORY "${dir}")
  file(COPY "${HOST}" "${LIBRARY}" DESTINATION "${dir}")
endfunction()

function(e2e_log_begin)
  if(NOT EXISTS "${E2E_LOG_DIR}")
    file(MAKE_DIRECTORY "${E2E_LOG_DIR}")
    if(NOT EXISTS "${E2E_LOG_DIR}")
      message(STATUS "SKIPPED: cannot create the debug log folder ${E2E_LOG_DIR} (run as root)")
      return()
    endif()
    file(WRITE "${WORK}/${CASE}.created-log-dir" "")
  endif()
  file(REMOVE "${E2E_LOG_DIR}/ErrorLog.txt")
endfunction()

function(e2e_log_end)
  if(EXISTS "${WORK}/${CASE}.created-log-dir")
    file(REMOVE_RECURSE "${E2E_LOG_DIR}")
    file(REMOVE "${WORK}/${CASE}.created-log-dir")
  endif()
endfunction()

function(e2e_log_lines var)
  set(lines "")
  if(EXISTS "${E2E_LOG_DIR}/ErrorLog.txt")
    file(STRINGS "${E2E_LOG_DIR}/ErrorLog.txt" raw)
    foreach(line IN LISTS raw)
      string(REGEX REPLACE "^[^\t]*\t" "" line "${line}")
      string(REPLACE "\r" "" line "${line}")
      list(APPEND lines "${line}")
    endforeach()
  endif()
  set(${var} "${lines}" PARENT_SCOPE)
endfunction()

function(e2e_host out rc dir)
  execute_process(COMMAND ${EMULATOR} "${dir}/${E2E_HOST_NAME}" ${ARGN}
    WORKING_DIRECTORY "${dir}" OUTPUT_VARIABLE output ERROR_VARIABLE errors RESULT_VARIABLE result
    TIMEOUT 100)
  set(${out} "${output}${errors}" PARENT_SCOPE)
  set(${rc} "${result}" PARENT_SCOPE)
endfunction()

function(e2e_fail text)
  e2e_log_end()
  message(FATAL_ERROR "${text}")
endfunction()

# Fails unless `needles` (a list) occur in `lines` in this order.
function(e2e_expect_in_order lines)
  set(position 0)
  list(LENGTH lines count)
  foreach(needle IN LISTS ARGN)
    set(found -1)
    set(i ${position})
    while(i LESS count)
      list(GET lines ${i} line)
      string(FIND "${line}" "${needle}" at)
      if(at GREATER_EQUAL 0)
        set(found ${i})
        break()
      endif()
      math(EXPR i "${i} + 1")
    endwhile()
    if(found LESS 0)
      string(REPLACE ";" "\n  " shown "${lines}")
      e2e_fail("log line '${needle}' missing or out of order; the log:\n  ${shown}")
    endif()
    math(EXPR position "${found} + 1")
  endforeach()
endfunction()
