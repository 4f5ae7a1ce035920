#include "instrumentation/redfish/RedfishWalk.h"

#include <deque>
#include <set>
#include <string_view>
#include <type_traits>
#include <utility>

#include "instrumentation/SourceError.h"
#include "instrumentation/redfish/RedfishResources.h"

namespace Kesta {
namespace platform {

namespace {

enum class ItemKind { Page, Chassis, Storage, Drive };

// A link the walk still has to follow.
struct Item {
  ItemKind kind = ItemKind::Chassis;
  std::string path;
  std::string chassis;  // for storage resources and drives: the description of their chassis
};

const char* kindText(ItemKind kind) {
  switch (kind) {
    case ItemKind::Page:
      return "page of the Chassis collection";
    case ItemKind::Chassis:
      return "chassis";
    case ItemKind::Storage:
      return "storage resource";
    case ItemKind::Drive:
      return "drive";
  }
  return "resource";
}

const char* lostText(ItemKind kind) {
  switch (kind) {
    case ItemKind::Page:
      return "the chassis it lists are left out";
    case ItemKind::Chassis:
      return "its lights are left out";
    case ItemKind::Storage:
      return "the lights of its drives are left out";
    case ItemKind::Drive:
      return "its light is left out";
  }
  return "its lights are left out";
}

std::string millisecondsText(std::chrono::milliseconds duration) {
  return std::to_string(duration.count()) + " ms";
}

// "<path> was not read, ..." or "<path> and the <n> links after it were not read, ...".
std::string notReadText(const std::string& path, std::size_t more) {
  if (more == 0) {
    return path + " was not read, and its lights are left out";
  }
  return path + " and the " + std::to_string(more) + (more == 1 ? " link" : " links") +
         " after it were not read, and their lights are left out";
}

class Walk {
 public:
  Walk(RedfishSession& session, const RedfishWalkSettings& settings, Clock::time_point deadline)
      : session_(session), settings_(settings), deadline_(deadline) {}

  RedfishWalkResult run() {
    const RedfishServiceRoot root = readSkeleton(kRedfishServiceRoot, readRedfishServiceRoot);
    if (!root.chassis) {
      return std::move(result_);  // a service without chassis has no lights to show
    }
    seen_.insert(kRedfishServiceRoot);
    seen_.insert(*root.chassis);
    addPage(readSkeleton(*root.chassis, readRedfishCollection));

    while (!work_.empty()) {
      Item item = std::move(work_.front());
      work_.pop_front();
      RedfishAnswer answer = session_.get(item.path, deadline_);
      if (answer.kind == RedfishAnswer::Kind::TimedOut) {
        result_.problems.push_back("ran out of time: the walk took longer than " +
                                   millisecondsText(settings_.timeout) + "; " +
                                   notReadText(item.path, work_.size()));
        break;
      }
      if (answer.kind == RedfishAnswer::Kind::Lost) {
        result_.problems.push_back("lost the service at " + item.path + ": " + answer.problem +
                                   "; " + notReadText(item.path, work_.size()));
        break;
      }
      if (answer.kind == RedfishAnswer::Kind::Refused) {
        cannotRead(item, answer.problem);
        continue;
      }
      try {
        visit(item, answer.body);
      } catch (const RedfishAnswerError& error) {
        cannotRead(item, error.what());
      }
    }
    return std::move(result_);
  }

 private:
  // The service root and the first page of the collection: without them there is no walk.
  template <typename Read>
  auto readSkeleton(const std::string& path, Read read)
      -> std::invoke_result_t<Read, std::string_view> {
    RedfishAnswer answer = session_.get(path, deadline_);
    if (answer.kind == RedfishAnswer::Kind::TimedOut) {
      throw SourceError("GET " + path + ": " + answer.problem + " within " +
                        millisecondsText(settings_.timeout));
    }
    if (answer.kind != RedfishAnswer::Kind::Body) {
      throw SourceError("GET " + path + ": " + answer.problem);
    }
    try {
      return read(answer.body);
    } catch (const RedfishAnswerError& error) {
      throw SourceError("GET " + path + ": " + error.what());
    }
  }

  void cannotRead(const Item& item, const std::string& why) {
    result_.problems.push_back(std::string("cannot read the ") + kindText(item.kind) + " " +
                               item.path + ": " + why + "; " + lostText(item.kind));
  }

  void addPage(const RedfishCollectionPage& page) {
    for (const std::string& member : page.members) {
      if (seen_.insert(member).second) {
        work_.push_back({ItemKind::Chassis, member, {}});
      }
    }
    if (page.next && seen_.insert(*page.next).second) {
      work_.push_back({ItemKind::Page, *page.next, {}});
    }
  }

  // The links of one resource come next, in their order, before the links that were waiting.
  void addFirst(const std::vector<std::string>& paths, ItemKind kind, const std::string& chassis) {
    std::vector<Item> items;
    for (const std::string& path : paths) {
      if (seen_.insert(path).second) {
        items.push_back({kind, path, chassis});
      }
    }
    work_.insert(work_.begin(), std::make_move_iterator(items.begin()),
                 std::make_move_iterator(items.end()));
  }

  void addLight(const RedfishLightResource& resource, const std::string& path,
                const std::string& description) {
    std::string problem;
    if (std::optional<InstrumentationNode> node = redfishLightNode(
            resource, settings_.pathPrefix + path, description, settings_.onReport, problem)) {
      result_.nodes.push_back(std::move(*node));
    }
    if (!problem.empty()) {
      result_.problems.push_back("cannot read the identify light of " + path + ": " + problem);
    }
  }

  void visit(const Item& item, const std::string& body) {
    switch (item.kind) {
      case ItemKind::Page:
        addPage(readRedfishCollection(body));
        break;
      case ItemKind::Chassis: {
        const RedfishChassis chassis = readRedfishChassis(body);
        const std::string description = chassis.name.empty() ? item.path : chassis.name;
        addLight(chassis, item.path, description);
        if (!settings_.drives) {
          break;
        }
        // The drives the chassis links itself, else those of the storage it links.
        const bool direct = chassis.drives.present;
        const RedfishLinks& links = direct ? chassis.drives : chassis.storage;
        if (!links.problem.empty()) {
          result_.problems.push_back("cannot follow the drives of the chassis " + item.path + ": " +
                                     links.problem + "; their lights are left out");
          break;
        }
        addFirst(links.paths, direct ? ItemKind::Drive : ItemKind::Storage, description);
        break;
      }
      case ItemKind::Storage: {
        const RedfishLinks drives = readRedfishStorage(body);
        if (!drives.problem.empty()) {
          result_.problems.push_back("cannot follow the drives of the storage resource " +
                                     item.path + ": " + drives.problem +
                                     "; their lights are left out");
          break;
        }
        addFirst(drives.paths, ItemKind::Drive, item.chassis);
        break;
      }
      case ItemKind::Drive: {
        const RedfishLightResource drive = readRedfishDrive(body);
        addLight(drive, item.path,
                 (drive.name.empty() ? item.path : drive.name) + " in " + item.chassis);
        break;
      }
    }
  }

  RedfishSession& session_;
  const RedfishWalkSettings& settings_;
  Clock::time_point deadline_;
  RedfishWalkResult result_;
  std::deque<Item> work_;
  std::set<std::string> seen_;  // every path queued once, so that no link is read twice
};

}  // namespace

RedfishSession::~RedfishSession() = default;

RedfishWalkResult walkRedfishService(RedfishSession& session, const RedfishWalkSettings& settings,
                                     Clock::time_point deadline) {
  return Walk(session, settings, deadline).run();
}

}  // namespace platform
}  // namespace Kesta
