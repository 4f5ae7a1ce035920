# The Debian package of everything the project installs: both provider libraries, the class MOF,
# the registrations, the caption catalogues, the example configuration, the tool and the docs.
#
#   cmake -S . -B build-deb -DCMAKE_INSTALL_PREFIX=/usr -DCMAKE_BUILD_TYPE=Release
#   cmake --build build-deb && (cd build-deb && cpack -G DEB)
#
# The package installs exactly where `cmake --install` would, so the paths compiled into the
# libraries (the catalogue directory) hold in the package too; a package meant for a Debian
# system therefore needs the /usr prefix, and cpack warns about any other.

set(CPACK_PACKAGE_NAME ${BLUELIGHT_PACKAGE_NAME})
set(CPACK_PACKAGE_VENDOR "KESTA")
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGE_CONTACT "${BLUELIGHT_PACKAGE_MAINTAINER}")
set(CPACK_PACKAGE_DESCRIPTION_SUMMARY
    "CMPI providers publishing the server's blue alarm lights as CIM instances")
set(CPACK_GENERATOR "DEB")
set(CPACK_PACKAGING_INSTALL_PREFIX "${CMAKE_INSTALL_PREFIX}")
# /etc/kesta lies outside the prefix; staging through DESTDIR keeps it inside the package.
set(CPACK_SET_DESTDIR ON)
# Debian ships debugging information separately; the package holds stripped binaries.
set(CPACK_STRIP_FILES ON)

set(CPACK_DEBIAN_PACKAGE_NAME ${BLUELIGHT_PACKAGE_NAME})
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_RELEASE 1)
set(CPACK_DEBIAN_PACKAGE_SECTION "admin")
set(CPACK_DEBIAN_PACKAGE_PRIORITY "optional")
# The extended description; cpack puts CPACK_PACKAGE_DESCRIPTION_SUMMARY before it as the
# synopsis line.
set(CPACK_DEBIAN_PACKAGE_DESCRIPTION
    "Instrumentation for CIM object managers that load CMPI 2.0 providers, such as
the Small Footprint CIM Broker (sfcb) and OpenPegasus. It publishes the blue
alarm lights of the server (KESTA_BlueLight), their capabilities and the
associations to them, plus a provider of KESTA_ComputerSystem for hosts that
have none.
.
The package installs the provider libraries, the class MOF and the
registration files for both object managers; docs/deployment.md in
/usr/share/doc/${BLUELIGHT_PACKAGE_NAME} lists the commands that load them.")

# Dependencies from the libraries themselves when dpkg-shlibdeps is there (dpkg-dev), else the
# run-time libraries every C++ program of this toolchain needs.
find_program(BLUELIGHT_DPKG_SHLIBDEPS dpkg-shlibdeps)
find_program(BLUELIGHT_FILE_PROGRAM file)
if(BLUELIGHT_DPKG_SHLIBDEPS AND BLUELIGHT_FILE_PROGRAM)
  set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
else()
  message(STATUS "dpkg-shlibdeps or file not found: the Debian package depends on libc6, "
                 "libgcc-s1, libstdc++6 and libsimdjson14 without versions")
  set(CPACK_DEBIAN_PACKAGE_DEPENDS "libc6, libgcc-s1, libstdc++6, libsimdjson14")
endif()

# The example configuration is the administrator's to change: a conffile, kept on upgrade.
set(_debian_dir ${CMAKE_CURRENT_BINARY_DIR}/debian)
file(CONFIGURE OUTPUT ${_debian_dir}/conffiles
     CONTENT "${BLUELIGHT_FULL_CONFIG_INSTALL_DIR}/instrumentation.conf\n")
set(CPACK_DEBIAN_PACKAGE_CONTROL_EXTRA ${_debian_dir}/conffiles)
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)

set(CPACK_PROJECT_CONFIG_FILE ${CMAKE_CURRENT_SOURCE_DIR}/cmake/CPackProjectConfig.cmake)

# Source packages are not made from here; keep build trees out should anyone try.
set(CPACK_SOURCE_GENERATOR "TGZ")
set(CPACK_SOURCE_IGNORE_FILES "/\\\\.git/" "/build[^/]*/")

include(CPack)
