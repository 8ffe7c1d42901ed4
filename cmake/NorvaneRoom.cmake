# norvane_room(NAME SOURCES... [LINK libs...]): a room of the house as a static library `nvr_NAME`, included by paths
# from the repository's root ("runtime/Instance.h"), compiled so that it can go into the shared module. What it keeps for
# each thread lies with the threads' own data: else the loader would ask for memory when a thread first comes to it, and
# end the process where there is none.
function(norvane_room name)
  cmake_parse_arguments(ROOM "" "" "SOURCES;LINK" ${ARGN})
  add_library(nvr_${name} STATIC ${ROOM_SOURCES})
  target_include_directories(nvr_${name} PUBLIC ${PROJECT_SOURCE_DIR})
  target_compile_options(nvr_${name} PRIVATE -ftls-model=initial-exec)
  target_link_libraries(nvr_${name} PUBLIC ${ROOM_LINK} Threads::Threads)
endfunction()

# norvane_test_headers(): GoogleTest's headers, compiled once for all tests: they are a third of each test's compile time.
function(norvane_test_headers)
  file(CONFIGURE OUTPUT test_headers.cpp CONTENT "int main() {}\n")
  add_executable(norvane_test_headers ${CMAKE_CURRENT_BINARY_DIR}/test_headers.cpp)
  target_link_libraries(norvane_test_headers PRIVATE GTest::gmock Threads::Threads)
  target_precompile_headers(norvane_test_headers PRIVATE <gmock/gmock.h> <gtest/gtest.h>)
endfunction()

# norvane_test_clock(PROGRAM... [SLEEPS_LAST]): the time of day that PROGRAM and the module in it see is the test's, and
# the module's sleeps take no time but with SLEEPS_LAST: see tests/module/support/Test_Clock.h.
function(norvane_test_clock)
  cmake_parse_arguments(CLOCK "SLEEPS_LAST" "" "" ${ARGN})
  if(NOT TARGET norvane_test_clock)
    add_library(norvane_test_clock OBJECT ${PROJECT_SOURCE_DIR}/tests/module/support/Test_Clock.cpp)
    target_include_directories(norvane_test_clock PRIVATE ${PROJECT_SOURCE_DIR})
  endif()
  foreach(program IN LISTS CLOCK_UNPARSED_ARGUMENTS)
    target_link_libraries(${program} PRIVATE norvane_test_clock)
    target_link_options(${program} PRIVATE LINKER:--export-dynamic-symbol=gettimeofday)
    if(NOT CLOCK_SLEEPS_LAST)
      target_link_options(${program} PRIVATE LINKER:--export-dynamic-symbol=select)
    endif()
  endforeach()
endfunction()

# norvane_test(NAME SOURCES... [LINK libs...] [TIMEOUT s] [MANNERS name...]): a GoogleTest program; each test runs in a
# process of its own, since much of what is tested lives once a process. Under a sanitizer, or with coverage, it may take
# five times as long.
# Its tests run once more in each of MANNERS, but for those that have a parameter (most often a manner) or start a server
# that takes its manner as an argument, and those that read the module's file. In a build with a sanitizer these runs, and
# the tests whose names begin with "Also/", have the label "all": only the test presets that go through all make them.
function(norvane_test name)
  cmake_parse_arguments(TEST "" "TIMEOUT" "SOURCES;LINK;ENVIRONMENT;MANNERS" ${ARGN})
  if(NOT TEST_TIMEOUT)
    set(TEST_TIMEOUT 60)
  endif()
  if(NORVANE_SANITIZE OR NORVANE_COVERAGE)
    math(EXPR TEST_TIMEOUT "${TEST_TIMEOUT} * 5")
  endif()
  add_executable(${name} ${TEST_SOURCES})
  if(NORVANE_COVERAGE)
    target_compile_definitions(${name} PRIVATE NORVANE_COVERAGE)
  endif()
  target_link_libraries(${name} PRIVATE ${TEST_LINK} GTest::gmock)
  if(NOT TEST_SOURCES MATCHES "\\.c(;|$)") # the headers are compiled for C++ alone
    target_precompile_headers(${name} REUSE_FROM norvane_test_headers)
  endif()
  gtest_discover_tests(${name} TEST_PREFIX "${name}." NO_PRETTY_VALUES DISCOVERY_MODE PRE_TEST TEST_FILTER "-Also/*"
    PROPERTIES TIMEOUT ${TEST_TIMEOUT} ENVIRONMENT "${TEST_ENVIRONMENT}")
  set(label "")
  if(NORVANE_SANITIZE AND TEST_MANNERS)
    set(label LABELS all)
    gtest_discover_tests(${name} TEST_PREFIX "${name}." NO_PRETTY_VALUES DISCOVERY_MODE PRE_TEST TEST_FILTER "Also/*"
      TEST_LIST "${name}_also" PROPERTIES TIMEOUT ${TEST_TIMEOUT} ${label} ENVIRONMENT "${TEST_ENVIRONMENT}")
  endif()
  foreach(manner IN LISTS TEST_MANNERS)
    gtest_discover_tests(${name} TEST_PREFIX "${name}.${manner}." NO_PRETTY_VALUES DISCOVERY_MODE PRE_TEST
      TEST_FILTER "-*/*:*Command.*:*Actions.*:Exports.*:Factories.*:Registrations.*" TEST_LIST "${name}_${manner}"
      PROPERTIES TIMEOUT ${TEST_TIMEOUT} ${label} ENVIRONMENT "NORVANE_MANNER=${manner}")
  endforeach()
endfunction()
