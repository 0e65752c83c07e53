# SPDX-License-Identifier: Apache-2.0
# An editor's language server looks for compile_commands.json at the top: that of the build configured last, but for those
# whose flags would only be in its way.
set(quenx_commands ${PROJECT_SOURCE_DIR}/compile_commands.json)
if(NOT QUENX_X86_32 AND NOT QUENX_SANITIZE AND NOT QUENX_COVERAGE AND (IS_SYMLINK ${quenx_commands} OR NOT EXISTS ${quenx_commands}))
    # Relative, so that the folder can be moved. A source tree that is read-only has none.
    file(RELATIVE_PATH quenx_commands_built ${PROJECT_SOURCE_DIR} ${CMAKE_BINARY_DIR}/compile_commands.json)
    file(CREATE_LINK ${quenx_commands_built} ${quenx_commands} RESULT quenx_ignored SYMBOLIC)
endif()
