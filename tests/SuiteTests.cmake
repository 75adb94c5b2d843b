# Read by ctest: registers one test per test suite of a test program, run as
# one process with a filter. A process per test case cost more than the tests
# themselves (the toolkit and, under the sanitizers, their runtime start each
# time); a suite is small enough to point at a failure and to spread the run
# over the processors.
#
# Set by the including file: SUITE_PROGRAM, SUITE_ENVIRONMENT, SUITE_TIMEOUT.
if(NOT EXISTS "${SUITE_PROGRAM}")
    get_filename_component(missing "${SUITE_PROGRAM}" NAME)
    add_test(${missing}_NOT_BUILT "${missing}_NOT_BUILT")
    return()
endif()

execute_process(COMMAND "${SUITE_CMAKE}" -E env ${SUITE_ENVIRONMENT} "${SUITE_PROGRAM}" --gtest_list_tests
    OUTPUT_VARIABLE listing ERROR_VARIABLE listing_errors RESULT_VARIABLE listed)
if(NOT listed EQUAL 0)
    message(FATAL_ERROR "${SUITE_PROGRAM} could not list its tests (${listed}):\n${listing_errors}")
endif()

string(REPLACE "\n" ";" lines "${listing}")
foreach(line IN LISTS lines)
    # Suites start in the first column ("Suite." or "Prefix/Suite.  # TypeParam = ..."),
    # their cases are indented.
    if(line MATCHES "^([^ #][^ ]*)\\.")
        set(suite "${CMAKE_MATCH_1}")
        add_test("${suite}" "${SUITE_PROGRAM}" "--gtest_filter=${suite}.*")
        set_tests_properties("${suite}" PROPERTIES
            ENVIRONMENT "${SUITE_ENVIRONMENT}" TIMEOUT ${SUITE_TIMEOUT})
    endif()
endforeach()
