# _Run in an install folder with components: one thread, whose first cycle finds them; a second _Run starts none;
# the process exits normally with the thread running. The host waits for each awaited line before it goes on (a
# line whose writer meets another is dropped by design), so the log is exactly these lines, the thread's start once.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
file(COPY "${HOST}" "${LIBRARY}" DESTINATION "${install}")
file(WRITE "${install}/Alpha/info.dat" "")
file(WRITE "${install}/Beta/info_SP.dat" "")
file(WRITE "${install}/Plain/readme.txt" "")
file(MAKE_DIRECTORY "${install}/Alpha/AlertReports/Sent items" "${install}/Anomaly Alerts")
e2e_log_begin()
set(E2E_AWAIT "log:Inside EnableProcessAlertThread;log:Sent items path contains 0 file(s).")
e2e_host(output rc run wait run wait)
file(READ "${E2E_LOG_DIR}/ErrorLog.txt" log)
string(REGEX REPLACE "[^\n]*\t([^\r\n]*)\r?\n" "\\1\n" log "${log}")  # timestamps cut off
set(run "void _Run\\(\\)\nInside HANDLE BEProcessSuccessfulAlerts::GetSuccAlertsInfo\\(\\)\n")
set(after "After calling GetDomainFolders Function: [^\n]*")
if(NOT rc EQUAL 0 OR NOT output STREQUAL "run nonzero\nrun nonzero\n" OR NOT log MATCHES
    "^${run}Inside EnableProcessAlertThread\\(LPVOID lp\\)\n${run}Anomaly Alerts\n[^\n]*\n${after} path contains \
3 Component\\(s\\)\\.\nInside GetDomainFolders function\n${after}.Alpha.AlertReports.Sent items path contains \
0 file\\(s\\)\\.\n$")
  e2e_fail("the host ended with ${rc}: ${output}\nThe log:\n${log}")
endif()
e2e_log_end()
