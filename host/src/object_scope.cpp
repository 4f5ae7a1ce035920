#include "object_scope.h"

#include <cstdlib>
#include <cstring>
#include <iterator>
#include <vector>

#include "broker_core.h"

namespace cmpihost::detail {

namespace {

thread_local std::vector<ObjectScope*> tCurrentScopes;

// One block of broker-managed memory; it frees the block when the scope frees it.
class MemoryBlock final : public ManagedObject {
 public:
  MemoryBlock(ObjectScope& scope, void* address) : ManagedObject(scope), address_(address) {}
  MemoryBlock(const MemoryBlock&) = delete;
  MemoryBlock& operator=(const MemoryBlock&) = delete;
  ~MemoryBlock() override { std::free(address_); }

  void* memoryAddress() const override { return address_; }
  void setAddress(void* address) { address_ = address; }

 private:
  void* address_;
};

}  // namespace

ObjectScope* currentScope() { return tCurrentScopes.empty() ? nullptr : tCurrentScopes.back(); }

void pushCurrentScope(ObjectScope* scope) { tCurrentScopes.push_back(scope); }

void removeCurrentScope(ObjectScope* scope) {
  for (auto it = tCurrentScopes.rbegin(); it != tCurrentScopes.rend(); ++it) {
    if (*it == scope) {
      tCurrentScopes.erase(std::next(it).base());
      return;
    }
  }
}

// ---- ManagedObject ----------------------------------------------------------------------------

ManagedObject::ManagedObject(ObjectScope& scope) : scope_(&scope) { scope.core().objectCreated(); }

ManagedObject::~ManagedObject() { scope_->core().objectDestroyed(); }

BrokerCore& ManagedObject::core() const { return scope_->core(); }

// ---- ObjectScope ------------------------------------------------------------------------------

ObjectScope::ObjectScope(BrokerCore& core, RequestState* request)
    : core_(&core), request_(request) {}

ObjectScope::~ObjectScope() {
  std::lock_guard<std::mutex> lock(mutex_);
  ManagedObject* object = head_;
  while (object != nullptr) {
    ManagedObject* next = object->next_;
    delete object;
    object = next;
  }
  head_ = tail_ = nullptr;
  count_ = 0;
  memory_.clear();
}

void ObjectScope::adopt(ManagedObject* object) {
  std::lock_guard<std::mutex> lock(mutex_);
  object->sequence_ = nextSequence_++;
  object->prev_ = tail_;
  object->next_ = nullptr;
  if (tail_ != nullptr) {
    tail_->next_ = object;
  } else {
    head_ = object;
  }
  tail_ = object;
  ++count_;
  if (void* address = object->memoryAddress()) memory_[address] = object;
}

void ObjectScope::unlinkLocked(ManagedObject* object) {
  if (object->prev_ != nullptr) {
    object->prev_->next_ = object->next_;
  } else {
    head_ = object->next_;
  }
  if (object->next_ != nullptr) {
    object->next_->prev_ = object->prev_;
  } else {
    tail_ = object->prev_;
  }
  object->prev_ = object->next_ = nullptr;
  --count_;
  if (void* address = object->memoryAddress()) memory_.erase(address);
}

bool ObjectScope::destroy(ManagedObject* object) {
  if (object == nullptr || object->pinned()) return false;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    unlinkLocked(object);
  }
  // Deleted outside the lock: a destructor may take other locks (a mark forgets itself in the
  // broker), and nothing else can reach the object any more.
  delete object;
  return true;
}

std::uint64_t ObjectScope::nextSequence() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return nextSequence_;
}

void ObjectScope::destroyFrom(std::uint64_t sequence) {
  ManagedObject* doomed = nullptr;  // singly linked through next_ after unlinking
  {
    std::lock_guard<std::mutex> lock(mutex_);
    ManagedObject* object = tail_;
    while (object != nullptr && object->sequence_ >= sequence) {
      ManagedObject* previous = object->prev_;
      if (!object->pinned()) {
        unlinkLocked(object);
        object->next_ = doomed;
        doomed = object;
      }
      object = previous;
    }
  }
  while (doomed != nullptr) {
    ManagedObject* next = doomed->next_;
    delete doomed;
    doomed = next;
  }
}

std::size_t ObjectScope::size() const {
  std::lock_guard<std::mutex> lock(mutex_);
  return count_;
}

void* ObjectScope::allocate(std::size_t size, bool zeroed) {
  // malloc(0) may return null; a broker should hand out a usable pointer for it.
  void* address = zeroed ? std::calloc(size == 0 ? 1 : size, 1) : std::malloc(size == 0 ? 1 : size);
  if (address == nullptr) return nullptr;
  make<MemoryBlock>(address);
  return address;
}

void* ObjectScope::reallocate(void* address, std::size_t size, bool& found) {
  std::lock_guard<std::mutex> lock(mutex_);
  const auto it = memory_.find(address);
  found = it != memory_.end();
  if (!found) return nullptr;
  void* moved = std::realloc(address, size == 0 ? 1 : size);
  if (moved == nullptr) return nullptr;  // the old block stays valid and owned
  auto* block = static_cast<MemoryBlock*>(it->second);
  memory_.erase(it);
  block->setAddress(moved);
  memory_[moved] = block;
  return moved;
}

bool ObjectScope::freeMemory(void* address) {
  ManagedObject* block = nullptr;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    const auto it = memory_.find(address);
    if (it == memory_.end()) return false;
    block = it->second;
    unlinkLocked(block);
  }
  delete block;
  return true;
}

}  // namespace cmpihost::detail
