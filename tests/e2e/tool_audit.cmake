# audit on a store that lost one row and holds another twice, beside marked files and alerts that retention purged
# (neither is missing); then --fix and one cycle leave it consistent, and with retention switched off the purged
# files turn into doubts, never into missing ones.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
e2e_need(SQLITE3 sqlite3 "it seeds the faults")
file(COPY "${SOURCE_DIR}/examples/install/" DESTINATION "${install}")
set(db "${install}/Alert_Summary/AlertSummaryDB.db")
set_retention()
macro(audit expected_rc)
  expect_tool(${expected_rc} "" audit --install-dir "${install}" --settings-root "${E2E_SETTINGS}" --format json ${fix})
  expect_json("${tool_out}" ${ARGN})
endmacro()
macro(collect expected)
  expect_tool(0 "^${expected}\n$" collect --once --install-dir "${install}" --log-dir "${root}/log")
endmacro()

collect("stored 36, marked 2, left 0")
audit(0 marked=2)
# Retention keeps what came after 2026/07/01: the days from then to today.
set(cutoff "2026/07/01 00:00:00")
string(TIMESTAMP today "%s" UTC)
math(EXPR keep "${today} / 86400 - 20635")  # 20635: the days from 1970/01/01 to 2026/07/01
set_retention(TRUE "${keep} Days")
sqlite(purged "${db}" "SELECT count(*) FROM AlertDB WHERE \"When\" <= '${cutoff}'")
sqlite(kept "${db}" "SELECT rowid FROM AlertDB WHERE \"When\" > '${cutoff}' ORDER BY rowid LIMIT 2")
string(REPLACE "\n" ";" kept "${kept}")
list(GET kept 0 twice)
list(GET kept 1 lost)
sqlite(lost_path "${db}" "SELECT \"Alert Path\" FROM AlertDB WHERE rowid = ${lost}")
sqlite(copy "${db}" "INSERT INTO AlertDB SELECT * FROM AlertDB WHERE rowid = ${twice}; SELECT last_insert_rowid()")
sqlite(ignored "${db}" "DELETE FROM AlertDB WHERE rowid = ${lost}")
expect_tool(0 "deleted the alerts stamped at or before ${cutoff}" purge --install-dir "${install}"
  --settings-root "${E2E_SETTINGS}")
audit(3 missing/LENGTH=1 duplicates/LENGTH=1 duplicates/0/rowids/0=${twice} duplicates/0/rowids/1=${copy} purged=${purged}
  marked=2 unsure/LENGTH=0 rows_without_file=0)
string(JSON original GET "${tool_out}" missing 0 original)
string(REPLACE "\\" "/" original "${original}")
string(REPLACE "\\" "/" lost_path "${lost_path}")
if(NOT original STREQUAL lost_path)
  e2e_fail("missing '${original}', but the row of '${lost_path}' was deleted")
endif()
tool_lock_held(rc audit --install-dir "${install}" --fix)
if(NOT rc EQUAL 4)
  e2e_fail("audit --fix beside a held lock exited ${rc}: ${tool_out}")
endif()
set(fix --fix)
audit(0 fixed/rows_deleted=1 fixed/files_reoffered=1)
set(fix "")
collect("stored 1, marked 0, left 0")
audit(0 missing/LENGTH=0 duplicates/LENGTH=0 purged=${purged})

# Retention switched off since: the purged files may have been purged under settings since changed, so they are
# doubts, never missing. A row of an unusable date sorts first, yet proves nothing about what purges removed.
set_retention()
sqlite(ignored "${db}" "INSERT INTO AlertDB SELECT \"Alert Action\", \"Alert Type\", \"Alert Name\", '-1/-1/-1 -1:-1:-1',
  \"Threshold\", \"Who\", \"Operation\", \"Component Name\", \"EmailStatus\", \"Server Name\", 'gone.eml' FROM AlertDB LIMIT 1")
audit(0 purged=0 unsure/LENGTH=${purged} missing/LENGTH=0 rows_without_file=1)
