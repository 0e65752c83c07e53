# SPDX-License-Identifier: Apache-2.0
# Run by the build: writes the header quenx_output with the id of this build, which is that of every build of the same
# headers by the same compiler. Given: quenx_root, quenx_folders below it whose headers the libraries share, quenx_salt.
set(text "${quenx_salt}")
foreach(folder IN LISTS quenx_folders)
    file(GLOB_RECURSE headers RELATIVE "${quenx_root}" "${quenx_root}/${folder}/*.h")
    list(SORT headers)
    foreach(header IN LISTS headers)
        file(SHA256 "${quenx_root}/${header}" sum)
        string(APPEND text " ${header} ${sum}")
    endforeach()
endforeach()
string(SHA256 id "${text}")
string(SUBSTRING "${id}" 0 12 id)
file(CONFIGURE OUTPUT "${quenx_output}" @ONLY CONTENT
[[// Made by cmake/QuenxBuildId.cmake.
#pragma once

#define QUENX_BUILD_ID "@id@"
#define QUENX_BUILD_SYMBOL quenx_build_@id@
]])
