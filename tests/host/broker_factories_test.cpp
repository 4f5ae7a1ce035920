// CMPIBrokerEncFT and the broker's data fields: factories, type helpers, messages, logging and
// tracing, and calls with a broker that is not ours.
#include "host_test_support.h"

namespace cmpihost {
namespace {

using testing::HostTest;

using BrokerFactoriesTest = HostTest;

TEST_F(BrokerFactoriesTest, BrokerIdentity) {
  EXPECT_STREQ(CBBrokerName(mb()), "cmpihost");
  EXPECT_EQ(CBBrokerVersion(mb()), 200u);
  EXPECT_EQ(mb()->eft->ftVersion, 200);
  EXPECT_EQ(mb()->xft->ftVersion, 200);
  EXPECT_EQ(mb()->mft->ftVersion, 200);
  EXPECT_NE(mb()->bft->brokerCapabilities & CMPI_MB_Class_0, 0u);
}

TEST(BrokerOptionsTest, NameAndVersionAreConfigurable) {
  BrokerOptions options;
  options.name = "other";
  options.version = 100;
  Broker broker(options);
  EXPECT_STREQ(CBBrokerName(broker.cmpi()), "other");
  EXPECT_EQ(CBBrokerVersion(broker.cmpi()), 100u);
  EXPECT_EQ(broker.cmpi()->eft->ftVersion, 100);
}

TEST_F(BrokerFactoriesTest, ClassPathIsA) {
  CMPIObjectPath* path = newPath("root/cimv2", "KESTA_BlueLight");
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(CMClassPathIsA(mb(), path, "kesta_bluelight", &rc), 1);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CMClassPathIsA(mb(), path, "CIM_AlarmDevice", &rc), 0);
  broker.setSuperclass("KESTA_BlueLight", "CIM_AlarmDevice");
  broker.setSuperclass("CIM_AlarmDevice", "CIM_LogicalDevice");
  EXPECT_EQ(CMClassPathIsA(mb(), path, "CIM_AlarmDevice", &rc), 1);
  EXPECT_EQ(CMClassPathIsA(mb(), path, "CIM_LogicalDevice", &rc), 1);
  EXPECT_EQ(CMClassPathIsA(mb(), path, nullptr, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CMClassPathIsA(mb(), nullptr, "X", &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(BrokerFactoriesTest, SuperclassCyclesEnd) {
  broker.setSuperclass("A", "B");
  broker.setSuperclass("B", "A");
  EXPECT_EQ(CMClassPathIsA(mb(), newPath("ns", "A"), "C", nullptr), 0);
}

TEST_F(BrokerFactoriesTest, ToStringOfObjects) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMAddKey(path, "K", "v", CMPI_chars);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(text(CDToString(mb(), path, &rc)), "ns:C.K=\"v\"");
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(CDToString(mb(), CMNewString(mb(), "s", nullptr), &rc)), "s");
  CMPIInstance* instance = newInstance("ns", "C");
  CMSetProperty(instance, "P", "x", CMPI_chars);
  EXPECT_EQ(text(CDToString(mb(), instance, &rc)), "instance of C (ns:C) { P = \"x\"; }");
  EXPECT_EQ(CDToString(mb(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  path->hdl = nullptr;
  EXPECT_EQ(CDToString(mb(), path, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

TEST_F(BrokerFactoriesTest, TypeTests) {
  CMPIObjectPath* path = newPath("ns", "C");
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(CDIsOfType(mb(), path, "CMPIObjectPath", &rc), 1);
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(CDIsOfType(mb(), path, "CMPIInstance", &rc), 0);
  EXPECT_EQ(text(CDGetType(mb(), path, &rc)), "CMPIObjectPath");
  EXPECT_EQ(text(CDGetType(mb(), request->context(), &rc)), "CMPIContext");
  EXPECT_EQ(text(CDGetType(mb(), CMNewArray(mb(), 0, CMPI_uint8, nullptr), &rc)), "CMPIArray");
  EXPECT_EQ(CDGetType(mb(), nullptr, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
  EXPECT_EQ(CDIsOfType(mb(), path, nullptr, &rc), 0);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(BrokerFactoriesTest, GetMessageFillsInTheArguments) {
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  CMPIString* message = CMGetMessage(mb(), "Id1", "Light $0 is $1 ($2)", &rc,
                                     CMFmtArgs3(CMFmtChars("one"), CMFmtSint(-4), CMFmtBoolean(1)));
  EXPECT_EQ(rc.rc, CMPI_RC_OK);
  EXPECT_EQ(text(message), "Light one is -4 (true)");
  EXPECT_EQ(text(CMGetMessage(mb(), "Id", "plain $0", &rc, CMFmtArgs0())), "plain $0");
  EXPECT_EQ(CMGetMessage(mb(), "Id", nullptr, &rc, CMFmtArgs0()), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(BrokerFactoriesTest, MessageFiles) {
  CMPIMsgFileHandle handle = nullptr;
  EXPECT_EQ(CMOpenMessageFile(mb(), "messages", &handle).rc, CMPI_RC_OK);
  EXPECT_NE(handle, nullptr);
  CMPIStatus rc{CMPI_RC_ERR_FAILED, nullptr};
  EXPECT_EQ(text(CMGetMessage2(mb(), "Id", handle, "n=$0", &rc, CMFmtArgs1(CMFmtUint(7)))), "n=7");
  EXPECT_EQ(CMCloseMessageFile(mb(), handle).rc, CMPI_RC_OK);
  EXPECT_EQ(CMOpenMessageFile(mb(), "messages", nullptr).rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(BrokerFactoriesTest, TracesAreRecorded) {
  EXPECT_EQ(CMTraceMessage(mb(), CMPI_LEV_WARNING, "Comp", "text", nullptr).rc, CMPI_RC_OK);
  CMTraceMessage(mb(), CMPI_LEV_INFO, nullptr, nullptr, CMNewString(mb(), "from string", nullptr));
  CMTraceMessage(mb(), CMPI_LEV_VERBOSE, "Comp", nullptr, nullptr);
  CMTraceMessage(mb(), CMPI_LEV_INFO, "Comp", "text wins", CMNewString(mb(), "ignored", nullptr));
  const std::vector<TraceRecord> traces = request->traces();
  ASSERT_EQ(traces.size(), 4u);
  EXPECT_EQ(traces[0].level, CMPI_LEV_WARNING);
  EXPECT_EQ(traces[0].component, "Comp");
  EXPECT_EQ(traces[0].text, "text");
  EXPECT_FALSE(traces[0].textFromString);
  EXPECT_EQ(traces[1].component, std::nullopt);
  EXPECT_EQ(traces[1].text, "from string");
  EXPECT_TRUE(traces[1].textFromString);
  EXPECT_EQ(traces[2].text, std::nullopt);
  EXPECT_FALSE(traces[2].textFromString);
  EXPECT_EQ(traces[3].text, "text wins");
  EXPECT_EQ(broker.traces(), traces);
  EXPECT_EQ(traces[0].requestId, request->id());
}

TEST_F(BrokerFactoriesTest, LogsAreRecorded) {
  EXPECT_EQ(CMLogMessage(mb(), CMPI_SEV_ERROR, "Id", "bad", nullptr).rc, CMPI_RC_OK);
  CMLogMessage(mb(), CMPI_SEV_INFO, nullptr, nullptr, CMNewString(mb(), "alt", nullptr));
  const std::vector<LogRecord> logs = request->logs();
  ASSERT_EQ(logs.size(), 2u);
  EXPECT_EQ(logs[0].severity, CMPI_SEV_ERROR);
  EXPECT_EQ(logs[0].id, "Id");
  EXPECT_EQ(logs[0].text, "bad");
  EXPECT_EQ(logs[1].id, std::nullopt);
  EXPECT_EQ(logs[1].text, "alt");
  EXPECT_TRUE(logs[1].textFromString);
}

TEST_F(BrokerFactoriesTest, UnsupportedFactories) {
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  CMPIArray* projection = reinterpret_cast<CMPIArray*>(0x1);
  EXPECT_EQ(CMNewSelectExp(mb(), "SELECT * FROM C", "WQL", &projection, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  EXPECT_EQ(projection, nullptr);
  EXPECT_EQ(CMNewCMPIError(mb(), "o", "id", "m", ErrorSevLow, ErrorProbCauseOther,
                           CMPI_RC_ERR_FAILED, &rc),
            nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(BrokerFactoriesTest, NullOrForeignBrokerFailsCleanly) {
  const CMPIBrokerEncFT* eft = mb()->eft;
  CMPIStatus rc{CMPI_RC_OK, nullptr};
  EXPECT_EQ(eft->newObjectPath(nullptr, "ns", "C", &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  EXPECT_EQ(eft->newString(nullptr, "x", &rc), nullptr);
  EXPECT_EQ(eft->trace(nullptr, 1, "c", "t", nullptr).rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMPIBroker foreign = *mb();
  foreign.hdl = nullptr;
  EXPECT_EQ(eft->newInstance(&foreign, newPath("ns", "C"), &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
  CMPIBrokerEncFT otherTable = *eft;
  otherTable.newInstance = nullptr;
  CMPIBroker other = *mb();
  other.eft = &otherTable;
  EXPECT_EQ(eft->newArgs(&other, &rc), nullptr);
  EXPECT_EQ(rc.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

}  // namespace
}  // namespace cmpihost
