# What "cmake --install" puts where.
file(RELATIVE_PATH libraries_from_programs ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set_target_properties(vmqd PROPERTIES INSTALL_RPATH "$ORIGIN/${libraries_from_programs}")
set_target_properties(vmq PROPERTIES INSTALL_RPATH "$ORIGIN")

install(TARGETS vmqd vmqctl RUNTIME)
install(TARGETS vmq vmqhost LIBRARY)
install(FILES packaging/vmqd.conf.example docs/api.yaml docs/file-transfer.md docs/vmqd.md DESTINATION ${CMAKE_INSTALL_DOCDIR})

# The unit names the program by its path.
configure_file(packaging/vmqd.service ${PROJECT_BINARY_DIR}/packaging/vmqd.service @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/packaging/vmqd.service DESTINATION lib/systemd/system)
