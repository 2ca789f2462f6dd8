# What "cmake --install" puts where.
file(RELATIVE_PATH libraries_from_programs ${CMAKE_INSTALL_FULL_BINDIR} ${CMAKE_INSTALL_FULL_LIBDIR})
set_target_properties(vmqd PROPERTIES INSTALL_RPATH "$ORIGIN/${libraries_from_programs}")
set_target_properties(vmq PROPERTIES INSTALL_RPATH "$ORIGIN")

install(TARGETS vmqd vmqctl RUNTIME)
install(TARGETS vmq vmqhost LIBRARY)

# The unit names the program by its path.
configure_file(packaging/vmqd.service ${PROJECT_BINARY_DIR}/packaging/vmqd.service @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/packaging/vmqd.service DESTINATION lib/systemd/system)

# In the folders in which they are here, so that the links between them lead somewhere.
install(FILES SECURITY.md DESTINATION ${CMAKE_INSTALL_DOCDIR})
install(FILES docs/api.yaml docs/file-transfer.md docs/messages.md docs/trace.md docs/vmqctl.md docs/vmqd.md
  DESTINATION ${CMAKE_INSTALL_DOCDIR}/docs)
install(FILES packaging/vmqd.conf.example ${PROJECT_BINARY_DIR}/packaging/vmqd.service
  DESTINATION ${CMAKE_INSTALL_DOCDIR}/packaging)
