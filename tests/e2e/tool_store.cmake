# status and audit over a store in trouble. status, as a person runs it when alerts seem missing: what waits and
# for how long, the database, the collector lock held by another process, retention, the log; it creates nothing.
# audit on a store that lost one row and holds another twice, beside marked files and alerts that retention purged
# (neither is missing); --fix and one cycle leave it consistent; with retention switched off the purged files
# are doubts, never missing ones, and a row of an unusable date (which sorts first) proves nothing about them.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
file(COPY "${SOURCE_DIR}/examples/install/" DESTINATION "${install}")
set(in --install-dir "${install}" --settings-root "${E2E_SETTINGS}")
set(db "${install}/Alert_Summary/AlertSummaryDB.db")
set_retention()
e2e_log_begin()
macro(expect sub expected_rc)
  expect_tool(${expected_rc} "" ${sub} ${in} --format json ${fix})
  expect_json("${tool_out}" ${ARGN})
endmacro()
expect(status 0 pending_total=38 database/exists=OFF collector=free log/on=ON retention/enabled=OFF retention/days=15)
expect_tool(0 "^stored 36, marked 2, left 0\n$" collect --once ${in} --log-dir "${root}")
# One alert arrives late; it was written two hours ago.
set(late "${install}/Exchange/AlertReports/Outbox/late.eml")
file(COPY_FILE "${SOURCE_DIR}/examples/install/Exchange/AlertReports/Outbox/Alert_000004.eml" "${late}")
execute_process(COMMAND touch -d "2 hours ago" "${late}")
set_retention(TRUE "30 Days")
expect(status 0 pending_total=1 database/exists=ON database/rows=36 database/schema_exact=ON database/when_index=OFF
  database/quick_check=ok retention/enabled=ON "retention/days_text=30 Days" retention/days=30)
if(NOT tool_out MATCHES "\"Exchange\",[^}]*\"Outbox\",[^}]*\"files\": 1,[^}]*\"oldest_age_s\": 7[0-9][0-9][0-9]\n"
    OR NOT tool_out MATCHES "\"cutoff\": \"[0-9]+/[0-9][0-9]/[0-9][0-9] 00:00:00\"")
  e2e_fail("the late alert is not two hours old, or the retention cut-off is no day:\n${tool_out}")
endif()
set(locked ON)
expect_tool(0 "\"collector\": \"held\"" status ${in} --format json)
expect_tool(4 "" collect --once ${in})
expect_tool(4 "" audit ${in} --fix)
set(locked OFF)
file(REMOVE "${install}/Alert_Summary/AlertSummaryDB.collector.lock" "${late}" "${E2E_LOG_DIR}/ErrorLog.txt")
expect_tool(0 "collector  free" status ${in})
file(GLOB written "${install}/Alert_Summary/*.lock" "${E2E_LOG_DIR}/ErrorLog.txt")
if(written)
  e2e_fail("status wrote ${written}")
endif()
e2e_log_end()

expect(audit 0 marked=2 missing/LENGTH=0)
# Retention keeps what came after 2026/07/01 (20635 days after 1970/01/01): the days from then to today.
set(cutoff "2026/07/01 00:00:00")
string(TIMESTAMP today "%s" UTC)
math(EXPR keep "${today} / 86400 - 20635")
set_retention(TRUE "${keep} Days")
sqlite(purged "${db}" "SELECT count(*) FROM AlertDB WHERE \"When\" <= '${cutoff}'")
sqlite(kept "${db}" "SELECT rowid FROM AlertDB WHERE \"When\" > '${cutoff}' ORDER BY rowid LIMIT 2")
string(REGEX MATCH "^([0-9]+)\n([0-9]+)$" kept "${kept}")
set(twice ${CMAKE_MATCH_1})
sqlite(lost_path "${db}" "SELECT \"Alert Path\" FROM AlertDB WHERE rowid = ${CMAKE_MATCH_2}")
sqlite(copy "${db}" "DELETE FROM AlertDB WHERE rowid = ${CMAKE_MATCH_2};
  INSERT INTO AlertDB SELECT * FROM AlertDB WHERE rowid = ${twice}; SELECT last_insert_rowid()")
expect_tool(0 "deleted the alerts stamped at or before ${cutoff}" purge ${in})
expect(audit 3 missing/LENGTH=1 "missing/0/original=${lost_path}" duplicates/LENGTH=1 duplicates/0/rowids/0=${twice}
  duplicates/0/rowids/1=${copy} purged=${purged} marked=2 unsure/LENGTH=0 rows_without_file=0)
set(fix --fix)
expect(audit 0 fixed/rows_deleted=1 fixed/files_reoffered=1)
set(fix "")
expect_tool(0 "^stored 1, marked 0, left 0\n$" collect --once ${in} --log-dir "${root}")
expect(audit 0 missing/LENGTH=0 duplicates/LENGTH=0 purged=${purged})
set_retention()
sqlite(ignored "${db}" "INSERT INTO AlertDB SELECT \"Alert Action\", \"Alert Type\", \"Alert Name\", '-1/-1/-1 -1:-1:-1',
  \"Threshold\", \"Who\", \"Operation\", \"Component Name\", \"EmailStatus\", \"Server Name\", 'gone.eml' FROM AlertDB LIMIT 1")
expect(audit 0 purged=0 unsure/LENGTH=${purged} missing/LENGTH=0 rows_without_file=1)
expect_tool(0 "older than every stored alert: a purge under other settings may have removed it" audit ${in})
