# The host in a copy of the example install folder: a count first (which creates the database), then _Run; after
# the first cycle every example alert is stored with the expected row or marked, and the host's counts agree.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
file(COPY "${HOST}" "${LIBRARY}" "${SOURCE_DIR}/examples/install/" DESTINATION "${install}")
set(all "<FROM></FROM><TO>9999/99/99 99:99:99</TO>")
set(june "<FROM>2026/06/01 00:00:00</FROM><TO>2026/06/30 23:59:59</TO>")
e2e_host(output rc count @empty "${all}" run await @empty "${all}" 36 60000 count "Script Alert" "${all}"
  count "Email Alert" "${all}" count Change "${all}" count "Data Leakage" "${all}" count @empty "${june}"
  count Change "${june}")
set(expected "count 0\nrun nonzero\nawait 36\ncount 10\ncount 26\ncount 20\ncount 2\ncount 2\ncount 2\n")
if(NOT rc EQUAL 0 OR NOT output STREQUAL expected)
  e2e_fail("the host ended with ${rc} and printed:\n${output}\nexpected:\n${expected}")
endif()
if(WINDOWS)  # every way the service hands over its string objects, on the stored rows
  e2e_host(output rc abicheck Change "${all}" 20 36 abicheck @empty "${june}" 2 2)
  if(NOT rc EQUAL 0 OR NOT output STREQUAL "abicheck ok\nabicheck ok\n")
    e2e_fail("string passing: ${rc} ${output}")
  endif()
endif()
e2e_expect_all_marked("${install}")
e2e_need(SQLITE3 sqlite3 "the stored rows are read with it")
execute_process(COMMAND ${SQLITE3} -separator " | " "${install}/Alert_Summary/AlertSummaryDB.db"
  INPUT_FILE "${CMAKE_CURRENT_LIST_DIR}/rows.sql" OUTPUT_VARIABLE rows RESULT_VARIABLE rc)
file(READ "${CMAKE_CURRENT_LIST_DIR}/example_rows.txt" expected_rows)
if(NOT rc EQUAL 0 OR NOT rows STREQUAL expected_rows)
  file(WRITE "${root}/rows.txt" "${rows}")
  e2e_fail("the stored rows differ from example_rows.txt; see ${root}/rows.txt")
endif()
