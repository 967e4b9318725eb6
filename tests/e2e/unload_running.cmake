# _Run, then unload the library while its thread works, keep running, exit
# normally: no crash, code 0, nothing lost. (Linux stops the thread at
# unload; Windows keeps the library mapped while its thread runs.)
include(${CMAKE_CURRENT_LIST_DIR}/e2e_common.cmake)
set(install "${WORK}/unload_running/install")
e2e_prepare_install("${install}")
e2e_many_alerts("${install}" 10)
e2e_host(output rc "${install}" count @empty @empty run sleep 10800 unload sleep 3000 exit)
if(NOT rc EQUAL 0 OR output MATCHES "terminate" OR NOT output MATCHES "unloaded")
  e2e_fail("unload with the thread running ended with ${rc}: ${output}")
endif()
e2e_expect_nothing_lost("${install}" 380)
