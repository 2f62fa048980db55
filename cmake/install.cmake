# What `cmake --install` installs, in two components: the programs, and what developers of installers need.
install(TARGETS kz7InstallReg kz7admin RUNTIME COMPONENT kz7install)
install(DIRECTORY docs DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT kz7install
  FILES_MATCHING PATTERN *.md PATTERN *.json PATTERN *.png PATTERN man EXCLUDE)
install(DIRECTORY examples/fleet DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples COMPONENT kz7install USE_SOURCE_PERMISSIONS)
install(FILES CHANGELOG.md DESTINATION ${CMAKE_INSTALL_DOCDIR} COMPONENT kz7install)

install(TARGETS kz7runtime EXPORT kz7Targets COMPONENT kz7install-dev FILE_SET HEADERS COMPONENT kz7install-dev)
install(EXPORT kz7Targets NAMESPACE kz7:: DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kz7 COMPONENT kz7install-dev)
include(CMakePackageConfigHelpers)
write_basic_package_version_file(${PROJECT_BINARY_DIR}/kz7ConfigVersion.cmake COMPATIBILITY SameMajorVersion)
install(FILES cmake/kz7Config.cmake ${PROJECT_BINARY_DIR}/kz7ConfigVersion.cmake
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/cmake/kz7 COMPONENT kz7install-dev)
install(DIRECTORY examples/consumer examples/installer examples/package DESTINATION ${CMAKE_INSTALL_DOCDIR}/examples
  COMPONENT kz7install-dev USE_SOURCE_PERMISSIONS)

foreach(section 1 5 7)
  file(GLOB pages CONFIGURE_DEPENDS docs/man/*.${section})
  install(FILES ${pages} DESTINATION ${CMAKE_INSTALL_MANDIR}/man${section} COMPONENT kz7install)
endforeach()
if(NOT WIN32)
  foreach(shell bash zsh)
    set(completions ${PROJECT_BINARY_DIR}/completions/${shell})
    add_custom_command(OUTPUT ${completions} DEPENDS kz7admin VERBATIM COMMAND kz7admin completion ${shell} > ${completions})
    list(APPEND all_completions ${completions})
  endforeach()
  file(MAKE_DIRECTORY ${PROJECT_BINARY_DIR}/completions)
  add_custom_target(kz7_completions ALL DEPENDS ${all_completions})
  install(FILES ${PROJECT_BINARY_DIR}/completions/bash RENAME kz7admin
    DESTINATION ${CMAKE_INSTALL_DATADIR}/bash-completion/completions COMPONENT kz7install)
  install(FILES ${PROJECT_BINARY_DIR}/completions/zsh RENAME _kz7admin
    DESTINATION ${CMAKE_INSTALL_DATADIR}/zsh/vendor-completions COMPONENT kz7install)
  install(DIRECTORY packaging/ansible/ansible_collections DESTINATION ${CMAKE_INSTALL_DATADIR}/ansible/collections
    COMPONENT kz7install PATTERN __pycache__ EXCLUDE PATTERN *.in EXCLUDE)
  configure_file(packaging/ansible/ansible_collections/kz7/install/galaxy.yml.in galaxy.yml @ONLY)
  install(FILES ${PROJECT_BINARY_DIR}/galaxy.yml COMPONENT kz7install
    DESTINATION ${CMAKE_INSTALL_DATADIR}/ansible/collections/ansible_collections/kz7/install)
endif()

if(WIN32)
  set(system_libraries "-lmsi -lntdll -lole32 -luuid")
  install(TARGETS kz7actions64 RUNTIME COMPONENT kz7install ARCHIVE COMPONENT kz7install-dev)
else()
  set(system_libraries "-Wl,--exclude-libs,libkz7runtime.a -pthread -ldl -lm")
endif()
file(RELATIVE_PATH includes_from_pc ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig ${CMAKE_INSTALL_FULL_INCLUDEDIR})
configure_file(cmake/kz7.pc.in kz7.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/kz7.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT kz7install-dev)
include(packaging/cpack.cmake)
