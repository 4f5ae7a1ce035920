# Read by cpack for every generator, after CPackConfig.cmake.

# A Debian package belongs under /usr: the libraries have their catalogue directory compiled in,
# so only a build configured with -DCMAKE_INSTALL_PREFIX=/usr makes a package that installs
# where it looks.
if(CPACK_GENERATOR STREQUAL "DEB" AND NOT CPACK_PACKAGING_INSTALL_PREFIX STREQUAL "/usr")
  message(WARNING "Packaging with the prefix ${CPACK_PACKAGING_INSTALL_PREFIX}; configure the "
                  "build with -DCMAKE_INSTALL_PREFIX=/usr for a package to install on Debian")
endif()
