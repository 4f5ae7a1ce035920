# The tests of the IPMI sources (included from CMakeLists.txt of this folder). CTest names
# "platform.*" as for the other platform tests.
#
# Unit tests need nothing beyond the platform. The simulator tests (ipmi_simulator,
# ipmi_provider) run OpenIPMI's BMC simulator ipmi_sim on a loopback port with the plug-in of
# tests/ipmi-sim; they need the Debian packages openipmi (ipmi_sim) and libopenipmi-dev (for the
# network transport and the plug-in). When any of it is missing they FAIL and say what is missing,
# so a CI machine without it cannot pass by accident; developers may set
# BLUELIGHT_SKIP_IPMI_SIM_TESTS=1 to have them skipped instead.
set(IPMI_TEST_UNITS
  ipmi_identify
  ipmi_source_text
  ipmi_credentials
  ipmi_device_transport
  ipmi_source
  ipmi_simulator
  ipmi_provider)

find_program(BLUELIGHT_IPMI_SIM ipmi_sim DOC "OpenIPMI's BMC simulator, for the IPMI tests")
if(NOT BLUELIGHT_IPMI_SIM)
  set(BLUELIGHT_IPMI_SIM "")
endif()
find_path(BLUELIGHT_OPENIPMI_SERVER_INCLUDE OpenIPMI/mcserv.h
          DOC "OpenIPMI's simulator headers, for the identify plug-in of the IPMI tests")
set(_ipmi_sim_plugin "")
if(BLUELIGHT_OPENIPMI_SERVER_INCLUDE)
  add_subdirectory(${PROJECT_SOURCE_DIR}/tests/ipmi-sim ${CMAKE_CURRENT_BINARY_DIR}/ipmi-sim)
  set(_ipmi_sim_plugin $<TARGET_FILE:bluelight_identify_sim>)
endif()
if(TARGET bluelight_ipmi_lan)
  set(_ipmi_lan_plugin $<TARGET_FILE:bluelight_ipmi_lan>)
else()
  set(_ipmi_lan_plugin "")
endif()

foreach(unit IN LISTS IPMI_TEST_UNITS)
  set(target platform_${unit}_test)
  set(sources ${unit}_test.cpp)
  if(unit STREQUAL "ipmi_simulator" OR unit STREQUAL "ipmi_provider")
    list(APPEND sources support/IpmiSimulator.cpp support/IpmiSimulator.h)
  endif()
  add_executable(${target} ${sources})
  target_include_directories(${target} PRIVATE ${CMAKE_CURRENT_SOURCE_DIR}/support)
  target_compile_definitions(${target} PRIVATE
    IPMI_TEST_SIMULATOR="${BLUELIGHT_IPMI_SIM}"
    IPMI_TEST_SIMULATOR_PLUGIN="${_ipmi_sim_plugin}"
    IPMI_TEST_SIMULATOR_CONFIG="${PROJECT_SOURCE_DIR}/tests/ipmi-sim"
    IPMI_TEST_LAN_PLUGIN="${_ipmi_lan_plugin}"
    IPMI_TEST_PROVIDER_LIBRARY="$<TARGET_FILE:bluelightprofileprovider>")
  target_link_libraries(${target} PRIVATE
    bluelight_platform platform_test_seams test_support GTest::gtest GTest::gtest_main
    Threads::Threads)
  if(BLUELIGHT_OPENIPMI_SERVER_INCLUDE)
    add_dependencies(${target} bluelight_identify_sim)
  endif()
  gtest_discover_tests(${target}
    TEST_PREFIX "platform."
    NO_PRETTY_VALUES
    PROPERTIES ENVIRONMENT "VNLOG_SINK=none;LC_ALL=;LC_MESSAGES=;LANG=;KESTA_LANGUAGE="
               LABELS platform)
endforeach()

# The provider tests load the built provider library into the in-process host.
target_link_libraries(platform_ipmi_provider_test PRIVATE platform_test_provider)
add_dependencies(platform_ipmi_provider_test bluelightprofileprovider)
