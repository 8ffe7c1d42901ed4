# Fails unless the class records are data that the linker places: no code that runs at load, nothing writable before
# relocation, in any object of the archive.
#   cmake -DREADELF=... -DARCHIVE=... -P check_constant_data.cmake
execute_process(COMMAND ${READELF} --sections --wide ${ARCHIVE} OUTPUT_VARIABLE sections RESULT_VARIABLE status)
if(NOT status EQUAL 0 OR NOT sections MATCHES "\\.data\\.rel\\.ro\\.local")
  message(FATAL_ERROR "no class records in ${ARCHIVE}")
endif()
foreach(section \\.init_array \\.ctors \\.fini_array)
  if(sections MATCHES "${section}")
    message(FATAL_ERROR "${ARCHIVE} has a ${section} section: code runs at load")
  endif()
endforeach()
# A section's line: number, name, type, address, offset, size.
if(sections MATCHES " \\.(data|bss|tbss|tdata) +[A-Z]+ +[0-9a-f]+ [0-9a-f]+ 0*[1-9a-f]")
  message(FATAL_ERROR "${ARCHIVE} has writable data: ${CMAKE_MATCH_0}")
endif()
