# SPDX-License-Identifier: Apache-2.0
# Run by `cmake --install` for files that are an administrator's once they are there. Installs those of
# quenx_configuration_files, in quenx_configuration_source, below quenx_sysconfdir where there are none yet.
if(NOT IS_ABSOLUTE "${quenx_sysconfdir}")
    # The prefix may have been chosen just now. That of a distribution's packages goes with /etc.
    if(CMAKE_INSTALL_PREFIX MATCHES "^/usr/?$")
        set(quenx_sysconfdir "/${quenx_sysconfdir}")
    else()
        set(quenx_sysconfdir "${CMAKE_INSTALL_PREFIX}/${quenx_sysconfdir}")
    endif()
endif()

# What is configured stays when the manifest's files are removed.
set(quenx_manifest "${CMAKE_INSTALL_MANIFEST_FILES}")
foreach(file IN LISTS quenx_configuration_files)
    set(target "${quenx_sysconfdir}/${file}")
    if(EXISTS "$ENV{DESTDIR}${target}" OR IS_SYMLINK "$ENV{DESTDIR}${target}")
        message(STATUS "Kept: $ENV{DESTDIR}${target}")
    else()
        get_filename_component(folder "${target}" DIRECTORY)
        file(INSTALL "${quenx_configuration_source}/${file}" DESTINATION "${folder}")
    endif()
endforeach()
set(CMAKE_INSTALL_MANIFEST_FILES "${quenx_manifest}")
