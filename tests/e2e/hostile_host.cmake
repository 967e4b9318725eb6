# Hostile alert files processed by the library's own thread inside the test
# host (whose stack, on Windows, is the 1 MiB of a typical service): deep MIME
# nesting, deeply nested tables, a huge header, very many headers, binary
# junk and an empty file. The process neither crashes nor hangs, and every
# file ends marked: three with a row, and without one the junk, the empty file
# and the message whose text lies deeper than the reader descends.
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
set(install "${WORK}/hostile_host/install")
e2e_prepare_install("${install}")
set(report "${install}/Hostile/AlertReports/Sent items")
file(WRITE "${install}/Hostile/info.dat" "")
file(MAKE_DIRECTORY "${report}")
set(head "From: a@b.example\r\nSubject: Threshold Alert: T \"N\" (S(C)\\R\\X)\r\n")

string(REPEAT "Content-Type: multipart/mixed; boundary=b\r\n\r\n--b\r\n" 3000 nest)
file(WRITE "${report}/deep_mime.eml" "${head}${nest}Content-Type: text/html\r\n\r\n<p>x</p>\r\n")
string(REPEAT "<table><tr><td>" 20000 tables)
file(WRITE "${report}/deep_tables.eml" "${head}Content-Type: text/html\r\n\r\n${tables}x")
string(REPEAT "x" 2000000 long_value)
file(WRITE "${report}/long_header.eml" "${head}X-Long: ${long_value}\r\nContent-Type: text/html\r\n\r\n<p>x</p>")
string(REPEAT "X-H: v\r\n" 100000 many)
file(WRITE "${report}/many_headers.eml" "${head}${many}Content-Type: text/html\r\n\r\n<p>x</p>")
string(ASCII 1 2 127 59 61 63 13 27 junk_unit)
string(REPEAT "${junk_unit}" 50000 junk)
file(WRITE "${report}/junk.eml" "${junk}")
file(WRITE "${report}/empty.eml" "")

e2e_host(output rc "${install}" count @empty @empty run await @empty "<FROM></FROM><TO>9</TO>" 3 40000 sleep 1000)
if(NOT rc EQUAL 0 OR NOT output MATCHES "await 3")
  e2e_fail("hostile files in the host: ${rc} ${output}")
endif()
e2e_expect_all_marked("${report}")
