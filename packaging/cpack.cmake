# The packages: Debian packages of both components, and one zip file for Windows.
set(CPACK_PACKAGE_NAME kz7install)
set(CPACK_PACKAGE_CONTACT "KZ7 maintainers <maintainers@kz7.invalid>" CACHE STRING "The maintainer of the packages")
set(CPACK_VERBATIM_VARIABLES ON)
set(CPACK_STRIP_FILES ON)

if(WIN32)
  set(CPACK_GENERATOR ZIP)
  set(CPACK_PACKAGE_FILE_NAME kz7install-${PROJECT_VERSION}-win64)
  set(CPACK_PRE_BUILD_SCRIPTS ${PROJECT_SOURCE_DIR}/packaging/finish.cmake)
else()
  set(CPACK_GENERATOR DEB)
  set(CPACK_COMPONENTS_ALL kz7install kz7install-dev)
  set(CPACK_DEB_COMPONENT_INSTALL ON)
  set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
  set(CPACK_PRE_BUILD_SCRIPTS ${PROJECT_SOURCE_DIR}/packaging/finish.cmake)
  set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
  set(CPACK_DEBIAN_COMPRESSION_TYPE xz)
  set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

  set(CPACK_DEBIAN_KZ7INSTALL_PACKAGE_NAME kz7install)
  set(CPACK_DEBIAN_KZ7INSTALL_PACKAGE_SECTION admin)
  set(CPACK_DEBIAN_KZ7INSTALL_PACKAGE_SHLIBDEPS ON)
  set(CPACK_DEBIAN_KZ7INSTALL_PACKAGE_RECOMMENDS jq)
  set(CPACK_COMPONENT_KZ7INSTALL_DESCRIPTION "registry layout of installed copies of a database product
kz7InstallReg creates, migrates and removes the registry layout of copies of
the KZ7 database product that are installed side by side. kz7admin shows,
checks, repairs and backs up what it wrote.")
  foreach(script postinst prerm postrm)
    list(APPEND CPACK_DEBIAN_KZ7INSTALL_PACKAGE_CONTROL_EXTRA ${PROJECT_SOURCE_DIR}/packaging/debian/${script})
  endforeach()

  set(CPACK_DEBIAN_KZ7INSTALL-DEV_PACKAGE_NAME kz7install-dev)
  set(CPACK_DEBIAN_KZ7INSTALL-DEV_PACKAGE_SECTION libdevel)
  set(CPACK_DEBIAN_KZ7INSTALL-DEV_PACKAGE_SUGGESTS kz7install)
  set(CPACK_COMPONENT_KZ7INSTALL-DEV_DESCRIPTION "installer runtime library for C++20
Library, headers, CMake package and pkg-config file for installers that
report their progress to a front end and configure copies of the KZ7 database
product.")
endif()
include(CPack)
