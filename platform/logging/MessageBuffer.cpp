#include <string>

#include "VNLog.h"

namespace VNLog {

VNMessageBuffer::VNMessageBuffer() = default;
VNMessageBuffer::~VNMessageBuffer() = default;

VNMessageBuffer& VNMessageBuffer::operator<<(const char* text) {
  if (text == nullptr) {
    // What std::ostream does for a null character pointer: nothing is written and the stream
    // fails, so later inserts write nothing either.
    stream_.setstate(std::ios_base::badbit);
  } else {
    stream_ << text;
  }
  return *this;
}

VNMessageBuffer::operator std::ostream&() { return stream_; }

std::string VNMessageBuffer::take(Stream& stream) {
  std::string text = stream.str();
  stream.str(std::string());
  stream.clear();
  return text;
}

std::string VNMessageBuffer::str(VNMessageBuffer& buffer) { return take(buffer.stream_); }

std::string VNMessageBuffer::str(std::ostream& stream) {
  if (auto* own = dynamic_cast<Stream*>(&stream)) {
    return take(*own);
  }
  return std::string();
}

}  // namespace VNLog
