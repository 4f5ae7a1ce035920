# The set-up step of the package tests (CTest fixture "deploy_package"): builds the Debian
# package from the build tree once and unpacks it, so that every test of PackageTest.cpp reads
# the same unpacked tree instead of packaging again.
#
#   cmake -DCPACK=<cpack> -DBINARY_DIR=<build tree> -DOUT=<scratch dir> -DSANITIZERS=<list>
#         -P BuildPackage.cmake
file(REMOVE_RECURSE ${OUT})
file(MAKE_DIRECTORY ${OUT})

# A sanitized build is not packaged: its libraries only load into an object manager that has the
# sanitizer runtime preloaded.
if(SANITIZERS)
  message("SKIPPED: a build with sanitizers (${SANITIZERS}) is not packaged")
  return()
endif()
find_program(DPKG_DEB dpkg-deb)
if(NOT DPKG_DEB)
  message("SKIPPED: dpkg-deb is not installed: not a Debian system")
  return()
endif()

# gzip instead of xz: the same package, built in a fraction of the time.
execute_process(
  COMMAND ${CPACK} -G DEB -D CPACK_DEBIAN_COMPRESSION_TYPE=gzip
          --config ${BINARY_DIR}/CPackConfig.cmake -B ${OUT}/cpack
  WORKING_DIRECTORY ${OUT}
  RESULT_VARIABLE result
  OUTPUT_VARIABLE log
  ERROR_VARIABLE log)
if(NOT result EQUAL 0)
  message(FATAL_ERROR "cpack failed (${result}):\n${log}")
endif()
file(GLOB debs ${OUT}/cpack/*.deb)
list(LENGTH debs count)
if(NOT count EQUAL 1)
  message(FATAL_ERROR "cpack made ${count} packages instead of one:\n${log}")
endif()

foreach(step "-x;${OUT}/root" "-e;${OUT}/control")
  list(INSERT step 1 ${debs})
  execute_process(COMMAND ${DPKG_DEB} ${step} RESULT_VARIABLE result ERROR_VARIABLE error)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "dpkg-deb ${step} failed: ${error}")
  endif()
endforeach()
file(WRITE ${OUT}/package.txt "${debs}")
message("built and unpacked ${debs}")
