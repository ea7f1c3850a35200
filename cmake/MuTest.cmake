include(GoogleTest)

# mu_test(<name> SOURCES <file>... [LINK <target>...]): one test program whose tests ctest runs one by one.
function(mu_test name)
    cmake_parse_arguments(TEST "" "" "SOURCES;LINK" ${ARGN})
    add_executable(${name} ${TEST_SOURCES})
    # The code under test is optimised; optimising the tests takes longer than running them.
    if(MU_COMMON_SANITIZE)
        target_compile_options(${name} PRIVATE -O0)
    else()
        target_compile_options(${name} PRIVATE -O1)
    endif()
    target_link_libraries(${name} PRIVATE mu_test_support ${TEST_LINK} GTest::gmock_main mu_warnings)
    gtest_discover_tests(${name} DISCOVERY_MODE PRE_TEST NO_PRETTY_VALUES PROPERTIES TIMEOUT 120)
endfunction()
