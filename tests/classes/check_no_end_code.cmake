# Fails if an object of the archives asks for code to run when the process or a thread ends: a server may exit while
# threads of ours run, so that nothing they touch may be destroyed.
#   cmake -DNM=... "-DARCHIVES=a;b" -P check_no_end_code.cmake
foreach(archive IN LISTS ARCHIVES)
  execute_process(COMMAND ${NM} ${archive} OUTPUT_VARIABLE symbols RESULT_VARIABLE status)
  if(NOT status EQUAL 0 OR NOT symbols MATCHES " T ")
    message(FATAL_ERROR "no objects in ${archive}")
  endif()
  if(symbols MATCHES "U (__cxa_atexit|__cxa_thread_atexit)")
    message(FATAL_ERROR "${archive} refers to ${CMAKE_MATCH_1}")
  endif()
endforeach()
