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
list(FILTER lines INCLUDE REGEX "^Inside EnableProcessAlertThread\\(LPVOID lp\\)$")
list(LENGTH lines threads)
if(NOT threads EQUAL 1)
  e2e_fail("expected one processing thread, the log shows ${threads}")
endif()
e2e_log_end()
