// The platform's instrumentation library: a cursor over the hardware instrumentation tree.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_H
#define KESTA_PLATFORM_INSTRUMENTATION_H

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

namespace Kesta {

// The vocabulary of the instrumentation tree.
struct NodeLexicon {
  enum NodeType : unsigned int {
    NODE_TYPE_BLUE_LIGHT = 26,
  };
  enum Properties : unsigned int {
    PROPERTY_ALARM_STATE = 1,
  };
};

namespace platform {
struct InstrumentationNode;
class InstrumentationSource;
}  // namespace platform

// A cursor over the nodes of the instrumentation tree, read once when the cursor is opened.
//
// The source is chosen by KESTA_INSTRUMENTATION (read at every opening), else by the first line
// of /etc/kesta/instrumentation.conf, else sysfs:/sys/class/leds. A source that is configured but
// cannot be read or parsed is reported with one line to the log at level 6000, and the
// constructor then throws a std::exception.
class Instrumentation {
 public:
  Instrumentation();
  // A cursor over the nodes of a given source (tests and tools).
  explicit Instrumentation(std::unique_ptr<platform::InstrumentationSource> source);
  ~Instrumentation();
  Instrumentation(const Instrumentation&) = delete;
  Instrumentation& operator=(const Instrumentation&) = delete;

  // Restricts the cursor to the nodes of `type` and stands on the first of them. False when
  // there is none.
  bool selectNode(NodeLexicon::NodeType type);
  // True while the cursor stands on a node.
  explicit operator bool() const;
  // Steps to the next node (of the selected type, once one is selected).
  Instrumentation& operator++();

  // The current node's path in the source's own form.
  std::string getPathToNode();
  // A path of getPathToNode() as printable text.
  std::string convertPathToString(const std::string& path);
  // The current node's description.
  std::string getNodeDescription();
  // The current node's status code; 0 when it has none.
  unsigned int getNodeStatus();
  // Reads one numeric property of the current node; false when the node does not have it.
  bool getProperty(NodeLexicon::Properties property, unsigned int& value);

 private:
  void skipUnselected();

  std::vector<platform::InstrumentationNode> nodes_;
  std::size_t position_ = 0;
  bool typeSelected_ = false;
  unsigned int selectedType_ = 0;
};

}  // namespace Kesta

#endif  // KESTA_PLATFORM_INSTRUMENTATION_H
