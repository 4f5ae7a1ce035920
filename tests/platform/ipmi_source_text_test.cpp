// The text of the IPMI sources: "ipmi:[<device>][?options]" and
// "ipmi-lan:<host>[:<port>]?credentials=<file>[&options]".
#include <gtest/gtest.h>

#include <chrono>
#include <string>

#include "instrumentation/InstrumentationSource.h"
#include "instrumentation/ipmi/IpmiSource.h"

namespace {

using namespace std::chrono_literals;
using Kesta::platform::ipmiDevicePath;
using Kesta::platform::IpmiDeviceSourceSettings;
using Kesta::platform::ipmiLanPath;
using Kesta::platform::IpmiLanSourceSettings;
using Kesta::platform::makeInstrumentationSource;
using Kesta::platform::OnReport;
using Kesta::platform::parseIpmiDeviceSource;
using Kesta::platform::parseIpmiLanSource;
using Kesta::platform::SourceError;

std::string deviceError(const std::string& rest) {
  try {
    parseIpmiDeviceSource(rest);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(accepted)";
}

std::string lanError(const std::string& rest) {
  try {
    parseIpmiLanSource(rest);
  } catch (const SourceError& error) {
    return error.what();
  }
  return "(accepted)";
}

TEST(IpmiDeviceSourceText, DefaultsToTheFirstDevice) {
  const IpmiDeviceSourceSettings settings = parseIpmiDeviceSource("");
  EXPECT_EQ(settings.device, "/dev/ipmi0");
  EXPECT_EQ(settings.options.description, "Blue Light");
  EXPECT_EQ(settings.options.timeout, 1000ms);
  EXPECT_EQ(settings.options.onReport, OnReport::Alternating);
  EXPECT_EQ(ipmiDevicePath(settings), "ipmi:/dev/ipmi0");
}

TEST(IpmiDeviceSourceText, NamesAnotherDevice) {
  const IpmiDeviceSourceSettings settings = parseIpmiDeviceSource("/dev/ipmi1");
  EXPECT_EQ(settings.device, "/dev/ipmi1");
  EXPECT_EQ(ipmiDevicePath(settings), "ipmi:/dev/ipmi1");
}

TEST(IpmiDeviceSourceText, TakesOptions) {
  const IpmiDeviceSourceSettings settings =
      parseIpmiDeviceSource("?description=Front%20ID%20%26%20rear&timeout=250ms&on=steady");
  EXPECT_EQ(settings.device, "/dev/ipmi0");
  EXPECT_EQ(settings.options.description, "Front ID & rear");
  EXPECT_EQ(settings.options.timeout, 250ms);
  EXPECT_EQ(settings.options.onReport, OnReport::Steady);
}

TEST(IpmiDeviceSourceText, DescriptionMayHoldBlanksAndUtf8) {
  EXPECT_EQ(parseIpmiDeviceSource("/dev/ipmi0?description=Blaue Leuchte").options.description,
            "Blaue Leuchte");
  EXPECT_EQ(parseIpmiDeviceSource("?description=Voyant%20bleu%C3%A9").options.description,
            "Voyant bleu\xc3\xa9");
}

TEST(IpmiDeviceSourceText, TimeoutForms) {
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=2").options.timeout, 2000ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=2s").options.timeout, 2000ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=0.5").options.timeout, 500ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=1.25").options.timeout, 1250ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=0.01").options.timeout, 10ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=60").options.timeout, 60000ms);
  EXPECT_EQ(parseIpmiDeviceSource("?timeout=10ms").options.timeout, 10ms);
  EXPECT_EQ(parseIpmiDeviceSource("?on=ALTERNATING").options.onReport, OnReport::Alternating);
}

TEST(IpmiDeviceSourceText, RefusesWhatItCannotUse) {
  EXPECT_EQ(deviceError("bmc0"),
            "the IPMI device \"bmc0\" is not an absolute path such as /dev/ipmi0 (a BMC on the "
            "network is ipmi-lan:<host>?credentials=<file>)");
  EXPECT_EQ(deviceError("?timeout=0"), "timeout=0 is outside 10 ms to 60 s");
  EXPECT_EQ(deviceError("?timeout=61"), "timeout=61 is outside 10 ms to 60 s");
  EXPECT_EQ(deviceError("?timeout=9ms"), "timeout=9ms is outside 10 ms to 60 s");
  EXPECT_EQ(deviceError("?timeout=0.0005"), "timeout=0.0005 is finer than a millisecond");
  EXPECT_EQ(deviceError("?timeout=1.5ms"), "timeout=1.5ms is finer than a millisecond");
  for (const char* bad : {"?timeout=", "?timeout=x", "?timeout=-1", "?timeout=1.", "?timeout=.5",
                          "?timeout=1h", "?timeout=1 s", "?timeout=1e3"}) {
    EXPECT_NE(deviceError(bad).find("is not a duration"), std::string::npos) << bad;
  }
  EXPECT_EQ(deviceError("?on=blinking"), "on=blinking must be on=alternating or on=steady");
  EXPECT_EQ(deviceError("?description="), "description= names no description");
  EXPECT_EQ(deviceError("?description=%20%20"), "description= names no description");
  EXPECT_EQ(deviceError("?description=a%0Ab"),
            "description= must be UTF-8 text without control characters");
  EXPECT_EQ(deviceError("?description=%FF"),
            "description= must be UTF-8 text without control characters");
  EXPECT_EQ(deviceError("?description=100%"),
            "the value of \"description\" has a '%' that is not followed by two hexadecimal "
            "digits");
  EXPECT_EQ(deviceError("?description=%zz"),
            "the value of \"description\" has a '%' that is not followed by two hexadecimal "
            "digits");
  EXPECT_EQ(deviceError("?colour=blue"),
            "unknown option \"colour\" (expected description, timeout or on)");
  EXPECT_EQ(deviceError("?credentials=/etc/kesta/bmc"),
            "unknown option \"credentials\" (expected description, timeout or on)");
  EXPECT_EQ(deviceError("?on=steady&on=steady"), "the option \"on\" is given twice");
  for (const char* bad : {"?", "?on", "?=steady", "?on=steady&", "?on=steady&&timeout=1"}) {
    EXPECT_EQ(deviceError(bad), "the options after '?' must be name=value pairs joined by '&'")
        << bad;
  }
}

TEST(IpmiLanSourceText, HostWithDefaultPort) {
  const IpmiLanSourceSettings settings =
      parseIpmiLanSource("BMC-01.example.net?credentials=/etc/k/bmc");
  EXPECT_EQ(settings.host, "bmc-01.example.net");
  EXPECT_EQ(settings.port, 623u);
  EXPECT_EQ(settings.credentialsFile, "/etc/k/bmc");
  EXPECT_EQ(ipmiLanPath(settings), "ipmi-lan:bmc-01.example.net:623");
}

TEST(IpmiLanSourceText, AddressPortAndOptions) {
  const IpmiLanSourceSettings settings = parseIpmiLanSource(
      "10.1.2.3:6230?timeout=0.3&credentials=/etc/kesta/bmc%26co.conf&on=steady&description=Rack "
      "7");
  EXPECT_EQ(settings.host, "10.1.2.3");
  EXPECT_EQ(settings.port, 6230u);
  EXPECT_EQ(settings.credentialsFile, "/etc/kesta/bmc&co.conf");
  EXPECT_EQ(settings.options.timeout, 300ms);
  EXPECT_EQ(settings.options.onReport, OnReport::Steady);
  EXPECT_EQ(settings.options.description, "Rack 7");
  EXPECT_EQ(ipmiLanPath(settings), "ipmi-lan:10.1.2.3:6230");
}

TEST(IpmiLanSourceText, Ipv6InBrackets) {
  const IpmiLanSourceSettings withPort = parseIpmiLanSource("[FD00::5]:624?credentials=/c");
  EXPECT_EQ(withPort.host, "fd00::5");
  EXPECT_EQ(withPort.port, 624u);
  EXPECT_EQ(ipmiLanPath(withPort), "ipmi-lan:[fd00::5]:624");
  const IpmiLanSourceSettings withoutPort = parseIpmiLanSource("[::1]?credentials=/c");
  EXPECT_EQ(withoutPort.host, "::1");
  EXPECT_EQ(withoutPort.port, 623u);
  EXPECT_EQ(ipmiLanPath(withoutPort), "ipmi-lan:[::1]:623");
}

TEST(IpmiLanSourceText, RefusesWhatItCannotUse) {
  EXPECT_EQ(lanError(""), "no host is named after \"ipmi-lan:\"");
  EXPECT_EQ(lanError("?credentials=/c"), "no host is named after \"ipmi-lan:\"");
  EXPECT_EQ(lanError("bmc"),
            "a BMC on the network needs credentials=<file>, a file that only its owner can read");
  EXPECT_EQ(lanError("bmc?timeout=2"),
            "a BMC on the network needs credentials=<file>, a file that only its owner can read");
  EXPECT_EQ(lanError("bmc?credentials="),
            "a BMC on the network needs credentials=<file>, a file that only its owner can read");
  EXPECT_EQ(lanError("bmc?credentials=bmc.conf"), "credentials=bmc.conf is not an absolute path");
  EXPECT_EQ(lanError("bmc?credentials=/c&user=admin"),
            "unknown option \"user\" (expected credentials, description, timeout or on)");
  EXPECT_EQ(lanError("bmc?credentials=/c&password=x"),
            "unknown option \"password\" (expected credentials, description, timeout or on)");
  EXPECT_EQ(lanError("bmc:0?credentials=/c"), "the port \"0\" is not a number from 1 to 65535");
  EXPECT_EQ(lanError("bmc:65536?credentials=/c"),
            "the port \"65536\" is not a number from 1 to 65535");
  EXPECT_EQ(lanError("bmc:x?credentials=/c"), "the port \"x\" is not a number from 1 to 65535");
  EXPECT_EQ(lanError("bmc:?credentials=/c"), "no port follows the ':' after the host");
  EXPECT_EQ(lanError("fd00::5?credentials=/c"),
            "an IPv6 address is written in brackets, e.g. ipmi-lan:[fd00::5]:623");
  EXPECT_EQ(lanError("[fd00::5?credentials=/c"), "the address \"[fd00::5\" has no closing ']'");
  EXPECT_EQ(lanError("[fd00::5]x?credentials=/c"),
            "only \":<port>\" may follow the address in brackets");
  EXPECT_EQ(lanError("[fd00::5]:?credentials=/c"), "no port follows the ':' after the address");
  EXPECT_EQ(lanError("[bmc]?credentials=/c"), "\"bmc\" in brackets is not an IPv6 address");
  EXPECT_EQ(lanError("user@bmc?credentials=/c"), "\"user@bmc\" is not a host name or IPv4 address");
  EXPECT_EQ(lanError("bmc/x?credentials=/c"), "\"bmc/x\" is not a host name or IPv4 address");
}

TEST(IpmiSourceText, TheFactoryKnowsBothSchemes) {
  EXPECT_EQ(makeInstrumentationSource("ipmi:")->name(), "ipmi:");
  EXPECT_EQ(makeInstrumentationSource("ipmi:/dev/ipmi2?timeout=2")->name(),
            "ipmi:/dev/ipmi2?timeout=2");
  // Making a network source reads nothing yet: the credentials are read by every read.
  EXPECT_EQ(makeInstrumentationSource("ipmi-lan:bmc?credentials=/nonexistent")->name(),
            "ipmi-lan:bmc?credentials=/nonexistent");
  EXPECT_THROW(makeInstrumentationSource("ipmi:bmc0"), SourceError);
  EXPECT_THROW(makeInstrumentationSource("ipmi-lan:bmc"), SourceError);
}

}  // namespace
