# The HTML report as a browser builds it: a fixture database with counts this test knows, the page opened in
# headless Chromium with a probe script beside its own style policy, and the charts read back from the DOM the
# browser made: every stacked piece, the totals and the performers carry the fixture's counts, the drawn sizes
# are proportional to them, and a day without alerts keeps its place on the axis.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
e2e_need(CHROMIUM chromium)
e2e_need(SQLITE3 sqlite3)
# day | type | alerts | who | status. Ten types: the two smallest are "Other".
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
expect_tool(0 "" report --install-dir "${install}" --format html --output "${root}/page.html"
  --made-at "2026/03/05 08:00:00" --install-label "Fixture install")

# The probe writes what the browser drew into attributes, in thousandths of a pixel.
file(READ "${root}/page.html" page)
string(REPLACE "default-src 'none';" "default-src 'none'; script-src 'unsafe-inline';" page "${page}")
string(REPLACE "</body>" "<script>
for (const e of document.querySelectorAll('[data-count]')) {
  const r = e.getBoundingClientRect();
  e.setAttribute('data-drawn', Math.round(1000 * (e.classList.contains('bar') ? r.width : r.height)));
  e.setAttribute('data-left', Math.round(1000 * r.left));
}
</script></body>" page "${page}")
file(WRITE "${root}/probe.html" "${page}")
string(REPLACE " " "%20" url "file://${root}/probe.html")
execute_process(COMMAND ${CHROMIUM} --headless --no-sandbox --disable-gpu --no-first-run --disable-sync
  --disable-background-networking --disable-component-update --user-data-dir=${root}/profile
  --window-size=1200,1000 --dump-dom "${url}" OUTPUT_VARIABLE dom ERROR_VARIABLE errors RESULT_VARIABLE r TIMEOUT 90)
if(NOT r EQUAL 0 OR NOT dom MATCHES "</html>")
  e2e_fail("chromium on ${root}/probe.html: exit ${r}\n${errors}")
endif()

# The values of the attributes named (in the page's order) of every element matching `element`, "|"-joined, sorted.
function(read_back out element)
  set(pattern ".*")
  set(replacement "")
  foreach(attribute IN LISTS ARGN)
    string(APPEND pattern " ${attribute}=\"([^\"]*)\".*")
    string(LENGTH "/${replacement}" at)
    math(EXPR at "${at} / 3 + 1")
    string(APPEND replacement "\\${at}|")
  endforeach()
  string(REGEX MATCHALL "${element}" rows "${dom}")
  list(TRANSFORM rows REPLACE "${pattern}" "${replacement}")
  list(TRANSFORM rows REPLACE "\\|$" "")
  list(SORT rows)
  set(${out} ${${out}} ${rows} PARENT_SCOPE)
endfunction()

set(piece "<rect class=\"piece\"[^>]*>")
set(performer "<rect class=\"bar\"[^>]*data-who[^>]*>")
read_back(got "${piece}" data-day data-type data-count)
read_back(got "<div class=\"totals\"[^>]*>" data-total data-delivered data-failed)
read_back(got "${performer}" data-who data-count)
set(expected "2026/03/01|Alpha|6" "2026/03/01|Bravo|5" "2026/03/03|Charlie|4" "2026/03/03|Delta|4"
  "2026/03/03|Echo|3" "2026/03/04|Foxtrot|3" "2026/03/04|Golf|2" "2026/03/04|Hotel|2" "2026/03/04|Other|2"
  "none|Alpha|1" "32|24|8" "CORP\\ann|6" "CORP\\bob|11" "CORP\\cy|3")
if(NOT got STREQUAL expected)
  e2e_fail("day chart pieces, totals and performers read back from the browser:\n${got}\nthe fixture's:\n${expected}")
endif()

# Within each chart a piece's height (a bar's width) over its count is one scale, to half a pixel.
foreach(chart "${piece}" "${performer}" "<rect class=\"bar\"[^>]*data-component[^>]*>")
  set(sizes "")
  read_back(sizes "${chart}" data-count data-drawn)
  string(REGEX MATCH "^([0-9]+)\\|([0-9]+)" reference "${sizes}")
  set(scale "${CMAKE_MATCH_2} / ${CMAKE_MATCH_1}")
  foreach(size IN LISTS sizes)
    string(REGEX MATCH "^([0-9]+)\\|(-?[0-9]+)$" size "${size}")
    math(EXPR off "${CMAKE_MATCH_2} - ${CMAKE_MATCH_1} * ${scale}")
    if(off GREATER 500 OR off LESS -500 OR CMAKE_MATCH_2 LESS_EQUAL 0)
      e2e_fail("a piece of ${size} (alerts|thousandths of a pixel) is off the scale of ${reference}")
    endif()
  endforeach()
endforeach()

# The empty 2026/03/02 has no bar but keeps its place: 03/01 to 03/03 is two steps of 03/03 to 03/04.
set(lefts "")
read_back(lefts "<rect class=\"piece\"[^>]*data-day=\"2026[^>]*data-type=\"(Alpha|Charlie|Foxtrot)\"[^>]*>"
  data-day data-left)
string(REGEX MATCH "^[0-9/]+\\|([0-9]+);[0-9/]+\\|([0-9]+);[0-9/]+\\|([0-9]+)$" days "${lefts}")
math(EXPR off "(${CMAKE_MATCH_2} - ${CMAKE_MATCH_1}) - 2 * (${CMAKE_MATCH_3} - ${CMAKE_MATCH_2})")
if(off GREATER 1000 OR off LESS -1000 OR CMAKE_MATCH_3 LESS_EQUAL CMAKE_MATCH_2 OR dom MATCHES "data-day=\"2026/03/02\"")
  e2e_fail("days stand at ${lefts} (thousandths of a pixel): the empty day has a bar or no place")
endif()
