# The HTML report of a fixture as headless Chromium builds it, read back from its DOM: the charts carry the
# fixture's counts, drawn to one scale, and a day without alerts keeps its place on the axis.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
find_program(CHROMIUM chromium)
if(NOT CHROMIUM)
  message(STATUS "SKIPPED: no chromium on this machine to check the page in")
  return()
endif()
# day | type | alerts | who | status. Of ten types the two smallest are "Other".
set(fixture "2026/03/01|Alpha|6|CORP\\ann, CORP\\bob|Delivered" "2026/03/01|Bravo|5|CORP\\bob, CORP\\bob|Delivered"
  "2026/03/03|Charlie|4|N\\A|Failed" "2026/03/03|Delta|4||Delivered" "2026/03/03|Echo|3|CORP\\cy|Failed"
  "2026/03/04|Foxtrot|3||Delivered" "2026/03/04|Golf|2||Delivered" "2026/03/04|Hotel|2||Delivered"
  "2026/03/04|India|1||Delivered" "2026/03/04|Juliet|1||Delivered" "none|Alpha|1||Failed")
list(TRANSFORM fixture REPLACE "^([^|]*)\\|([^|]*)\\|([^|]*)\\|([^|]*)\\|(.*)$" "INSERT INTO AlertDB WITH RECURSIVE \
k(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM k WHERE i < \\3) SELECT 'Email Alert', '\\2', 'n', '\\1 10:00:00', \
'No', '\\4', 'op', 'File Server', '\\5', 's', '\\2' || i FROM k;" OUTPUT_VARIABLE sql)
string(REPLACE "'none 10:00:00'" "'-1/-1/-1 -1:-1:-1'" sql "${sql}")
expect_tool(0 "" collect --once --install-dir "${install}")
sqlite(ignored "${install}/Alert_Summary/AlertSummaryDB.db" "${sql}")
expect_tool(0 "" report --install-dir "${install}" --format html --output "${root}/page.html")
# Beside the page's own style policy, a probe writes what the browser drew into attributes, in thousandths of a pixel.
file(READ "${root}/page.html" page)
string(REPLACE "default-src 'none';" "default-src 'none'; script-src 'unsafe-inline';" page "${page}")
string(REPLACE "</body>" "<script>for (const e of document.querySelectorAll('[data-count]')) {
  const r = e.getBoundingClientRect(), bar = e.classList.contains('bar');
  e.setAttribute('data-drawn', Math.round(1000 * (bar ? r.width : r.height)));
  e.setAttribute('data-left', Math.round(1000 * r.left)); }</script></body>" page "${page}")
file(WRITE "${root}/probe.html" "${page}")
execute_process(COMMAND ${CHROMIUM} --headless --no-sandbox --disable-gpu --no-first-run --disable-sync
  --disable-background-networking --disable-component-update --user-data-dir=${root}/profile
  --window-size=1200,1000 --dump-dom "${root}/probe.html" OUTPUT_VARIABLE dom ERROR_VARIABLE errors RESULT_VARIABLE r TIMEOUT 90)
if(NOT r EQUAL 0 OR NOT dom MATCHES "</html>")
  e2e_fail("chromium on ${root}/probe.html: exit ${r}\n${errors}")
endif()
# Appends to `out` the `replacement` of each element matching `element` (a regex of its attributes).
function(read_back out element replacement)
  string(REGEX MATCHALL "${element}[^>]*>" rows "${dom}")
  list(TRANSFORM rows REPLACE "${element}[^>]*>" "${replacement}")
  set(${out} ${${out}} ${rows} PARENT_SCOPE)
endfunction()
set(v "=\"([^\"]*)\"")
read_back(got "<rect class=\"piece\"[^>]* data-day${v} data-type${v} data-count${v}" "\\1|\\2|\\3")
read_back(got "<div class=\"totals\" data-total${v} data-delivered${v} data-failed${v}" "\\1|\\2|\\3")
read_back(got "<rect class=\"bar\"[^>]* data-who${v} data-count${v}" "\\1|\\2")
list(SORT got)
if(NOT got STREQUAL "2026/03/01|Alpha|6;2026/03/01|Bravo|5;2026/03/03|Charlie|4;2026/03/03|Delta|4;\
2026/03/03|Echo|3;2026/03/04|Foxtrot|3;2026/03/04|Golf|2;2026/03/04|Hotel|2;2026/03/04|Other|2;32|24|8;\
CORP\\ann|6;CORP\\bob|11;CORP\\cy|3;none|Alpha|1")
  e2e_fail("the day chart's pieces, the totals and the performers as the browser read them:\n${got}")
endif()
# Within each chart a piece's height (a bar's width) over its count is one scale, to half a pixel.
foreach(chart "class=\"piece\"" "data-who" "data-component")
  set(sizes "")
  read_back(sizes "<rect [^>]*${chart}[^>]* data-count${v} data-drawn${v}" "\\1;\\2")
  list(GET sizes 1 0 scale)
  string(REPLACE ";" " / " scale "${scale}")
  while(sizes)
    list(POP_FRONT sizes count drawn)
    math(EXPR off "${drawn} - ${count} * ${scale}")
    if(off GREATER 500 OR off LESS -500 OR drawn LESS_EQUAL 0)
      e2e_fail("${chart}: ${count} alerts drawn ${drawn}/1000 px, off the scale ${scale} px per alert")
    endif()
  endwhile()
endforeach()
# The empty 2026/03/02 has no bar but keeps its place: 03/01 to 03/03 is two steps of 03/03 to 03/04.
read_back(lefts "<rect class=\"piece\" [^>]*data-day=\"2026[^>]* data-type=\"(Alpha|Charlie|Foxtrot)\"[^>]* \
data-left${v}" "\\2")
string(REGEX MATCH "^([0-9]+);([0-9]+);([0-9]+)$" ignored "${lefts}")
math(EXPR off "(${CMAKE_MATCH_2} - ${CMAKE_MATCH_1}) - 2 * (${CMAKE_MATCH_3} - ${CMAKE_MATCH_2})")
if(off GREATER 1000 OR off LESS -1000 OR CMAKE_MATCH_3 LESS_EQUAL CMAKE_MATCH_2 OR dom MATCHES "data-day=\"2026/03/02\"")
  e2e_fail("days stand at ${lefts} (thousandths of a pixel): the empty day has a bar or no place")
endif()
