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

# mu_test(<name> SOURCES <file>... [LINK <target>...] [SLOW <pattern>...]): one test program whose tests ctest runs one
# by one. Those that a pattern of SLOW names, as --gtest_filter takes it, have the label `slow`, all others `single`.
# Under the sanitizers a process takes longer to start than most tests to run: there each program runs in a few shards.
#
# `ctest --preset quick` leaves out both labels. In their place it runs what is not slow of each program in one process,
# for here too most of the time goes into starting processes.
function(mu_test name)
    cmake_parse_arguments(TEST "" "" "SOURCES;LINK;SLOW" ${ARGN})
    add_executable(${name} ${TEST_SOURCES})
    target_link_libraries(${name} PRIVATE mu_test_support ${TEST_LINK} GTest::gmock_main mu_warnings)
    mu_test_options(${name})
    target_precompile_headers(${name} REUSE_FROM mu_test_headers)
    if(MU_COMMON_SANITIZE)
        mu_test_in_shards(${name} 4)
        return()
    endif()
    list(JOIN TEST_SLOW ":" slow)
    mu_test_one_by_one(${name} "-${slow}" 120 single)
    if(slow)
        mu_test_one_by_one(${name} "${slow}" 300 slow)
    endif()
    if(NOT slow STREQUAL "*")
        add_test(NAME quick.${name} CONFIGURATIONS quick COMMAND ${name} --gtest_brief=1 "--gtest_filter=-${slow}")
        set_tests_properties(quick.${name} PROPERTIES TIMEOUT 120)
    endif()
endfunction()

function(mu_test_one_by_one name filter timeout label)
    gtest_discover_tests(${name}
        TEST_FILTER "${filter}"
        DISCOVERY_MODE PRE_TEST
        NO_PRETTY_VALUES
        PROPERTIES TIMEOUT ${timeout} LABELS ${label})
endfunction()

function(mu_test_in_shards name shards)
    math(EXPR last "${shards} - 1")
    foreach(shard RANGE ${last})
        add_test(NAME ${name}.${shard} COMMAND ${name} --gtest_brief=1)
        set_tests_properties(${name}.${shard} PROPERTIES
            TIMEOUT 600
            ENVIRONMENT "GTEST_TOTAL_SHARDS=${shards};GTEST_SHARD_INDEX=${shard}")
    endforeach()
endfunction()
