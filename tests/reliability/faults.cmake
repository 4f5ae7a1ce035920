# The fault-injection and hostile-input gates, on the black-box fixture (the provider library
# loaded once per program with dlopen, a fresh broker per test).
find_package(Threads REQUIRED)
# Exhaustive fault injection: every creating broker call of every operation made to fail in turn.
if(TARGET blackbox_fixture)
  add_executable(reliability_fault_injection FaultInjectionTest.cpp)
  target_link_libraries(reliability_fault_injection PRIVATE blackbox_fixture GTest::gtest_main)
  gtest_discover_tests(reliability_fault_injection TEST_PREFIX "reliability."
                       DISCOVERY_TIMEOUT 60 PROPERTIES LABELS reliability)

  # Hostile input: odd property lists, object paths and arguments, huge and changing trees.
  add_executable(reliability_hostile_input HostileInputTest.cpp)
  target_link_libraries(reliability_hostile_input PRIVATE blackbox_fixture GTest::gtest_main
                                                          Threads::Threads)
  gtest_discover_tests(reliability_hostile_input TEST_PREFIX "reliability."
                       DISCOVERY_TIMEOUT 60 PROPERTIES LABELS reliability TIMEOUT 1800)
endif()
