# Compiles the header checks with every C and C++ compiler found at configure time (not only the
# one the build uses), because providers and brokers using our headers may be built with either
# GCC or Clang. Runs the C check program and the C++ factory test each compiler produces.
#
# Called by CTest as:
#   cmake -DSOURCE_DIR=... -DINCLUDE_DIR=... -DWORK_DIR=... -DC_COMPILERS=a,b -DCXX_COMPILERS=c,d
#         -P check_compilers.cmake

foreach(var SOURCE_DIR INCLUDE_DIR WORK_DIR)
  if(NOT DEFINED ${var})
    message(FATAL_ERROR "check_compilers.cmake: ${var} is not set")
  endif()
endforeach()

string(REPLACE "," ";" C_COMPILERS "${C_COMPILERS}")
string(REPLACE "," ";" CXX_COMPILERS "${CXX_COMPILERS}")
file(MAKE_DIRECTORY ${WORK_DIR})
set(_common -DCMPI_PLATFORM_LINUX_GENERIC_GNU=1 -DABI_OWN_HEADERS=1 -I${INCLUDE_DIR} -I${SOURCE_DIR} -Wall -Wextra
            -pedantic -Werror)
set(_ran 0)

function(_run what)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE rv OUTPUT_VARIABLE out ERROR_VARIABLE err)
  if(NOT rv EQUAL 0)
    message(FATAL_ERROR "${what} failed (${rv}):\n${out}${err}")
  endif()
  string(STRIP "${out}" out)
  message(STATUS "${what}: ok ${out}")
endfunction()

foreach(cc IN LISTS C_COMPILERS)
  get_filename_component(name ${cc} NAME)
  foreach(std c11 gnu11 c17)
    set(exe ${WORK_DIR}/abi_check_${name}_${std})
    _run("${name} -std=${std} abi_check.c" ${cc} -std=${std} ${_common}
         ${SOURCE_DIR}/abi_check.c -o ${exe})
    _run("${name} -std=${std} run" ${exe})
    _run("${name} -std=${std} abi_v100.c" ${cc} -std=${std} ${_common} -fsyntax-only
         ${SOURCE_DIR}/abi_v100.c)
    _run("${name} -std=${std} stub provider" ${cc} -std=${std} ${_common} -fsyntax-only
         ${SOURCE_DIR}/abi_stub_provider_c.c)
    math(EXPR _ran "${_ran} + 1")
  endforeach()
endforeach()

foreach(cxx IN LISTS CXX_COMPILERS)
  get_filename_component(name ${cxx} NAME)
  foreach(std c++17 c++20)
    _run("${name} -std=${std} abi_static_checks.cpp" ${cxx} -std=${std} ${_common} -fsyntax-only
         ${SOURCE_DIR}/abi_static_checks.cpp)
    _run("${name} -std=${std} stub provider" ${cxx} -std=${std} ${_common} -fsyntax-only
         ${SOURCE_DIR}/abi_stub_provider_cxx.cpp)
    set(exe ${WORK_DIR}/abi_factory_test_${name}_${std})
    _run("${name} -std=${std} abi_factory_test.cpp" ${cxx} -std=${std} ${_common}
         -fvisibility=hidden -rdynamic ${SOURCE_DIR}/abi_factory_test.cpp -o ${exe} -ldl)
    _run("${name} -std=${std} factory run" ${exe})
    math(EXPR _ran "${_ran} + 1")
  endforeach()
endforeach()

if(_ran EQUAL 0)
  message(FATAL_ERROR "no compiler to check with")
endif()
