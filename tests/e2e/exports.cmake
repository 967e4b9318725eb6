# The library exports exactly _Run, _GetAlertCount and _RunRetentionProc (a DLL's export table as objdump reads it,
# a shared object's defined dynamic symbols as nm lists them). On Windows the host and the tool carry an asInvoker
# manifest: an unelevated program without one would be virtualised.
execute_process(COMMAND nm -D --defined-only ${LIBRARY} OUTPUT_VARIABLE dump ERROR_QUIET)
if(WINDOWS)
  execute_process(COMMAND ${OBJDUMP} -p ${LIBRARY} OUTPUT_VARIABLE dump)
  string(REGEX MATCH "\\[Ordinal/Name Pointer\\] Table\n([^\n]+\n)*" dump "${dump}")
  file(STRINGS "${HOST}" host_manifest REGEX "requestedExecutionLevel level=\"asInvoker\"")
  file(STRINGS "${TOOL}" tool_manifest REGEX "requestedExecutionLevel level=\"asInvoker\"")
endif()
string(REGEX MATCHALL "(\\[ *[0-9]+\\]|[0-9a-f]+ [A-Za-z]) [^\n]+" names "${dump}")
list(TRANSFORM names REPLACE "^(\\[ *[0-9]+\\]|[0-9a-f]+ [A-Za-z]) " "")
list(SORT names)
if(NOT names STREQUAL "_GetAlertCount;_Run;_RunRetentionProc" OR WINDOWS AND NOT (host_manifest AND tool_manifest))
  message(FATAL_ERROR "the exports of ${LIBRARY} are '${names}'; manifests: '${host_manifest}' '${tool_manifest}'")
endif()
