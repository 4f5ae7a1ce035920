// Ownership of broker objects.
//
// Every object the broker hands out is a ManagedObject that belongs to exactly one ObjectScope:
// the scope of a request, or the broker's own scope. A scope frees what it still owns when it
// ends; releasing an object early unlinks it first, so the two never free the same object.
//
// Which scope a new object goes to is decided by the thread-local "current scope", which a
// Request sets on its thread for its lifetime (and a ScopeGuard on another thread).
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <utility>

namespace cmpihost::detail {

class BrokerCore;
class ObjectScope;
class RequestState;

/// Base of everything a scope owns. Objects are made only through ObjectScope::make and freed
/// only by their scope.
class ManagedObject {
 public:
  explicit ManagedObject(ObjectScope& scope);
  virtual ~ManagedObject();
  ManagedObject(const ManagedObject&) = delete;
  ManagedObject& operator=(const ManagedObject&) = delete;

  ObjectScope& scope() const { return *scope_; }
  BrokerCore& core() const;

  /// A pinned object survives CMRelease; the request's own context and result are pinned
  /// because the host keeps using them after the provider returns.
  bool pinned() const { return pinned_; }
  void pin() { pinned_ = true; }

  /// For blocks of broker-managed memory: the address handed out; null for every other object.
  virtual void* memoryAddress() const { return nullptr; }

 private:
  friend class ObjectScope;

  ObjectScope* scope_;
  ManagedObject* prev_ = nullptr;
  ManagedObject* next_ = nullptr;
  std::uint64_t sequence_ = 0;  // creation order within the scope, for mark/release
  bool pinned_ = false;
};

/// The objects of one request (or of the broker itself), in creation order.
class ObjectScope {
 public:
  /// `request` is null for the broker's own scope.
  ObjectScope(BrokerCore& core, RequestState* request);
  /// Frees every object still owned.
  ~ObjectScope();
  ObjectScope(const ObjectScope&) = delete;
  ObjectScope& operator=(const ObjectScope&) = delete;

  BrokerCore& core() const { return *core_; }
  RequestState* request() const { return request_; }

  /// Creates an object owned by this scope.
  template <class T, class... Args>
  T* make(Args&&... args) {
    auto object = std::make_unique<T>(*this, std::forward<Args>(args)...);
    T* raw = object.release();
    adopt(raw);
    return raw;
  }

  /// Frees the object now. Returns false (and frees nothing) for a pinned object.
  bool destroy(ManagedObject* object);

  /// The sequence number the next object will get; objects made later have larger numbers.
  std::uint64_t nextSequence() const;
  /// Frees every unpinned object made at or after `sequence`.
  void destroyFrom(std::uint64_t sequence);

  /// Number of objects owned now.
  std::size_t size() const;

  // Broker-managed memory (CMPIBrokerMemFT): blocks freed with the scope unless freed earlier.
  void* allocate(std::size_t size, bool zeroed);
  /// realloc semantics; `found` is set false when `address` is not a block of this scope.
  void* reallocate(void* address, std::size_t size, bool& found);
  /// Frees a block; false when `address` is not a block of this scope.
  bool freeMemory(void* address);

 private:
  void adopt(ManagedObject* object);
  void unlinkLocked(ManagedObject* object);

  BrokerCore* core_;
  RequestState* request_;
  mutable std::mutex mutex_;
  ManagedObject* head_ = nullptr;
  ManagedObject* tail_ = nullptr;
  std::size_t count_ = 0;
  std::uint64_t nextSequence_ = 1;
  std::unordered_map<void*, ManagedObject*> memory_;
};

/// The scope current on this thread (the one made current last and not yet removed), or null.
ObjectScope* currentScope();
/// Makes `scope` current on this thread.
void pushCurrentScope(ObjectScope* scope);
/// Takes `scope` off this thread's stack of current scopes, wherever it is, so that requests may
/// end in any order; the scope made current before it becomes current again.
void removeCurrentScope(ObjectScope* scope);

}  // namespace cmpihost::detail
