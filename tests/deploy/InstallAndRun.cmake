# Installs the project into a scratch prefix and runs the installed bluelight-cli there, without
# --library: the tool must find the library that the installation put in place.
#
#   cmake -DBINARY_DIR=<build tree> -DWORK=<scratch dir> -DSAMPLE_TREE=<json tree>
#         [-DSOURCE_DIR=<source tree> -DPROVIDER_DIR=<absolute dir>] -DSANITIZERS=<list>
#         -P InstallAndRun.cmake
#
# Without PROVIDER_DIR the build tree itself is installed with --prefix. With it, a build of its
# own is configured with -DBLUELIGHT_PROVIDER_DIR=<that dir> (the option the deployment guide
# documents for an object manager's own provider directory), built and installed with another
# --prefix, so the libraries land outside the prefix the tool is in.
file(REMOVE_RECURSE ${WORK})
file(MAKE_DIRECTORY ${WORK})

# A sanitized tool only runs with the sanitizer's runtime, which an installation does not have.
if(SANITIZERS)
  message("SKIPPED: a build with sanitizers (${SANITIZERS}) is not installed")
  return()
endif()

function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE out)
  if(NOT result EQUAL 0)
    string(REPLACE ";" " " command "${ARGN}")
    message(FATAL_ERROR "${command} failed (${result}):\n${out}")
  endif()
endfunction()

set(prefix ${WORK}/prefix)
if(PROVIDER_DIR)
  set(build ${WORK}/build)
  run(${CMAKE_COMMAND} -S ${SOURCE_DIR} -B ${build} -DCMAKE_BUILD_TYPE=Debug
      -DBLUELIGHT_BUILD_TESTS=OFF -DBLUELIGHT_BUILD_BENCHMARKS=OFF -DBLUELIGHT_IPMI_LAN=OFF -DBLUELIGHT_REDFISH=OFF
      -DCMAKE_INSTALL_PREFIX=${WORK}/configured-prefix -DBLUELIGHT_PROVIDER_DIR=${PROVIDER_DIR})
  # Only what is installed: the libraries, the tool and the catalogues.
  run(${CMAKE_COMMAND} --build ${build} -j 2 --target bluelightprofileprovider bluelight-cli
      kestacomputersystemprovider bluelight_catalogues)
  set(library_dir ${PROVIDER_DIR})
else()
  set(build ${BINARY_DIR})
  execute_process(COMMAND ${CMAKE_COMMAND} -L -N ${build} OUTPUT_VARIABLE cache)
  string(REGEX MATCH "BLUELIGHT_PROVIDER_DIR:STRING=([^\n]*)" _ "${cache}")
  set(library_dir ${prefix}/${CMAKE_MATCH_1})
endif()
run(${CMAKE_COMMAND} --install ${build} --prefix ${prefix})

set(library ${library_dir}/libbluelightprofileprovider.so.1)
if(NOT EXISTS ${library})
  message(FATAL_ERROR "the installation put no provider library at ${library}")
endif()

# The installed tool, run from a folder of its own with nothing on the library path.
set(ENV{KESTA_INSTRUMENTATION} "file:${SAMPLE_TREE}")
set(ENV{KESTA_SYSTEM_NAME} "install-test")
set(ENV{VNLOG_SINK} "none")
unset(ENV{LD_LIBRARY_PATH})
execute_process(COMMAND ${prefix}/bin/bluelight-cli --verbose ein KESTA_BlueLight
                WORKING_DIRECTORY ${WORK}
                RESULT_VARIABLE result OUTPUT_VARIABLE out ERROR_VARIABLE err)
if(NOT result EQUAL 0)
  message(FATAL_ERROR "the installed bluelight-cli failed (${result}):\n${out}\n${err}")
endif()
string(FIND "${err}" "${library}" at)
if(at EQUAL -1)
  message(FATAL_ERROR "the installed tool did not load ${library}:\n${err}")
endif()
string(REGEX MATCHALL "KESTA_BlueLight\\.CreationClassName" paths "${out}")
list(LENGTH paths count)
if(NOT count EQUAL 6)
  message(FATAL_ERROR "expected the 6 lights of the sample tree, got ${count}:\n${out}")
endif()
message("the installed tool loaded ${library} and listed ${count} lights")
