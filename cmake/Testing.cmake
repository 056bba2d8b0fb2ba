# marlo_test(name SOURCES file... [LIBRARIES target...] [LABELS label...] [WHOLE] [ENVIRONMENT VAR=value...])
#
# One executable per tested unit, built with GoogleTest, every test of it known to ctest by its own name. WHOLE runs the
# executable as one test instead, for suites whose set-up is dear.
function(marlo_test name)
  cmake_parse_arguments(TEST "WHOLE" "" "SOURCES;LIBRARIES;LABELS;ENVIRONMENT" ${ARGN})
  add_executable(${name} ${TEST_SOURCES})
  target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PRIVATE ${TEST_LIBRARIES} GTest::gmock GTest::gtest GTest::gtest_main)
  # A list within a list keeps its semicolons only behind backslashes.
  string(REPLACE ";" "\\;" labels "${TEST_LABELS}")
  set(properties TIMEOUT 600 LABELS "${labels}")
  if(TEST_ENVIRONMENT)
    list(APPEND properties ENVIRONMENT "${TEST_ENVIRONMENT}")
  endif()
  if(TEST_WHOLE)
    add_test(NAME ${name} COMMAND ${name})
    set_tests_properties(${name} PROPERTIES ${properties})
  else()
    gtest_discover_tests(${name} TEST_PREFIX "${name}." DISCOVERY_TIMEOUT 120 PROPERTIES ${properties})
  endif()
endfunction()
