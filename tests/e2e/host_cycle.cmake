# The host in the example install folder, with two files nested deeper than any reader descends: a count first
# (which creates the database), then _Run. After the first cycle, on the library's own thread (on Windows with the
# 1 MiB stack of a typical service), every file is marked, the examples with the expected rows, and the counts agree.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
file(COPY "${HOST}" "${LIBRARY}" "${SOURCE_DIR}/examples/install/" DESTINATION "${install}")
file(WRITE "${install}/Deep/info.dat" "")
set(head "From: a@b.example\r\nSubject: Threshold Alert: T \"N\" (S(C)\\R\\X)\r\nContent-Type: ")
string(REPEAT "multipart/mixed; boundary=b\r\n\r\n--b\r\nContent-Type: " 3000 nest)
string(REPEAT "<table><tr><td>" 20000 tables)
file(WRITE "${install}/Deep/AlertReports/Sent items/mime.eml" "${head}${nest}text/html\r\n\r\n<p>x</p>\r\n")
file(WRITE "${install}/Deep/AlertReports/Sent items/tables.eml" "${head}text/html\r\n\r\n${tables}x")
set(all "<FROM></FROM><TO>9999/99/99 99:99:99</TO>")
set(june "<FROM>2026/06/01 00:00:00</FROM><TO>2026/06/30 23:59:59</TO>")
set(E2E_AWAIT "marked:40")
e2e_host(output rc count @empty "${all}" run wait count @empty "${all}" count "Script Alert" "${all}"
  count "Email Alert" "${all}" count Change "${all}" count "Data Leakage" "${all}" count @empty "${june}"
  count Change "${june}")
set(expected "count 0\nrun nonzero\ncount 37\ncount 10\ncount 27\ncount 20\ncount 2\ncount 2\ncount 2\n")
if(WINDOWS)  # every way the service hands over its string objects, on the stored rows
  e2e_host(abi abi_rc abicheck Change "${all}" 20 37 abicheck @empty "${june}" 2 2)
  string(APPEND output "${abi_rc} ${abi}")
  string(APPEND expected "0 abicheck ok\nabicheck ok\n")
endif()
file(GLOB_RECURSE left "${install}/[!P]*.eml")  # not yet PROC_
execute_process(COMMAND sqlite3 -separator " | " "${install}/Alert_Summary/AlertSummaryDB.db"
  INPUT_FILE "${CMAKE_CURRENT_LIST_DIR}/rows.sql" OUTPUT_FILE "${root}/rows.txt")
execute_process(COMMAND ${CMAKE_COMMAND} -E compare_files "${root}/rows.txt"
  "${CMAKE_CURRENT_LIST_DIR}/example_rows.txt" RESULT_VARIABLE rows_differ)
if(NOT rc EQUAL 0 OR NOT output STREQUAL expected OR left OR rows_differ)
  e2e_fail("exit ${rc}, the host printed:\n${output}\nexpected:\n${expected}\nunmarked: ${left}\n"
    "the stored rows: ${root}/rows.txt against example_rows.txt")
endif()
