# What `cmake --install` puts where. The programs find the libraries, and the libraries each other, from where they are
# themselves, so that an installation can be staged and moved.
set(quenx_libraries Quenx_Utils Quenx_CimFramework Quenx_MidAPI Quenx_CimSchema Quenx_SoftwareInventory Quenx_SoftwareUpdate)
set_target_properties(${quenx_libraries} PROPERTIES INSTALL_RPATH "$ORIGIN")
set_target_properties(quenxctl quenx-cimd PROPERTIES INSTALL_RPATH "$ORIGIN/../lib/quenx")
install(TARGETS ${quenx_libraries} DESTINATION lib/quenx)
install(TARGETS quenxctl DESTINATION bin)
install(TARGETS quenx-cimd DESTINATION sbin)

configure_file(packaging/quenx-cimd.service.in ${CMAKE_BINARY_DIR}/quenx-cimd.service @ONLY)
install(FILES ${CMAKE_BINARY_DIR}/quenx-cimd.service DESTINATION lib/systemd/system)
install(DIRECTORY docs/ DESTINATION share/doc/quenx)
install(FILES CHANGELOG.md DESTINATION share/doc/quenx)
install(FILES packaging/adapters.toml packaging/quenx-cimd.toml DESTINATION share/doc/quenx/examples)

# PAM reads /etc alone, whatever the prefix.
if(CMAKE_INSTALL_PREFIX STREQUAL "/usr")
    install(DIRECTORY packaging/pam.d DESTINATION /etc)
else()
    install(DIRECTORY packaging/pam.d DESTINATION etc)
endif()
