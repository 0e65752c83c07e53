# SPDX-License-Identifier: Apache-2.0
# GoogleTest from Debian's package; its 32-bit form is built from the sources that the package carries.
include(GoogleTest)
if(QUENX_X86_32)
    set(INSTALL_GTEST OFF)
    add_subdirectory(/usr/src/googletest ${CMAKE_BINARY_DIR}/googletest EXCLUDE_FROM_ALL)
    foreach(target gtest gtest_main gmock gmock_main)
        target_compile_options(${target} PUBLIC -m32)
        target_link_options(${target} PUBLIC -m32)
    endforeach()
else()
    find_package(GTest REQUIRED)
endif()

if(QUENX_PRECOMPILE)
    quenx_precompiled(quenx_precompiled_test ${quenx_standard_headers} <gtest/gtest.h>)
    target_link_libraries(quenx_precompiled_test PRIVATE GTest::gtest)
    target_compile_options(quenx_precompiled_test PRIVATE -O0)
endif()

# quenx_test_settings(TARGET): what test programs and the libraries that they share are built with
function(quenx_test_settings target)
    # What is tested is optimised; the tests themselves need not be, and compile in half the time.
    target_compile_options(${target} PRIVATE -O0)
    quenx_precompile(${target} test)
endfunction()

# quenx_test(NAME SOURCES... [LINK targets...]): one test program; each of its tests is a CTest test
function(quenx_test name)
    cmake_parse_arguments(ARG "" "" "LINK" ${ARGN})
    add_executable(${name} ${ARG_UNPARSED_ARGUMENTS})
    # The test support's syslog must be found by libraries that are loaded later, too.
    set_target_properties(${name} PROPERTIES ENABLE_EXPORTS ON)
    target_link_libraries(${name} PRIVATE quenx_settings QuenxTestSupport ${ARG_LINK})
    target_include_directories(${name} PRIVATE ${PROJECT_SOURCE_DIR}/tests)
    quenx_test_settings(${name})
    gtest_discover_tests(${name} DISCOVERY_TIMEOUT 60 PROPERTIES TIMEOUT 120)
endfunction()

# quenx_fips_test(PROGRAM FILTER): some of its tests once more, as one CTest test, in the FIPS mode of GnuTLS
function(quenx_fips_test program filter)
    # The mode is chosen while the library loads, so a test cannot enter it.
    add_test(NAME ${program}.WorksInFipsMode COMMAND FipsMode $<TARGET_FILE:${program}> --gtest_filter=${filter})
    set_tests_properties(${program}.WorksInFipsMode PROPERTIES ENVIRONMENT "GNUTLS_FORCE_FIPS_MODE=1" TIMEOUT 120)
endfunction()

# quenx_replaces_allocation(TARGET): a program with an operator new of its own
function(quenx_replaces_allocation target)
    # Clang's thread sanitizer links an operator new into what it takes for C++, and then there are two.
    if(QUENX_SANITIZE STREQUAL "thread" AND CMAKE_CXX_COMPILER_ID STREQUAL "Clang")
        target_link_options(${target} PRIVATE --driver-mode=gcc)
        target_link_libraries(${target} PRIVATE stdc++ m)
    endif()
endfunction()
