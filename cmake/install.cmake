# What `cmake --install` installs, in two components: the programs, and what developers of installers need.
install(TARGETS kz7InstallReg kz7admin RUNTIME COMPONENT kz7install)
install(DIRECTORY docs/ DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT kz7install
  FILES_MATCHING PATTERN *.md PATTERN *.json PATTERN *.png PATTERN man EXCLUDE)
install(FILES README.md CHANGELOG.md DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT kz7install)

install(TARGETS kz7runtime EXPORT kz7Targets COMPONENT kz7install-dev FILE_SET HEADERS COMPONENT kz7install-dev)
install(EXPORT kz7Targets NAMESPACE kz7:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kz7 COMPONENT kz7install-dev)
include(CMakePackageConfigHelpers)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/kz7ConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES cmake/kz7Config.cmake ${PROJECT_BINARY_DIR}/kz7ConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kz7 COMPONENT kz7install-dev)
install(DIRECTORY examples/consumer examples/installer DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT kz7install-dev)

if(WIN32)
  set(system_libraries "-lmsi -lntdll -lole32 -luuid")
  install(TARGETS kz7actions64 RUNTIME COMPONENT kz7install ARCHIVE COMPONENT kz7install-dev)
else()
  set(system_libraries "-pthread -ldl -lm")
endif()
configure_file(cmake/kz7.pc.in kz7.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/kz7.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT kz7install-dev)
