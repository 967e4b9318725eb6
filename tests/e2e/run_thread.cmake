# _Run from a host in an install folder with component folders: the thread's
# first cycle, ten seconds later, finds them; the process then exits normally
# with the thread still running. The two _Run calls are apart because a log
# line whose writer finds the file held is dropped by design.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
set(install "${WORK}/run_thread")
e2e_prepare_install("${install}")
file(WRITE "${install}/Alpha/info.dat" "")
file(MAKE_DIRECTORY "${install}/Alpha/AlertReports/Sent items")
file(WRITE "${install}/Beta/info_SP.dat" "")
file(MAKE_DIRECTORY "${install}/Anomaly Alerts")
file(WRITE "${install}/Plain/readme.txt" "")

e2e_log_begin()
e2e_host(output rc "${install}" run sleep 300 run sleep 11500)
if(NOT rc EQUAL 0)
  e2e_fail("host ended with ${rc}: ${output}")
endif()
if(NOT output MATCHES "run nonzero\nrun nonzero")
  e2e_fail("unexpected host output: ${output}")
endif()
if(output MATCHES "terminate")
  e2e_fail("the process ended badly: ${output}")
endif()
e2e_log_lines(lines)
e2e_expect_in_order("${lines}"
  "void _Run()"
  "Inside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo()"
  "Anomaly Alerts"
  "path contains 3 Component(s)."
  "Inside GetDomainFolders function"
  "Sent items path contains 0 file(s).")
# One thread, one first cycle. (A line whose writer meets another writer is
# dropped by design, so the thread's own first line may be missing on a busy
# machine; two threads would show two cycles.)
set(thread_lines "${lines}")
list(FILTER thread_lines INCLUDE REGEX "^Inside EnableProcessAlertThread\\(LPVOID lp\\)$")
set(cycles "${lines}")
list(FILTER cycles INCLUDE REGEX "path contains 3 Component\\(s\\)\\.$")
list(LENGTH thread_lines threads)
list(LENGTH cycles cycle_count)
if(threads GREATER 1 OR NOT cycle_count EQUAL 1)
  e2e_fail("expected one processing thread; the log shows ${threads} thread starts and ${cycle_count} cycles")
endif()
e2e_log_end()
