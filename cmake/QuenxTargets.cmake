# SPDX-License-Identifier: Apache-2.0
# One place for the compiler's settings: every target of the project links quenx_settings.

find_package(Threads REQUIRED)

# A compiler cache may hand over paths relative to the build folder.
file(RELATIVE_PATH quenx_source_from_build ${CMAKE_BINARY_DIR} ${PROJECT_SOURCE_DIR})

add_library(quenx_settings INTERFACE)
target_include_directories(quenx_settings INTERFACE ${PROJECT_SOURCE_DIR}/src)
target_link_libraries(quenx_settings INTERFACE Threads::Threads)
target_compile_options(quenx_settings INTERFACE
    -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wsign-conversion -Wnon-virtual-dtor -Wold-style-cast
    -Wcast-align -Woverloaded-virtual -Wformat=2 -Werror
    -fvisibility=hidden -fvisibility-inlines-hidden -fno-omit-frame-pointer
    # Source paths appear in log lines and assertion texts: keep them relative to the project.
    -ffile-prefix-map=${PROJECT_SOURCE_DIR}/= -ffile-prefix-map=${quenx_source_from_build}=)

if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    # Unique symbols pin a library: dlclose would never unload it.
    target_compile_options(quenx_settings INTERFACE
        -fno-gnu-unique
        -Wno-error=stringop-overflow  # false finding of g++ 12 on an atomic pointer store
        -Wno-error=maybe-uninitialized -Wno-error=restrict)
else()
    target_compile_options(quenx_settings INTERFACE -Wthread-safety -Wno-unknown-warning-option)
endif()

if(QUENX_X86_32)
    target_compile_options(quenx_settings INTERFACE -m32 -msse2 -mfpmath=sse)
    target_link_options(quenx_settings INTERFACE -m32)
    target_compile_definitions(quenx_settings INTERFACE _TIME_BITS=64 _FILE_OFFSET_BITS=64)
endif()

if(QUENX_SANITIZE)
    target_compile_options(quenx_settings INTERFACE -fsanitize=${QUENX_SANITIZE} -fno-sanitize-recover=all)
    target_link_options(quenx_settings INTERFACE -fsanitize=${QUENX_SANITIZE})
    # Keeps a provider mapped after dlclose, so that a leak report names its file and line.
    target_compile_definitions(quenx_settings INTERFACE QUENX_SANITIZED=1)
endif()
if(QUENX_FUZZ)
    target_compile_options(quenx_settings INTERFACE -fsanitize=fuzzer-no-link)
endif()
if(QUENX_COVERAGE)
    # Counters that threads share go wrong otherwise, below zero even, which gcovr refuses.
    target_compile_options(quenx_settings INTERFACE --coverage -fprofile-update=atomic)
    target_link_options(quenx_settings INTERFACE --coverage)
endif()

include(cmake/QuenxPrecompiled.cmake)
if(QUENX_PRECOMPILE)
    target_link_libraries(quenx_settings INTERFACE quenx_precompiled_settings)
endif()

# Libraries of different builds do not load each other, see SameBuild.cpp.
set(quenx_build_id ${CMAKE_BINARY_DIR}/generated/BuildId.h)
set(quenx_build_folders src/Utils src/Framework src/MidAPI src/Providers)
set(quenx_build_salt "${PROJECT_VERSION} ${CMAKE_CXX_COMPILER_ID} ${CMAKE_CXX_COMPILER_VERSION} ${QUENX_SANITIZE}")
set(quenx_build_headers)
foreach(folder IN LISTS quenx_build_folders)
    file(GLOB_RECURSE headers ${PROJECT_SOURCE_DIR}/${folder}/*.h)
    list(APPEND quenx_build_headers ${headers})
endforeach()
add_custom_command(OUTPUT ${quenx_build_id}
    COMMAND ${CMAKE_COMMAND} -D quenx_root=${PROJECT_SOURCE_DIR} -D "quenx_folders=${quenx_build_folders}"
        -D "quenx_salt=${quenx_build_salt}" -D quenx_output=${quenx_build_id}
        -P ${PROJECT_SOURCE_DIR}/cmake/QuenxBuildId.cmake
    DEPENDS ${quenx_build_headers} ${PROJECT_SOURCE_DIR}/cmake/QuenxBuildId.cmake
    VERBATIM)
add_library(quenx_same_build OBJECT ${PROJECT_SOURCE_DIR}/cmake/SameBuild.cpp ${quenx_build_id})
target_include_directories(quenx_same_build PUBLIC ${CMAKE_BINARY_DIR}/generated)
target_link_libraries(quenx_same_build PRIVATE quenx_settings)
set_target_properties(quenx_same_build PROPERTIES POSITION_INDEPENDENT_CODE ON)

# quenx_library(NAME SOURCES... [ANY_BUILD] [LINK targets...]): a shared library libNAME.so; with ANY_BUILD it is loaded
# whatever it finds below, and looks at the build itself
function(quenx_library name)
    cmake_parse_arguments(ARG "ANY_BUILD" "" "LINK" ${ARGN})
    add_library(${name} SHARED ${ARG_UNPARSED_ARGUMENTS})
    target_link_libraries(${name} PUBLIC quenx_settings ${ARG_LINK})
    quenx_precompile(${name} library)
    if(TARGET Quenx_Utils AND NOT name STREQUAL Quenx_Utils AND NOT ARG_ANY_BUILD)  # in the order of src/CMakeLists.txt
        target_sources(${name} PRIVATE $<TARGET_OBJECTS:quenx_same_build>)
    endif()
    target_link_options(${name} PRIVATE -Wl,--no-undefined-version -Wl,-z,relro,-z,now)
    # What a library lacks fails here, not when a host loads it. Clang puts the sanitizers' runtime into programs alone.
    if(NOT QUENX_SANITIZE)
        target_link_options(${name} PRIVATE -Wl,-z,defs)
    endif()
endfunction()

# quenx_export_only(NAME SCRIPT): a library that exports what the version script names, and no template instance besides
function(quenx_export_only name script)
    target_link_options(${name} PRIVATE -Wl,--version-script=${script})
    set_target_properties(${name} PROPERTIES LINK_DEPENDS ${script})
endfunction()

# quenx_provider(NAME SOURCES... [LINK targets...]): a library that a host loads, and that exports nothing. What it
# exported would be bound to by whatever is loaded after it, the framework included, and would keep it mapped after
# dlclose. The libraries below share their singletons and type information, so they keep their exports.
function(quenx_provider name)
    quenx_library(${name} ${ARGN})
    quenx_export_only(${name} ${PROJECT_SOURCE_DIR}/cmake/ExportsNothing.map)
endfunction()
