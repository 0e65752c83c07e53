# SPDX-License-Identifier: Apache-2.0
# With ccache on the machine, nothing is compiled twice: not after a clean, not when a branch changes back and, with g++,
# not in another checkout. -DQUENX_CCACHE=OFF turns it off; a launcher that the caller sets is left alone.
option(QUENX_CCACHE "Compile through ccache where it is installed" ON)

find_program(QUENX_CCACHE_PROGRAM ccache)
mark_as_advanced(QUENX_CCACHE_PROGRAM)
if(QUENX_CCACHE AND QUENX_CCACHE_PROGRAM AND NOT CMAKE_CXX_COMPILER_LAUNCHER)
    # ccache refuses to cache whatever uses precompiled headers until it is told that macros defined later and the times
    # of files do not matter. Here they do not: the headers are the standard library's, and no source asks for the time.
    # Nor does the language of warnings, so that a script and a terminal share results.
    # The base folder makes paths relative, so that checkouts share results.
    set(CMAKE_CXX_COMPILER_LAUNCHER
        env CCACHE_SLOPPINESS=pch_defines,time_macros,include_file_mtime,include_file_ctime,locale
        CCACHE_BASEDIR=${PROJECT_SOURCE_DIR} CCACHE_NOHASHDIR=1 ${QUENX_CCACHE_PROGRAM})
endif()
