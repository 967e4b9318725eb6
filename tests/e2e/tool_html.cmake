# The HTML report as a browser builds it: a fixture database with counts this
# test knows, the page opened in headless Chromium, and the chart read back
# from the DOM the browser made: every stacked piece, the totals and the
# performers carry the fixture's counts, the drawn sizes are proportional to
# them, and a day without alerts keeps its place on the axis.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
cmake_policy(SET CMP0007 NEW)  # empty fields of the fixture stay fields
e2e_need(CHROMIUM chromium "the page is checked in a browser")
e2e_need(SQLITE3 sqlite3 "it seeds the fixture")
set(root "${WORK}/tool_html")
set(install "${root}/install")
file(REMOVE_RECURSE "${root}")
file(MAKE_DIRECTORY "${install}")

# day | type | alerts | who | status. Ten types: the two smallest are "Other".
set(fixture
  "2026/03/01|Alpha|6|CORP\\ann, CORP\\bob|Delivered"
  "2026/03/01|Bravo|5|CORP\\bob, CORP\\bob|Delivered"
  "2026/03/03|Charlie|4|N\\A|Failed"
  "2026/03/03|Delta|4||Delivered"
  "2026/03/03|Echo|3|CORP\\cy|Failed"
  "2026/03/04|Foxtrot|3||Delivered"
  "2026/03/04|Golf|2||Delivered"
  "2026/03/04|Hotel|2||Delivered"
  "2026/03/04|India|1||Delivered"
  "2026/03/04|Juliet|1||Delivered"
  "none|Alpha|1||Failed")
set(expected_pieces
  "2026/03/01|Alpha|6" "2026/03/01|Bravo|5" "2026/03/03|Charlie|4" "2026/03/03|Delta|4" "2026/03/03|Echo|3"
  "2026/03/04|Foxtrot|3" "2026/03/04|Golf|2" "2026/03/04|Hotel|2" "2026/03/04|Other|2" "none|Alpha|1")
set(expected_totals "32|24|8")
set(expected_who "CORP\\bob|11" "CORP\\ann|6" "CORP\\cy|3")

expect_tool(0 "" collect --once --install-dir "${install}")
set(sql "")
foreach(line IN LISTS fixture)
  string(REPLACE "|" ";" f "${line}")
  list(GET f 0 day)
  list(GET f 1 type)
  list(GET f 2 n)
  list(GET f 3 who)
  list(GET f 4 status)
  set(when "${day} 10:00:00")
  if(day STREQUAL "none")
    set(when "-1/-1/-1 -1:-1:-1")
  endif()
  string(APPEND sql "INSERT INTO AlertDB WITH RECURSIVE k(i) AS (SELECT 1 UNION ALL SELECT i + 1 FROM k WHERE i < ${n}) "
    "SELECT 'Email Alert', '${type}', 'n', '${when}', 'No', '${who}', 'op', 'File Server', '${status}', 's', "
    "'${type}' || i FROM k;")
endforeach()
sqlite(ignored "${install}/Alert_Summary/AlertSummaryDB.db" "${sql}")
expect_tool(0 "" report --install-dir "${install}" --format html --output "${root}/page.html"
  --made-at "2026/03/05 08:00:00" --install-label "Fixture install")

# The page with a probe that writes what the browser drew into attributes, in
# thousandths of a pixel. The page itself runs no script (its policy forbids it).
file(READ "${root}/page.html" page)
string(REGEX REPLACE "<meta http-equiv=\"Content-Security-Policy\"[^>]*>" "" probe "${page}")
string(REPLACE "</body>" "<script>
for (const e of document.querySelectorAll('[data-count]')) {
  const r = e.getBoundingClientRect();
  e.setAttribute('data-drawn', Math.round(1000 * (e.classList.contains('bar') ? r.width : r.height)));
  e.setAttribute('data-left', Math.round(1000 * r.left));
}
</script></body>" probe "${probe}")
file(WRITE "${root}/probe.html" "${probe}")

function(browser_dom out html)
  string(REPLACE " " "%20" url "file://${html}")
  execute_process(COMMAND ${CHROMIUM} --headless --no-sandbox --disable-gpu --no-first-run
    --disable-background-networking --disable-component-update --disable-sync --user-data-dir=${root}/profile
    --window-size=1200,1000 --dump-dom "${url}"
    OUTPUT_VARIABLE dom ERROR_VARIABLE errors RESULT_VARIABLE r TIMEOUT 90)
  if(NOT r EQUAL 0 OR NOT dom MATCHES "</html>")
    e2e_fail("chromium on ${html}: exit ${r}\n${errors}")
  endif()
  set(${out} "${dom}" PARENT_SCOPE)
endfunction()

# Attribute values of every element matching `element_regex`, joined with "|".
function(read_back out dom element_regex)
  string(REGEX MATCHALL "${element_regex}" elements "${dom}")
  set(rows "")
  foreach(element IN LISTS elements)
    set(row "")
    foreach(attribute ${ARGN})
      if(NOT element MATCHES " ${attribute}=\"([^\"]*)\"")
        e2e_fail("no ${attribute} in ${element}")
      endif()
      string(REPLACE "&amp;" "&" value "${CMAKE_MATCH_1}")
      list(APPEND row "${value}")
    endforeach()
    string(JOIN "|" row ${row})
    list(APPEND rows "${row}")
  endforeach()
  set(${out} "${rows}" PARENT_SCOPE)
endfunction()

function(expect_same what got expected)
  list(SORT got)
  list(SORT expected)
  if(NOT got STREQUAL expected)
    e2e_fail("${what} read back from the browser: ${got}\nthe fixture's: ${expected}")
  endif()
endfunction()

browser_dom(dom "${root}/page.html")
read_back(pieces "${dom}" "<rect class=\"piece\"[^>]*>" data-day data-type data-count)
expect_same("day chart pieces" "${pieces}" "${expected_pieces}")
read_back(totals "${dom}" "<div class=\"totals\"[^>]*>" data-total data-delivered data-failed)
expect_same("totals" "${totals}" "${expected_totals}")
read_back(who "${dom}" "<rect class=\"bar\"[^>]*data-who[^>]*>" data-who data-count)
expect_same("performers" "${who}" "${expected_who}")
if(dom MATCHES "data-day=\"2026/03/02\"")
  e2e_fail("a day without alerts has a bar")
endif()

# Drawn sizes: within each chart, a piece's height (a bar's width) over its
# count is one scale, to half a pixel.
browser_dom(drawn "${root}/probe.html")
set(piece_chart "class=\"piece\"")
set(performer_chart "class=\"bar\"[^>]*data-who")
set(component_chart "class=\"bar\"[^>]*data-component")
foreach(kind piece performer component)
  read_back(sizes "${drawn}" "<rect ${${kind}_chart}[^>]*>" data-count data-drawn)
  list(GET sizes 0 reference)
  string(REGEX MATCH "^([0-9]+)\\|([0-9]+)$" reference "${reference}")
  set(reference_count ${CMAKE_MATCH_1})
  set(reference_px ${CMAKE_MATCH_2})
  foreach(size IN LISTS sizes)
    string(REGEX MATCH "^([0-9]+)\\|(-?[0-9]+)$" size "${size}")
    math(EXPR off "${CMAKE_MATCH_2} - ${reference_px} * ${CMAKE_MATCH_1} / ${reference_count}")
    if(off GREATER 500 OR off LESS -500 OR CMAKE_MATCH_2 LESS_EQUAL 0)
      e2e_fail("a ${kind} of ${size} (alerts|thousandths of a pixel) is off the scale of ${reference}")
    endif()
  endforeach()
endforeach()

# The axis keeps a place for the empty 2026/03/02: 03/01 to 03/03 is two steps of 03/03 to 03/04.
read_back(lefts "${drawn}" "<rect class=\"piece\"[^>]*data-type=\"(Alpha|Charlie|Foxtrot)\"[^>]*>" data-day data-left)
list(FILTER lefts INCLUDE REGEX "^2026")
list(SORT lefts)
string(REGEX REPLACE "[0-9/]+\\|" "" lefts "${lefts}")
list(GET lefts 0 first)
list(GET lefts 1 third)
list(GET lefts 2 fourth)
math(EXPR off "(${third} - ${first}) - 2 * (${fourth} - ${third})")
if(off GREATER 1000 OR off LESS -1000 OR fourth LESS_EQUAL third)
  e2e_fail("days stand at ${lefts} (thousandths of a pixel): the empty day has no place")
endif()
message(STATUS "page and probe in ${root}")
