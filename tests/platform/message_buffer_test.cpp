// VNLog::VNMessageBuffer: a stream that hands its text out once and is ready again.
#include <gtest/gtest.h>

#include <iomanip>
#include <sstream>
#include <string>

#include "VNLog.h"

namespace {

using VNLog::VNMessageBuffer;

TEST(MessageBuffer, CollectsWhatIsWritten) {
  VNMessageBuffer buffer;
  buffer << " vectBlueLight="
         << "x";
  static_cast<std::ostream&>(buffer) << 42 << ' ' << static_cast<const void*>(nullptr);
  EXPECT_EQ(VNMessageBuffer::str(buffer), " vectBlueLight=x42 0");
}

TEST(MessageBuffer, StrTakesTheTextOut) {
  VNMessageBuffer buffer;
  buffer << "first";
  EXPECT_EQ(VNMessageBuffer::str(buffer), "first");
  EXPECT_EQ(VNMessageBuffer::str(buffer), "");
  buffer << "second";
  EXPECT_EQ(VNMessageBuffer::str(buffer), "second");
}

TEST(MessageBuffer, NullPointerFailsTheStreamLikeOstream) {
  std::ostringstream reference;
  reference << "a" << static_cast<const char*>(nullptr) << "b";

  VNMessageBuffer buffer;
  buffer << "a" << static_cast<const char*>(nullptr) << "b";
  std::ostream& stream = buffer;
  EXPECT_EQ(stream.rdstate(), reference.rdstate());
  EXPECT_TRUE(stream.bad());
  stream << 7;
  EXPECT_EQ(VNMessageBuffer::str(buffer), reference.str());
  EXPECT_EQ(VNMessageBuffer::str(buffer), "");
}

TEST(MessageBuffer, StrClearsTheFailedState) {
  VNMessageBuffer buffer;
  buffer << static_cast<const char*>(nullptr);
  VNMessageBuffer::str(buffer);
  std::ostream& stream = buffer;
  EXPECT_TRUE(stream.good());
  buffer << "again";
  EXPECT_EQ(VNMessageBuffer::str(buffer), "again");
}

TEST(MessageBuffer, StrOfItsStreamWorksLikeStrOfTheBuffer) {
  VNMessageBuffer buffer;
  std::ostream& stream = buffer;
  stream << std::hex << 255;
  EXPECT_EQ(VNMessageBuffer::str(stream), "ff");
  EXPECT_EQ(VNMessageBuffer::str(buffer), "");
  stream << "x";
  EXPECT_EQ(VNMessageBuffer::str(buffer), "x");
}

TEST(MessageBuffer, StrOfAnotherStreamIsEmptyAndLeavesItAlone) {
  std::ostringstream other;
  other << "not ours";
  EXPECT_EQ(VNMessageBuffer::str(other), "");
  EXPECT_EQ(other.str(), "not ours");
}

TEST(MessageBuffer, BuffersAreIndependent) {
  VNMessageBuffer first;
  VNMessageBuffer second;
  first << "one";
  second << "two";
  EXPECT_EQ(VNMessageBuffer::str(static_cast<std::ostream&>(second)), "two");
  EXPECT_EQ(VNMessageBuffer::str(first), "one");
}

}  // namespace
