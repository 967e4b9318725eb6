# Fails when a source file other than the SQLite access layer (store/sqlite_db.*)
# calls SQLite: every other piece goes through that layer, so that its rules
# (UTF-16 texts, the busy allowance, statements finalized on close) hold
# everywhere.
#   cmake -DSRC=<the src folder> -P sqlite_callers.cmake
file(GLOB_RECURSE sources "${SRC}/*.h" "${SRC}/*.cpp")
set(callers "")
foreach(file IN LISTS sources)
  if(file MATCHES "/store/sqlite_db\\.(h|cpp)$")
    continue()
  endif()
  file(STRINGS "${file}" hits REGEX "sqlite3")
  if(hits)
    list(APPEND callers "${file}")
  endif()
endforeach()
if(callers)
  message(FATAL_ERROR "SQLite is called outside its access layer: ${callers}")
endif()
