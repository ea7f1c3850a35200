include(GoogleTest)

# The code under test is optimised, and checked by the sanitizers; to do so with the tests takes longer than to run them.
function(mu_test_options target)
    target_compile_options(${target} PRIVATE -O0)
    if(MU_COMMON_SANITIZE)
        target_compile_options(${target} PRIVATE -g0 -fno-sanitize=all)
        target_compile_definitions(${target} PRIVATE MU_SANITIZED)
    endif()
endfunction()

# Most of the time to compile a test goes into the headers of GoogleTest: they are compiled once, for all programs.
file(WRITE "${PROJECT_BINARY_DIR}/mu_test_headers.cpp" "")
add_library(mu_test_headers OBJECT "${PROJECT_BINARY_DIR}/mu_test_headers.cpp")
target_link_libraries(mu_test_headers PRIVATE GTest::gmock_main mu_warnings)
target_precompile_headers(mu_test_headers PRIVATE <gmock/gmock.h> <gtest/gtest.h> <string> <vector>)
mu_test_options(mu_test_headers)

# mu_test(<name> SOURCES <file>... [LINK <target>...] [SLOW <pattern>...] [STARTS_PROGRAMS]): one test program. ctest
# runs what a pattern of SLOW names, as --gtest_filter takes it, test by test with the label `slow`, and all other tests
# in one process: to start a process takes longer than most tests.
#
# Under the sanitizers a program runs in shards, so that two cores are busy to the end. Of a program that is slow as a
# whole all shards but the first have the label: without them every eighth test is still checked. STARTS_PROGRAMS says
# that most tests run tav, which takes ten times as long to start then: all shards but the first have the label.
function(mu_test name)
    cmake_parse_arguments(TEST "STARTS_PROGRAMS" "" "SOURCES;LINK;SLOW" ${ARGN})
    add_executable(${name} ${TEST_SOURCES})
    target_link_libraries(${name} PRIVATE mu_test_support ${TEST_LINK} GTest::gmock_main mu_warnings)
    mu_test_options(${name})
    target_precompile_headers(${name} REUSE_FROM mu_test_headers)
    list(JOIN TEST_SLOW ":" slow)
    if(MU_COMMON_SANITIZE)
        mu_test_in_shards(${name} "${slow}" ${TEST_STARTS_PROGRAMS})
        return()
    endif()
    if(NOT slow STREQUAL "*")
        add_test(NAME ${name} COMMAND ${name} --gtest_brief=1 "--gtest_filter=-${slow}")
        set_tests_properties(${name} PROPERTIES TIMEOUT 300)
    endif()
    if(slow)
        gtest_discover_tests(${name}
            TEST_FILTER "${slow}"
            DISCOVERY_MODE PRE_TEST
            NO_PRETTY_VALUES
            PROPERTIES TIMEOUT 300 LABELS slow)
    endif()
endfunction()

function(mu_test_in_shards name slow starts_programs)
    set(shards 4)
    set(checked 4)
    if(slow STREQUAL "*")
        set(shards 8)
    endif()
    if(slow STREQUAL "*" OR starts_programs)
        set(checked 1)
    endif()
    math(EXPR last "${shards} - 1")
    foreach(shard RANGE ${last})
        add_test(NAME ${name}.${shard} COMMAND ${name} --gtest_brief=1)
        set_tests_properties(${name}.${shard} PROPERTIES
            TIMEOUT 600
            ENVIRONMENT "GTEST_TOTAL_SHARDS=${shards};GTEST_SHARD_INDEX=${shard}")
        if(NOT shard LESS checked)
            set_tests_properties(${name}.${shard} PROPERTIES LABELS slow)
        endif()
    endforeach()
endfunction()
