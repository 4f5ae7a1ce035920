# The tests of the Redfish source (included from CMakeLists.txt of this folder). CTest names
# "platform.*" as for the other platform tests.
#
# Unit tests (source text, resources, walk, transport rules) need nothing beyond the platform.
# The mock tests (redfish_mock, redfish_provider) start the mock service of tests/redfish-mock on
# a loopback port with certificates made by the openssl command, and read it through the built
# transport bluelight-redfish.so; they need python3, openssl and libcurl's development files
# (Debian packages python3, openssl, libcurl4-openssl-dev, in the test group of
# scripts/packages.txt). A build with the tests needs all three, so none of these tests is ever
# skipped: configuring stops and says what is missing. redfish_fixture reads the source text of the CTest fixture of
# tests/redfish-mock (fixture ${BLUELIGHT_REDFISH_FIXTURE}, file
# ${BLUELIGHT_REDFISH_FIXTURE_SOURCE_FILE}), to show that the fixture serves what other suites
# get from it.
set(REDFISH_TEST_UNITS
  redfish_source_text
  redfish_resources
  redfish_walk
  redfish_transport
  redfish_mock
  redfish_provider
  redfish_fixture)

find_package(Python3 REQUIRED COMPONENTS Interpreter)
find_program(BLUELIGHT_OPENSSL openssl REQUIRED
             DOC "The openssl command, which makes the Redfish tests' certificates")
find_program(BLUELIGHT_READELF NAMES readelf ${CMAKE_READELF} REQUIRED)
if(NOT TARGET bluelight_redfish)
  message(FATAL_ERROR "The Redfish tests need the HTTPS transport, which needs libcurl's development "
                      "files (Debian package libcurl4-openssl-dev; scripts/ensure-packages.sh test "
                      "installs it), or configure with -DBLUELIGHT_BUILD_TESTS=OFF")
endif()
set(_redfish_plugin $<TARGET_FILE:bluelight_redfish>)

foreach(unit IN LISTS REDFISH_TEST_UNITS)
  set(target platform_${unit}_test)
  set(sources ${unit}_test.cpp)
  if(unit MATCHES "^redfish_(mock|provider|fixture)$")
    list(APPEND sources support/RedfishMock.cpp support/RedfishMock.h)
  endif()
  add_executable(${target} ${sources})
  target_include_directories(${target} PRIVATE ${CMAKE_CURRENT_SOURCE_DIR}/support)
  target_compile_definitions(${target} PRIVATE
    REDFISH_TEST_PYTHON="${Python3_EXECUTABLE}"
    REDFISH_TEST_MOCK="${BLUELIGHT_REDFISH_MOCK}"
    REDFISH_TEST_SERVICES="${BLUELIGHT_REDFISH_MOCK_SERVICES}"
    REDFISH_TEST_PKI_ROOT="${CMAKE_CURRENT_BINARY_DIR}/redfish-pki"
    REDFISH_TEST_PLUGIN="${_redfish_plugin}"
    REDFISH_TEST_PROVIDER_LIBRARY="$<TARGET_FILE:bluelightprofileprovider>"
    REDFISH_TEST_READELF="${BLUELIGHT_READELF}"
    REDFISH_TEST_FIXTURE_SOURCE_FILE="${BLUELIGHT_REDFISH_FIXTURE_SOURCE_FILE}")
  target_link_libraries(${target} PRIVATE
    bluelight_platform platform_test_seams test_support GTest::gtest GTest::gtest_main
    Threads::Threads)
  set(_properties ENVIRONMENT "VNLOG_SINK=none;LC_ALL=;LC_MESSAGES=;LANG=;KESTA_LANGUAGE="
                  LABELS platform)
  if(unit STREQUAL "redfish_fixture")
    list(APPEND _properties FIXTURES_REQUIRED ${BLUELIGHT_REDFISH_FIXTURE})
  endif()
  gtest_discover_tests(${target}
    TEST_PREFIX "platform."
    NO_PRETTY_VALUES
    PROPERTIES ${_properties})
endforeach()

# The walk tests read the mock's services as the tables of their fake sessions.
target_link_libraries(platform_redfish_walk_test PRIVATE nlohmann_json::nlohmann_json)
# The transport tests read the provider library's dependencies and load the plug-in.
add_dependencies(platform_redfish_transport_test bluelightprofileprovider)
# The provider tests load the built provider library into the in-process host.
target_link_libraries(platform_redfish_provider_test PRIVATE platform_test_provider)
add_dependencies(platform_redfish_provider_test bluelightprofileprovider)
