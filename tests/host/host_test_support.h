// Shared fixture of the host tests: a broker with a request current on the test thread, and
// short-hands for reading what the CMPI functions return.
#pragma once

#include <cmpihost/cmpihost.h>
#include <gtest/gtest.h>

#include <optional>
#include <string>

namespace cmpihost::testing {

class HostTest : public ::testing::Test {
 protected:
  void SetUp() override { request.emplace(broker); }
  void TearDown() override { request.reset(); }

  const CMPIBroker* mb() const { return broker.cmpi(); }

  /// The characters of a string, or "<null>".
  static std::string text(const CMPIString* string) { return toText(string).value_or("<null>"); }

  /// An object path made through the broker's table, as a provider makes one.
  CMPIObjectPath* newPath(const char* nameSpace, const char* className) {
    CMPIStatus rc{CMPI_RC_OK, nullptr};
    CMPIObjectPath* path = mb()->eft->newObjectPath(mb(), nameSpace, className, &rc);
    EXPECT_EQ(rc.rc, CMPI_RC_OK);
    return path;
  }

  CMPIInstance* newInstance(const char* nameSpace, const char* className) {
    CMPIStatus rc{CMPI_RC_OK, nullptr};
    CMPIInstance* instance = mb()->eft->newInstance(mb(), newPath(nameSpace, className), &rc);
    EXPECT_EQ(rc.rc, CMPI_RC_OK);
    return instance;
  }

  Broker broker;
  std::optional<Request> request;
};

/// Status values read well in assertions: EXPECT_EQ(statusOf(call), StatusValue(CMPI_RC_OK)).
inline StatusValue statusOf(const CMPIStatus& status) { return toStatusValue(status); }

/// Whether a CMPIData is null (the macro yields 256, not 1).
inline bool isNull(const CMPIData& data) { return (data.state & CMPI_nullValue) != 0; }

}  // namespace cmpihost::testing
