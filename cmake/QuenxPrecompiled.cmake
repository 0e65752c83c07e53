# SPDX-License-Identifier: Apache-2.0
# Parsing the standard library and GoogleTest is most of the work of compiling this project's small files. With
# QUENX_PRECOMPILE it is done once for all targets of a kind; the presets without it show a missing #include.
option(QUENX_PRECOMPILE "Use precompiled headers" OFF)

set(quenx_standard_headers
    <algorithm> <array> <atomic> <chrono> <cstdint> <functional> <map> <memory> <mutex> <optional> <set> <span>
    <string> <string_view> <utility> <variant> <vector>)

# quenx_precompiled(NAME HEADERS...): a target whose precompiled headers others reuse
function(quenx_precompiled name)
    add_library(${name} OBJECT ${PROJECT_SOURCE_DIR}/cmake/Precompiled.cpp)
    target_link_libraries(${name} PRIVATE quenx_settings)
    target_precompile_headers(${name} PRIVATE ${ARGN})
endfunction()

# What a compiler cache needs to know such headers again: the preprocessor's output naming them, no time in the file.
add_library(quenx_precompiled_settings INTERFACE)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
    target_compile_options(quenx_precompiled_settings INTERFACE -fpch-preprocess)
else()
    target_compile_options(quenx_precompiled_settings INTERFACE "SHELL:-Xclang -fno-pch-timestamp")
endif()

if(QUENX_PRECOMPILE)
    quenx_precompiled(quenx_precompiled_library ${quenx_standard_headers})
    set_target_properties(quenx_precompiled_library PROPERTIES POSITION_INDEPENDENT_CODE ON)
    quenx_precompiled(quenx_precompiled_program ${quenx_standard_headers})
endif()

# quenx_precompile(TARGET KIND): reuses the headers of library, program or test
function(quenx_precompile target kind)
    if(QUENX_PRECOMPILE)
        target_precompile_headers(${target} REUSE_FROM quenx_precompiled_${kind})
    endif()
endfunction()
