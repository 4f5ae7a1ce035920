// The "redfish:" source through the real HTTPS transport (the built plug-in bluelight-redfish.so
// on libcurl) against the mock service of tests/redfish-mock on a loopback port: what a walk
// asks, over how many connections, and what the source makes of a service that misbehaves - an
// account it refuses, HTTP errors, bodies that are too large or cut short, redirections, a
// connection dropped, a certificate that is not the one it should be, an answer that never comes.
//
// Nothing here asserts on wall time: an answer that does not come in time is told by the message
// the walk gives, and the mock that holds it back waits far longer than the source's timeout.
#include <gtest/gtest.h>

#include <algorithm>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "PlatformTestSupport.h"
#include "RedfishMock.h"
#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/redfish/RedfishSource.h"

namespace {

using Kesta::platform::InstrumentationNode;
using Kesta::platform::InstrumentationSource;
using Kesta::platform::makeRedfishSource;
using Kesta::platform::SourceError;
using redfish_test::RedfishMock;
using testsupport::LogCapture;

const std::string kLogPrefix = "Kesta.Platform.Instrumentation\t6000\tLOG\t";
const std::string kDrives = "/redfish/v1/Chassis/1U/Drives/";

class RedfishMockTest : public ::testing::Test {
 protected:
  // The nodes of one read of `text`; the log lines it wrote go to `lines`.
  std::vector<InstrumentationNode> read(const std::string& text,
                                        std::vector<std::string>* lines = nullptr) {
    LogCapture capture;
    const std::unique_ptr<InstrumentationSource> source = makeRedfishSource(text);
    std::vector<InstrumentationNode> nodes = source->readNodes();
    if (lines != nullptr) {
      *lines = platform_test::rawLines(capture);
    } else {
      EXPECT_TRUE(platform_test::rawLines(capture).empty())
          << testsupport::readFile(capture.file());
    }
    return nodes;
  }

  // The reason a read of `text` fails with (the walk could not start), or "(read)".
  std::string failure(const std::string& text) {
    try {
      makeRedfishSource(text)->readNodes();
    } catch (const SourceError& error) {
      return error.what();
    }
    return "(read)";
  }

  static std::string logLine(const std::string& text, const std::string& problem) {
    return kLogPrefix + "Instrumentation source \"" + text + "\" " + problem;
  }

  static std::vector<std::string> paths(const std::vector<InstrumentationNode>& nodes) {
    std::vector<std::string> result;
    result.reserve(nodes.size());
    for (const InstrumentationNode& node : nodes) {
      result.push_back(node.path);
    }
    return result;
  }

  static std::string prefix(const RedfishMock& mock) {
    return "redfish:127.0.0.1:" + std::to_string(mock.port());
  }
};

bool startsWith(const std::string& text, const std::string& start) {
  return text.rfind(start, 0) == 0;
}

TEST_F(RedfishMockTest, ARackServerIsReadOverOneConnection) {
  RedfishMock mock;
  const std::vector<InstrumentationNode> nodes = read(mock.sourceText());
  ASSERT_EQ(nodes.size(), 9u);
  EXPECT_EQ(nodes[0].path, prefix(mock) + "/redfish/v1/Chassis/1U");
  EXPECT_EQ(nodes[0].description, "Rack Server");
  EXPECT_EQ(nodes[0].type, 26u);
  EXPECT_EQ(nodes[0].status, 1u);
  EXPECT_EQ(nodes[0].property(1), 1u);
  EXPECT_EQ(nodes[2].path, prefix(mock) + kDrives + "1");
  EXPECT_EQ(nodes[2].description, "Drive Bay 1 in Rack Server");
  EXPECT_EQ(nodes[2].property(1), 3u);
  EXPECT_EQ(nodes[3].status, 20u) << "Status.Health Warning";
  EXPECT_EQ(nodes[5].status, 21u) << "Status.Health Critical";

  std::vector<std::string> expected = {"GET /redfish/v1/ 200", "GET /redfish/v1/Chassis 200",
                                       "GET /redfish/v1/Chassis/1U 200"};
  for (int drive = 0; drive < 8; ++drive) {
    expected.push_back("GET " + kDrives + std::to_string(drive) + " 200");
  }
  EXPECT_EQ(mock.requests(), expected);
  EXPECT_EQ(mock.connections(), 1u) << "one TLS handshake for the whole walk";
}

TEST_F(RedfishMockTest, EveryReadIsAWalkOfItsOwn) {
  RedfishMock mock({"blade-enclosure", "", {}});
  const std::unique_ptr<InstrumentationSource> source = makeRedfishSource(mock.sourceText());
  const std::vector<InstrumentationNode> first = source->readNodes();
  const std::vector<InstrumentationNode> second = source->readNodes();
  EXPECT_EQ(first.size(), 10u);
  EXPECT_EQ(first, second);
  EXPECT_EQ(mock.connections(), 2u) << "the connection lives as long as one walk";
  EXPECT_EQ(mock.requests().size(), 2u * (2u + 1u + 3u * 4u));
}

TEST_F(RedfishMockTest, DrivesNoAsksForTheChassisOnly) {
  RedfishMock mock;
  const std::vector<InstrumentationNode> nodes = read(mock.sourceText("drives=no"));
  EXPECT_EQ(paths(nodes), std::vector<std::string>{prefix(mock) + "/redfish/v1/Chassis/1U"});
  EXPECT_EQ(mock.requests(),
            (std::vector<std::string>{"GET /redfish/v1/ 200", "GET /redfish/v1/Chassis 200",
                                      "GET /redfish/v1/Chassis/1U 200"}));
}

TEST_F(RedfishMockTest, WrongValuesThroughTheTransport) {
  RedfishMock mock({"wrong-types", "", {}});
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(mock.sourceText(), &lines);
  EXPECT_EQ(nodes.size(), 6u);
  EXPECT_EQ(std::count_if(nodes.begin(), nodes.end(),
                          [](const InstrumentationNode& node) { return node.status == 21; }),
            4);
  EXPECT_EQ(lines.size(), 5u);
}

TEST_F(RedfishMockTest, AnAccountTheServiceRefusesEndsTheWalkAtTheCollection) {
  RedfishMock mock;
  std::string text = mock.sourceText();
  text.replace(text.find(mock.credentials()), mock.credentials().size(), mock.wrongCredentials());
  const std::string why = failure(text);
  EXPECT_EQ(why,
            "GET /redfish/v1/Chassis: HTTP status 401 (Unauthorized): the service does not "
            "accept the account of the credentials file");
  EXPECT_EQ(why.find("not-the-password"), std::string::npos);
  EXPECT_EQ(mock.requests(),
            (std::vector<std::string>{"GET /redfish/v1/ 200", "GET /redfish/v1/Chassis 401"}));
}

TEST_F(RedfishMockTest, HttpErrorsLeaveOutWhatTheyConcernAndTheWalkGoesOn) {
  RedfishMock mock(
      {"rack-server",
       "",
       {kDrives + "1=status:404", kDrives + "3=status:500", kDrives + "5=status:403"}});
  const std::string text = mock.sourceText();
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  EXPECT_EQ(nodes.size(), 6u);
  EXPECT_EQ(lines, (std::vector<std::string>{
                       logLine(text, "cannot read the drive " + kDrives +
                                         "1: HTTP status 404 (Not Found); its light is left out"),
                       logLine(text, "cannot read the drive " + kDrives +
                                         "3: HTTP status 500 (Internal Server Error); its light "
                                         "is left out"),
                       logLine(text, "cannot read the drive " + kDrives +
                                         "5: HTTP status 403 (Forbidden): the account may not "
                                         "read it; its light is left out"),
                   }));
  EXPECT_EQ(mock.requests().size(), 11u);
  EXPECT_EQ(mock.connections(), 1u) << "an error status does not cost the connection";
}

TEST_F(RedfishMockTest, AServiceRootThatFailsMakesTheSourceUnusable) {
  RedfishMock mock({"rack-server", "", {"/redfish/v1/=status:503"}});
  EXPECT_EQ(failure(mock.sourceText()), "GET /redfish/v1/: HTTP status 503 (Service Unavailable)");
}

TEST_F(RedfishMockTest, BodiesOverTheLimitAreNotRead) {
  RedfishMock mock({"rack-server", "", {kDrives + "2=oversized", kDrives + "4=oversized-chunked"}});
  const std::string text = mock.sourceText();
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  EXPECT_EQ(nodes.size(), 7u);
  const std::string tooLarge = ": the answer is larger than 1024 KiB; it is not read";
  ASSERT_GE(lines.size(), 2u);
  EXPECT_EQ(lines[0], logLine(text, "cannot read the drive " + kDrives + "2" + tooLarge +
                                        "; its light is left out"));
  EXPECT_EQ(lines[1], logLine(text, "cannot read the drive " + kDrives + "4" + tooLarge +
                                        "; its light is left out"));
  EXPECT_EQ(lines.size(), 2u);
  // The drives after them were read all the same.
  EXPECT_EQ(nodes.back().path, prefix(mock) + kDrives + "7");
}

TEST_F(RedfishMockTest, ABodyCutShortIsNotJson) {
  RedfishMock mock({"rack-server", "", {"/redfish/v1/Chassis/1U=truncated"}});
  const std::string text = mock.sourceText();
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  EXPECT_TRUE(nodes.empty());
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_TRUE(startsWith(lines[0], logLine(text,
                                           "cannot read the chassis /redfish/v1/Chassis/1U: "
                                           "the answer is not valid JSON: ")))
      << lines[0];
}

TEST_F(RedfishMockTest, ARedirectionWithinTheServiceIsFollowedAndOneElsewhereIsNot) {
  RedfishMock mock({"rack-server",
                    "",
                    {kDrives + "7=redirect:https://127.0.0.1:{port}" + kDrives + "6",
                     kDrives + "5=redirect:https://localhost:{port}" + kDrives + "5"}});
  const std::string text = mock.sourceText();
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  ASSERT_EQ(nodes.size(), 8u);
  EXPECT_EQ(nodes.back().path, prefix(mock) + kDrives + "7");
  EXPECT_EQ(nodes.back().description, "Drive Bay 6 in Rack Server") << "the body of drive 6";
  EXPECT_EQ(lines, std::vector<std::string>{logLine(
                       text, "cannot read the drive " + kDrives +
                                 "5: redirected (HTTP status 302) to https://localhost:" +
                                 std::to_string(mock.port()) + kDrives +
                                 "5, another host or port than the source names; not followed; "
                                 "its light is left out")});
  const std::vector<std::string> requests = mock.requests();
  EXPECT_EQ(std::count(requests.begin(), requests.end(), "GET " + kDrives + "7 302"), 1);
  EXPECT_EQ(std::count(requests.begin(), requests.end(), "GET " + kDrives + "6 200"), 2);
  EXPECT_EQ(mock.connections(), 1u);
}

TEST_F(RedfishMockTest, AConnectionDroppedWithoutAnAnswerEndsTheWalk) {
  RedfishMock mock({"rack-server", "", {kDrives + "6=hang-up"}});
  const std::string text = mock.sourceText();
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  EXPECT_EQ(nodes.size(), 7u) << "the chassis and drives 0 to 5";
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_TRUE(startsWith(lines[0], logLine(text, "lost the service at " + kDrives + "6: ")))
      << lines[0];
  const std::string end = "; " + kDrives +
                          "6 and the 1 link after it were not read, and their "
                          "lights are left out";
  ASSERT_GT(lines[0].size(), end.size());
  EXPECT_EQ(lines[0].substr(lines[0].size() - end.size()), end);
}

TEST_F(RedfishMockTest, AnAnswerThatNeverComesEndsTheWalkAtTheTimeout) {
  // The mock holds drive 3 back for a minute; the walk gives up after its 2 s and keeps what it
  // read before.
  RedfishMock mock({"rack-server", "", {kDrives + "3=slow:60"}});
  const std::string text = mock.sourceText("timeout=2");
  std::vector<std::string> lines;
  const std::vector<InstrumentationNode> nodes = read(text, &lines);
  EXPECT_EQ(nodes.size(), 4u) << "the chassis and drives 0 to 2";
  EXPECT_EQ(lines, std::vector<std::string>{logLine(
                       text, "ran out of time: the walk took longer than 2000 ms; " + kDrives +
                                 "3 and the 4 links after it were not read, and their lights are "
                                 "left out")});
}

TEST_F(RedfishMockTest, AServiceRootThatNeverAnswersMakesTheSourceUnusable) {
  RedfishMock mock({"rack-server", "", {"/redfish/v1/=slow:60"}});
  EXPECT_EQ(failure(mock.sourceText("timeout=500ms")), "GET /redfish/v1/: no answer within 500 ms");
}

TEST_F(RedfishMockTest, NobodyListening) {
  // The port of a mock that has stopped; its credentials file is still there.
  RedfishMock mock;
  mock.stop();
  const std::string why = failure(mock.sourceText());
  EXPECT_TRUE(startsWith(why, "GET /redfish/v1/: no connection to the service: ")) << why;
}

// ---------------------------------------------------------------------------------------------
// Certificates.

TEST_F(RedfishMockTest, ACertificateOfAnotherAuthorityIsRefused) {
  RedfishMock mock({"rack-server", redfish_test::pki().otherServer, {}});
  const std::string why = failure(mock.sourceText());
  EXPECT_TRUE(startsWith(why, "GET /redfish/v1/: the service's certificate is not accepted: "))
      << why;
  EXPECT_TRUE(mock.requests().empty()) << "nothing was asked, so no account was sent";
}

TEST_F(RedfishMockTest, ACertificateForAnotherNameIsRefused) {
  RedfishMock mock({"rack-server", redfish_test::pki().wrongName, {}});
  const std::string why = failure(mock.sourceText());
  EXPECT_TRUE(startsWith(why, "GET /redfish/v1/: the service's certificate is not accepted: "))
      << why;
  EXPECT_TRUE(mock.requests().empty());
}

TEST_F(RedfishMockTest, TheTestAuthorityIsNotTrustedWithoutCa) {
  RedfishMock mock;
  const std::string why = failure(mock.sourceTextWithoutCa());
  EXPECT_TRUE(startsWith(why, "GET /redfish/v1/: the service's certificate is not accepted: "))
      << why;
  EXPECT_TRUE(mock.requests().empty());
}

TEST_F(RedfishMockTest, TheRightCaFileAcceptsTheOtherAuthoritysCertificate) {
  RedfishMock mock({"rack-server", redfish_test::pki().otherServer, {}});
  const std::string text = mock.sourceTextWithoutCa("ca=" + redfish_test::pki().otherAuthority);
  EXPECT_EQ(read(text).size(), 9u);
}

TEST_F(RedfishMockTest, InsecureYesAcceptsAnyCertificateAndSaysSoEveryWalk) {
  RedfishMock mock({"rack-server", redfish_test::pki().wrongName, {}});
  const std::string text = mock.sourceTextWithoutCa("insecure=yes");
  std::vector<std::string> lines;
  EXPECT_EQ(read(text, &lines).size(), 9u);
  EXPECT_EQ(lines, std::vector<std::string>{logLine(
                       text,
                       "reads the service without checking its certificate (insecure=yes): "
                       "whoever can answer in its place learns the account of the credentials "
                       "file")});
}

TEST_F(RedfishMockTest, ACaFileThatCannotBeReadIsNamed) {
  RedfishMock mock;
  const std::string missing = "/nonexistent/kesta/ca.pem";
  const std::string why = failure(mock.sourceTextWithoutCa("ca=" + missing));
  EXPECT_TRUE(startsWith(
      why, "the certificate authorities file \"" + missing + "\" (ca=) cannot be read: "))
      << why;
  EXPECT_TRUE(mock.events().empty()) << "nothing was sent";
}

}  // namespace
