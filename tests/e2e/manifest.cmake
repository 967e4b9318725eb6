# Each program carries an application manifest asking for asInvoker.
foreach(program IN LISTS PROGRAMS)
  file(STRINGS "${program}" hits REGEX "requestedExecutionLevel level=\"asInvoker\"")
  if(NOT hits)
    message(FATAL_ERROR "${program} has no asInvoker manifest")
  endif()
endforeach()
