# SPDX-License-Identifier: Apache-2.0
# What `cmake --install` puts where. The programs find the libraries, and the libraries each other, from where they are
# themselves, so that an installation can be staged and moved.
set(CMAKE_INSTALL_DEFAULT_DIRECTORY_PERMISSIONS  # whatever the mask of whoever installs
    OWNER_READ OWNER_WRITE OWNER_EXECUTE GROUP_READ GROUP_EXECUTE WORLD_READ WORLD_EXECUTE)
set(QUENX_INSTALL_LIBDIR lib CACHE STRING "Where libraries are installed, relative to the prefix")
set(quenx_libraries Quenx_FileReader Quenx_Utils Quenx_CimFramework Quenx_MidAPI Quenx_CimSchema Quenx_SoftwareInventory Quenx_SoftwareUpdate)
set_target_properties(${quenx_libraries} PROPERTIES INSTALL_RPATH "$ORIGIN")
set_target_properties(quenxctl quenx-cimd PROPERTIES INSTALL_RPATH "$ORIGIN/../${QUENX_INSTALL_LIBDIR}/quenx")
install(TARGETS ${quenx_libraries} DESTINATION ${QUENX_INSTALL_LIBDIR}/quenx)
# Where object managers look for providers.
set_target_properties(Quenx_Cmpi PROPERTIES INSTALL_RPATH "$ORIGIN/../quenx")
install(TARGETS Quenx_Cmpi DESTINATION ${QUENX_INSTALL_LIBDIR}/cmpi)
if(NOT QUENX_X86_32)
    set_target_properties(Quenx_History Quenx_Trust PROPERTIES INSTALL_RPATH "$ORIGIN/..")
    install(TARGETS Quenx_History DESTINATION ${QUENX_INSTALL_LIBDIR}/quenx/history)
    install(TARGETS Quenx_Trust DESTINATION ${QUENX_INSTALL_LIBDIR}/quenx/trust)
endif()
install(TARGETS quenxctl DESTINATION bin)
install(TARGETS quenx-cimd DESTINATION sbin)
# To build no more than this.
add_custom_target(quenx_installed)
add_dependencies(quenx_installed ${quenx_libraries} Quenx_Cmpi Quenx_History Quenx_Trust quenxctl quenx-cimd)

configure_file(packaging/quenx-cimd.service.in ${CMAKE_BINARY_DIR}/quenx-cimd.service @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/quenx-cimd.service DESTINATION lib/systemd/system)
install(FILES packaging/tmpfiles.d/quenx.conf DESTINATION lib/tmpfiles.d)
install(FILES packaging/sysusers.d/quenx.conf DESTINATION lib/sysusers.d)
install(FILES packaging/completions/quenxctl.bash DESTINATION share/bash-completion/completions RENAME quenxctl)
install(FILES packaging/completions/_quenxctl DESTINATION share/zsh/vendor-completions)
install(FILES packaging/completions/quenxctl.fish DESTINATION share/fish/vendor_completions.d)
install(DIRECTORY docs/ DESTINATION share/doc/quenx)
install(FILES CHANGELOG.md LICENSE DESTINATION share/doc/quenx)
install(DIRECTORY ansible/ DESTINATION share/ansible/collections/ansible_collections/quenx/adapters)
install(FILES packaging/adapters.toml packaging/devlink.toml packaging/policy.toml packaging/quenx-cimd.toml
    packaging/quenx-cimprovider.conf
    DESTINATION share/doc/quenx/examples)

# Configuration goes below the prefix, for /usr to /etc. With another prefix PAM still reads /etc alone: set this to it.
set(CMAKE_INSTALL_SYSCONFDIR etc CACHE PATH "Where configuration is installed, relative to the prefix or absolute")
install(DIRECTORY packaging/pam.d DESTINATION share/doc/quenx/examples)
install(CODE "set(quenx_sysconfdir \"${CMAKE_INSTALL_SYSCONFDIR}\")
set(quenx_configuration_source \"${PROJECT_SOURCE_DIR}/packaging\")
set(quenx_configuration_files pam.d/quenx-cimd quenx-cimprovider.conf)
include(\"${PROJECT_SOURCE_DIR}/cmake/QuenxInstallConfiguration.cmake\")")
