# Fails if an object of the archives asks for code to run when the process or a thread ends: a server may exit while
# threads of ours run, so that nothing they touch may be destroyed. One object has the exit wait, and destroys nothing.
#   cmake -DNM=... "-DARCHIVES=a;b" -DWAITS=c.cpp.o -P check_no_end_code.cmake
foreach(archive IN LISTS ARCHIVES)
  execute_process(COMMAND ${NM} -A ${archive} OUTPUT_VARIABLE symbols RESULT_VARIABLE status)
  if(NOT status EQUAL 0 OR NOT symbols MATCHES " T ")
    message(FATAL_ERROR "no objects in ${archive}")
  endif()
  string(REGEX REPLACE ":${WAITS}: +U __cxa_atexit\n" "" symbols "${symbols}")
  if(symbols MATCHES "U (__cxa_atexit|__cxa_thread_atexit)")
    message(FATAL_ERROR "${archive} refers to ${CMAKE_MATCH_1}")
  endif()
endforeach()
