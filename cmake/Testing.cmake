# marlo_test(name SOURCES file... [LIBRARIES target...] [LABELS label...] [WHOLE] [ENVIRONMENT VAR=value...])
#
# One executable per tested unit, built with GoogleTest, every test of it known to ctest by its own name. WHOLE runs the
# executable as one test instead, for suites whose set-up is dear.
function(marlo_test name)
  cmake_parse_arguments(TEST "WHOLE" "" "SOURCES;LIBRARIES;LABELS;ENVIRONMENT" ${ARGN})
  add_executable(${name} ${TEST_SOURCES})
  target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR})
  target_link_libraries(${name} PRIVATE ${TEST_LIBRARIES} GTest::gmock GTest::gtest GTest::gtest_main)
  if(TEST_WHOLE)
    add_test(NAME ${name} COMMAND ${name})
    set_tests_properties(${name} PROPERTIES TIMEOUT 600 LABELS "${TEST_LABELS}" ENVIRONMENT "${TEST_ENVIRONMENT}")
    return()
  endif()
  # The properties of discovered tests lose lists within them, so ctest reads these from a file of their own.
  gtest_discover_tests(${name} TEST_PREFIX "${name}." DISCOVERY_TIMEOUT 120 TEST_LIST ${name}_tests)
  set(file "${CMAKE_CURRENT_BINARY_DIR}/${name}_properties.cmake")
  file(CONFIGURE OUTPUT "${file}" @ONLY CONTENT [[
if(@name@_tests)
  set_tests_properties(${@name@_tests} PROPERTIES
    TIMEOUT 600 LABELS "@TEST_LABELS@" ENVIRONMENT "@TEST_ENVIRONMENT@")
endif()
]])
  set_property(DIRECTORY APPEND PROPERTY TEST_INCLUDE_FILES "${file}")
endfunction()
