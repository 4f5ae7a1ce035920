# Where an installation puts things. Included by the top-level CMakeLists.txt before any
# subdirectory, because the command-line tool must know where the provider library goes (it looks
# there first) and the deploy rules install it there.

set(BLUELIGHT_PACKAGE_NAME "kesta-bluelight-provider")

# Both object managers search a list of directories for lib<location>.so (sfcb: providerDirs in
# sfcb.cfg; OpenPegasus: the providerDir setting). The distribution's shared CMPI directory is
# the default; point it at the object manager's own directory where that is simpler.
set(BLUELIGHT_PROVIDER_DIR "${CMAKE_INSTALL_LIBDIR}/cmpi" CACHE STRING
    "Where the provider libraries are installed (relative to the prefix, or absolute)")
set(BLUELIGHT_DATA_DIR "${CMAKE_INSTALL_DATADIR}/bluelightprofileprovider" CACHE STRING
    "Where the class MOF, the registrations and the examples are installed")
set(BLUELIGHT_DOC_DIR "${CMAKE_INSTALL_DATAROOTDIR}/doc/${BLUELIGHT_PACKAGE_NAME}" CACHE STRING
    "Where the deployment documents are installed")

# The platform reads /etc/kesta/instrumentation.conf whatever the prefix. GNUInstallDirs gives
# /etc for the /usr prefix; that absolute path is used as it is, while a sysconfdir inside the
# prefix stays relative so that `cmake --install --prefix` and packaging can move it.
if(CMAKE_INSTALL_FULL_SYSCONFDIR STREQUAL "${CMAKE_INSTALL_PREFIX}/${CMAKE_INSTALL_SYSCONFDIR}")
  set(BLUELIGHT_CONFIG_INSTALL_DIR "${CMAKE_INSTALL_SYSCONFDIR}/kesta")
else()
  set(BLUELIGHT_CONFIG_INSTALL_DIR "${CMAKE_INSTALL_FULL_SYSCONFDIR}/kesta")
endif()

# Absolute forms, for the tool, the tests and the Debian control files.
foreach(var PROVIDER_DIR DATA_DIR DOC_DIR CONFIG_INSTALL_DIR)
  if(IS_ABSOLUTE "${BLUELIGHT_${var}}")
    set(BLUELIGHT_FULL_${var} "${BLUELIGHT_${var}}")
  else()
    set(BLUELIGHT_FULL_${var} "${CMAKE_INSTALL_PREFIX}/${BLUELIGHT_${var}}")
  endif()
endforeach()
