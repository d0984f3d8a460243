# Read by ctest. grouped_tests(PROGRAM WORD [property value]…): one test for all tests of the program
# whose names are the same up to the last of this word, as each process has much to prepare. It is
# skipped when all of them are. These are the longest tests, so ctest starts them first: no processor
# waits for the last one.
cmake_minimum_required(VERSION 3.25)

function(grouped_tests program word)
  execute_process(COMMAND "${program}" --gtest_list_tests OUTPUT_VARIABLE listed
                  RESULT_VARIABLE result)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "${program} does not list its tests: ${result}")
  endif()
  string(REGEX REPLACE " +#[^\n]*" "" listed "${listed}")
  string(REGEX MATCHALL "[^\n]+" lines "${listed}")
  set(filters)
  foreach(line IN LISTS lines)
    if(NOT line MATCHES "^  (.*)")
      set(suite "${line}")
      continue()
    endif()
    set(filter "${suite}${CMAKE_MATCH_1}")
    if(filter MATCHES "^(.*${word})")
      set(filter "${CMAKE_MATCH_1}*")
    endif()
    if(filter IN_LIST filters)
      continue()
    endif()
    list(APPEND filters "${filter}")
    string(REGEX REPLACE "/?${word}[*]$" "" name "${filter}")
    add_test("${name}" "${program}" "--gtest_filter=${filter}")
    set_tests_properties("${name}" PROPERTIES COST 10
      SKIP_REGULAR_EXPRESSION "PASSED  . 0 tests\\.\n(.  SKIPPED .[^\n]*\n)+\n*$" ${ARGN})
  endforeach()
endfunction()
