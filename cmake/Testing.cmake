# st_add_test_program(NAME SOURCES... [LIBRARIES ...]): one GoogleTest program for a folder, one CTest entry for each case.
# Under Wine every entry needs the primed session of tools/wine_session.sh (fixture `wine`): without it a crashed test
# can look like a pass.
include(GoogleTest)

if(CMAKE_CROSSCOMPILING)
  set(ST_WINE_SESSION ${PROJECT_SOURCE_DIR}/tools/wine_session.sh)
  add_test(NAME wine_up COMMAND ${ST_WINE_SESSION} up)
  add_test(NAME wine_down COMMAND ${ST_WINE_SESSION} down)
  set_tests_properties(wine_up PROPERTIES FIXTURES_SETUP wine TIMEOUT 120)
  set_tests_properties(wine_down PROPERTIES FIXTURES_CLEANUP wine TIMEOUT 60)
endif()

function(st_add_test_program name)
  cmake_parse_arguments(ARG "" "" "SOURCES;LIBRARIES" ${ARGN})
  add_executable(${name} ${ARG_SOURCES})
  target_link_libraries(${name} PRIVATE st_options ${ARG_LIBRARIES} GTest::gmock GTest::gtest_main)
  # What is tested is optimised as it ships; the tests themselves compile in half the time without, and with no more
  # for the debugger than their lines.
  if(NOT MSVC)
    target_compile_options(${name} PRIVATE -O0 -g1)
  endif()
  set(fixture "")
  if(CMAKE_CROSSCOMPILING)
    set(fixture FIXTURES_REQUIRED wine)
  endif()
  gtest_discover_tests(${name} DISCOVERY_MODE PRE_TEST DISCOVERY_TIMEOUT 120
    PROPERTIES TIMEOUT 120 ${fixture})
endfunction()
