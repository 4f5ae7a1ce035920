// The trace formatters, the emission of a message to the logger, and the module's exception.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "KestaTrace.h"
#include "TestSupport.h"

namespace {

using Kesta::ENTERING;
using Kesta::EXITING;
using Kesta::MESSAGE;
using Kesta::METHOD;
// The pointer inserter of the message buffer; the check does not see its use through templates.
using Kesta::operator<<;  // NOLINT(misc-unused-using-decls)
using testsupport::LogCapture;
using testsupport::LogLine;

TEST(Trace, EnteringLineNamesFunctionFileAndLine) {
  EXPECT_STREQ(Kesta::trace("BlueLightProvider", "BlueLight_GetInstance", 182, ENTERING),
               "ENTERING: BlueLight_GetInstance() in BlueLightProvider [Line: 182]");
}

TEST(Trace, EveryTypeHasItsFormat) {
  EXPECT_STREQ(Kesta::trace("F.cpp", "fn", 1, EXITING), "EXITING: fn() in F.cpp [Line: 1]");
  EXPECT_STREQ(Kesta::trace("F.cpp", "fn", 2, METHOD),
               "METHOD: fn() was invoked in F.cpp [Line: 2]");
  EXPECT_STREQ(Kesta::trace("F.cpp", "Something happened.", 3, MESSAGE),
               "MESSAGE [File: F.cpp, Line: 3]: Something happened.");
}

TEST(Trace, ParameterFormatsAppendTheList) {
  EXPECT_STREQ(Kesta::tracepara("F.cpp", "fn", 10, " a=1 b=2", ENTERING),
               "ENTERING: fn() in F.cpp [Line: 10],Parameters List:  a=1 b=2");
  EXPECT_STREQ(Kesta::tracepara("F.cpp", "fn", 11, " a=1", EXITING),
               "EXITING: fn() in F.cpp [Line: 11],Parameters List:  a=1");
  EXPECT_STREQ(Kesta::tracepara("F.cpp", "fn", 12, " a=1", METHOD),
               "METHOD: fn() was invoked in F.cpp [Line: 12],Parameters List:  a=1");
}

TEST(Trace, MessageWithListEndsInColonAndTwoBlanksBeforeTheList) {
  const std::string text = Kesta::tracepara("BlueLight", "Oops", 7, " key=value", MESSAGE);
  EXPECT_EQ(text, "MESSAGE [File: BlueLight, Line: 7]: Oops,Parameters List:  key=value");
  const std::string beforeList = text.substr(0, text.size() - std::strlen("key=value"));
  ASSERT_GE(beforeList.size(), 3u);
  EXPECT_EQ(beforeList.substr(beforeList.size() - 3), ":  ");
}

TEST(Trace, UnknownTypeYieldsEmptyText) {
  EXPECT_STREQ(Kesta::trace("F.cpp", "fn", 1, static_cast<Kesta::MessageType>(4)), "");
  EXPECT_STREQ(Kesta::tracepara("F.cpp", "fn", 1, " a=1", static_cast<Kesta::MessageType>(4)), "");
}

TEST(Trace, ConsecutiveCallsShareOneBuffer) {
  char* first = Kesta::trace("F.cpp", "first", 1, ENTERING);
  const std::string firstText = first;
  char* second = Kesta::trace("F.cpp", "second", 2, ENTERING);
  EXPECT_EQ(first, second);
  EXPECT_EQ(firstText, "ENTERING: first() in F.cpp [Line: 1]");
  EXPECT_STREQ(first, "ENTERING: second() in F.cpp [Line: 2]");
}

TEST(Trace, FormattersHaveSeparateBuffers) {
  char* plain = Kesta::trace("F.cpp", "plain", 1, ENTERING);
  char* withList = Kesta::tracepara("F.cpp", "listed", 2, " a=1", ENTERING);
  EXPECT_NE(plain, withList);
  EXPECT_STREQ(plain, "ENTERING: plain() in F.cpp [Line: 1]");
}

TEST(Trace, LongTextIsCutTo511Characters) {
  const std::string description(2000, 'x');
  char* text = Kesta::tracepara("F.cpp", "fn", 1, description.c_str(), ENTERING);
  EXPECT_EQ(std::strlen(text), 511u);
  const std::string expectedStart = "ENTERING: fn() in F.cpp [Line: 1],Parameters List: xxx";
  EXPECT_EQ(std::string(text).substr(0, expectedStart.size()), expectedStart);
  char* message = Kesta::trace("F.cpp", description.c_str(), 1, MESSAGE);
  EXPECT_EQ(std::strlen(message), 511u);
}

TEST(Trace, ShorterTextLeavesNoRemainsOfALongerOne) {
  const std::string longText(600, 'y');
  Kesta::trace("F.cpp", longText.c_str(), 1, MESSAGE);
  char* text = Kesta::trace("F.cpp", "short", 1, MESSAGE);
  EXPECT_STREQ(text, "MESSAGE [File: F.cpp, Line: 1]: short");
  EXPECT_EQ(text[std::strlen(text) + 1], '\0');
  EXPECT_EQ(text[Kesta::kMessageBufferSize - 1], '\0');
}

TEST(Trace, PrintfDirectivesInTextsAreWrittenLiterally) {
  EXPECT_STREQ(Kesta::tracepara("F.cpp", "fn", 5, " d=%s%n%d", ENTERING),
               "ENTERING: fn() in F.cpp [Line: 5],Parameters List:  d=%s%n%d");
}

TEST(Trace, PointerInserterWritesTheAddressLikeAStream) {
  VNLog::VNMessageBuffer buffer;
  int value = 0;
  int* pointer = &value;
  std::ostringstream expected;
  expected << " p=" << static_cast<const void*>(pointer)
           << " n=" << static_cast<const void*>(nullptr);
  buffer << " p=" << pointer << " n=" << static_cast<int*>(nullptr);
  EXPECT_EQ(VNLog::VNMessageBuffer::str(buffer), expected.str());
}

TEST(Trace, NullTextInAListStopsTheList) {
  VNLog::VNMessageBuffer buffer;
  const char* missing = nullptr;
  std::ostream& stream = buffer << " a=" << static_cast<int*>(nullptr);
  stream << " b=" << missing << " c="
         << "text";
  EXPECT_EQ(VNLog::VNMessageBuffer::str(buffer), " a=0 b=");
  // The buffer is usable again afterwards.
  buffer << " d=1";
  EXPECT_EQ(VNLog::VNMessageBuffer::str(buffer), " d=1");
}

// What one emission writes: the same line at log level, then at trace level.
TEST(TraceEmission, LineGoesToLogLevelThenTraceLevel) {
  LogCapture log;
  const std::string category = "Varnel.Test";
  const char* const kSourceFile = "Unit.cpp";
  auto parameters = [](VNLog::VNMessageBuffer& list) { list << " a=1"; };
  const int line = __LINE__ + 1;
  Kesta::emitTracePara("someFunction", kSourceFile, line, category, 3000, ENTERING, parameters);

  const std::string text = "ENTERING: someFunction() in Unit.cpp [Line: " + std::to_string(line) +
                           "],Parameters List:  a=1";
  const std::vector<LogLine> expected = {{category, 3000, "LOG", text},
                                         {category, 3000, "TRACE", text}};
  EXPECT_EQ(log.lines(), expected);
}

TEST(TraceEmission, ParameterListIsBuiltForEachLevel) {
  LogCapture log;
  int builds = 0;
  auto parameters = [&builds](VNLog::VNMessageBuffer& list) {
    ++builds;
    list << " n=1";
  };
  Kesta::emitTracePara("f", "U.cpp", 1, "Varnel.Test", 3000, EXITING, parameters);
  EXPECT_EQ(builds, 2);
  ASSERT_EQ(log.lines().size(), 2u);
  EXPECT_EQ(log.lines()[0].text, log.lines()[1].text);
}

TEST(TraceEmission, MessageWithoutList) {
  LogCapture log;
  Kesta::emitTrace("f", "U.cpp", 9, "Varnel.Test", 6000, MESSAGE, "It failed.");
  const std::vector<LogLine> expected = {
      {"Varnel.Test", 6000, "LOG", "MESSAGE [File: U.cpp, Line: 9]: It failed."},
      {"Varnel.Test", 6000, "TRACE", "MESSAGE [File: U.cpp, Line: 9]: It failed."}};
  EXPECT_EQ(log.lines(), expected);
}

TEST(TraceEmission, MacroPassesTheCallersNameAndLine) {
  LogCapture log;
  const char* const kSourceFile = "Macro.cpp";
  auto parameters = [](VNLog::VNMessageBuffer& list) { list << " x=2"; };
  const int line = __LINE__ + 1;
  KESTA_TRACE_PARA("Varnel.Test", 3000, ENTERING, parameters);
  ASSERT_EQ(log.lines().size(), 2u);
  EXPECT_EQ(log.lines()[0].text, "ENTERING: TestBody() in Macro.cpp [Line: " +
                                     std::to_string(line) + "],Parameters List:  x=2");
}

// A helper that writes the entry line of the function calling it names that function and line.
void traceOnBehalfOf(const Kesta::TraceSite& site) {
  auto parameters = [](VNLog::VNMessageBuffer& list) { list << " y=3"; };
  Kesta::emitTracePara(site, "Site.cpp", "Varnel.Test", 3000, ENTERING, parameters);
}

TEST(TraceEmission, SiteNamesTheCallerNotTheHelper) {
  LogCapture log;
  const int line = __LINE__ + 1;
  traceOnBehalfOf(KESTA_TRACE_SITE);
  const std::string text =
      "ENTERING: TestBody() in Site.cpp [Line: " + std::to_string(line) + "],Parameters List:  y=3";
  const std::vector<LogLine> expected = {{"Varnel.Test", 3000, "LOG", text},
                                         {"Varnel.Test", 3000, "TRACE", text}};
  EXPECT_EQ(log.lines(), expected);
}

TEST(TraceEmission, NothingBelowTheThreshold) {
  LogCapture log(6000);
  int builds = 0;
  auto parameters = [&builds](VNLog::VNMessageBuffer& list) {
    ++builds;
    list << " n=1";
  };
  Kesta::emitTracePara("f", "U.cpp", 1, "Varnel.Test", 3000, ENTERING, parameters);
  EXPECT_TRUE(log.lines().empty());
  // A dropped line is not even formatted.
  EXPECT_EQ(builds, 0);
  Kesta::emitTrace("f", "U.cpp", 1, "Varnel.Test", 6000, MESSAGE, "kept");
  EXPECT_EQ(log.lines().size(), 2u);
}

TEST(ProviderException, HoldsItsMessage) {
  Kesta::ProviderException error("Failed while setting Device ID");
  EXPECT_STREQ(error.what(), "Failed while setting Device ID");
  // A copy of its own is what the test is about.
  // NOLINTNEXTLINE(performance-unnecessary-copy-initialization)
  const Kesta::ProviderException copy(error);
  EXPECT_STREQ(copy.what(), "Failed while setting Device ID");
  EXPECT_NE(copy.what(), error.what());
}

TEST(ProviderException, IsCaughtAsStdException) {
  try {
    throw Kesta::ProviderException("Failed while setting Element Name");
  } catch (const std::exception& error) {
    EXPECT_STREQ(error.what(), "Failed while setting Element Name");
    return;
  }
  FAIL() << "not caught";
}

TEST(ProviderException, NullMessageIsEmpty) {
  Kesta::ProviderException error(nullptr);
  EXPECT_STREQ(error.what(), "");
}

}  // namespace
