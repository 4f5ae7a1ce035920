// The network transport for "ipmi-lan:" sources, built into its own shared object
// (bluelight-ipmi-lan.so) on top of OpenIPMI's connection layer. The platform opens it with
// dlopen only when a network source is configured; see IpmiLanPluginApi.h for why.
//
// OpenIPMI is event-driven and, with its plain POSIX OS handler, not thread-safe. So all of it
// runs on one engine thread: callers queue a job, wake the thread through an eventfd and wait
// for the answer on their own condition variable until their deadline - never longer, whatever
// the BMC or the library does. Jobs whose callers gave up are finished later and dropped.
//
// One session is kept per BMC and account and reused by later reads, because opening an RMCP+
// session takes several round trips and a BMC has only a few session slots. A session that
// fails is closed and opened afresh by the next read; one that nobody used for a minute is
// closed so it does not hold a slot for ever.
#include <OpenIPMI/ipmi_addr.h>
#include <OpenIPMI/ipmi_auth.h>
#include <OpenIPMI/ipmi_conn.h>
#include <OpenIPMI/ipmi_err.h>
#include <OpenIPMI/ipmi_lan.h>
#include <OpenIPMI/ipmi_posix.h>
#include <OpenIPMI/ipmiif.h>
#include <OpenIPMI/selector.h>
#include <dlfcn.h>
#include <string.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <chrono>
#include <condition_variable>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

#include "instrumentation/ipmi-lan-plugin/IpmiLanPluginApi.h"

namespace {

using Clock = std::chrono::steady_clock;

// A session nobody used for this long is closed.
constexpr std::chrono::seconds kIdleSession{60};
// How long the engine sleeps when nothing happens; also how late it notices idle sessions.
constexpr long kIdleTickMicroseconds = 250000;
// How long closing the sessions may hold up the process at exit.
constexpr std::chrono::seconds kShutdownGrace{2};

void wipeText(std::string& text) noexcept {
  if (!text.empty()) {
    ::explicit_bzero(text.data(), text.size());
  }
  text.clear();
}

// One BMC and one account; a session is shared by the reads with equal keys. No move members on
// purpose: moving a short string leaves its bytes in the moved-from object's own buffer, where
// the destructor, seeing it empty, would not wipe them; a copy leaves two keys that are both wiped.
struct SessionKey {  // NOLINT(cppcoreguidelines-special-member-functions)
  std::string host;
  unsigned int port = 0;
  std::string user;
  std::string password;
  unsigned int privilege = 0;
  unsigned int cipherSuite = 0;

  SessionKey() = default;
  SessionKey(const SessionKey&) = default;
  SessionKey& operator=(const SessionKey&) = default;
  ~SessionKey() {
    wipeText(user);
    wipeText(password);
  }

  bool operator<(const SessionKey& other) const {
    return std::tie(host, port, user, password, privilege, cipherSuite) <
           std::tie(other.host, other.port, other.user, other.password, other.privilege,
                    other.cipherSuite);
  }
};

struct CipherSuite {
  unsigned int number;
  int authentication;
  int integrity;
  int confidentiality;
};

constexpr CipherSuite kCipherSuites[] = {
    {1, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_SHA1, IPMI_LANP_INTEGRITY_ALGORITHM_NONE,
     IPMI_LANP_CONFIDENTIALITY_ALGORITHM_NONE},
    {2, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_SHA1,
     IPMI_LANP_INTEGRITY_ALGORITHM_HMAC_SHA1_96, IPMI_LANP_CONFIDENTIALITY_ALGORITHM_NONE},
    {3, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_SHA1,
     IPMI_LANP_INTEGRITY_ALGORITHM_HMAC_SHA1_96, IPMI_LANP_CONFIDENTIALITY_ALGORITHM_AES_CBC_128},
    {6, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_MD5, IPMI_LANP_INTEGRITY_ALGORITHM_NONE,
     IPMI_LANP_CONFIDENTIALITY_ALGORITHM_NONE},
    {7, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_MD5,
     IPMI_LANP_INTEGRITY_ALGORITHM_HMAC_MD5_128, IPMI_LANP_CONFIDENTIALITY_ALGORITHM_NONE},
    {8, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_MD5,
     IPMI_LANP_INTEGRITY_ALGORITHM_HMAC_MD5_128, IPMI_LANP_CONFIDENTIALITY_ALGORITHM_AES_CBC_128},
    {11, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_MD5, IPMI_LANP_INTEGRITY_ALGORITHM_MD5_128,
     IPMI_LANP_CONFIDENTIALITY_ALGORITHM_NONE},
    {12, IPMI_LANP_AUTHENTICATION_ALGORITHM_RAKP_HMAC_MD5, IPMI_LANP_INTEGRITY_ALGORITHM_MD5_128,
     IPMI_LANP_CONFIDENTIALITY_ALGORITHM_AES_CBC_128},
};

const CipherSuite* findCipherSuite(unsigned int number) {
  for (const CipherSuite& suite : kCipherSuites) {
    if (suite.number == number) {
      return &suite;
    }
  }
  return nullptr;
}

std::string openIpmiError(int error) {
  char text[128] = {};
  ::ipmi_get_error_string(static_cast<unsigned int>(error), text, sizeof text);
  text[sizeof text - 1] = '\0';
  return text[0] != '\0' ? std::string(text) : "error " + std::to_string(error);
}

void stopEngineAtExit();

// OpenSSL, which OpenIPMI uses for the session keys, frees itself in an exit handler, and exit
// handlers run in the reverse order of their registration. The engine must stop before that
// handler runs - a session closed at exit, or a keep-alive sent while the process ends, would
// use freed ciphers - so OpenSSL is initialised (registering its handler) before the engine
// registers its own. OpenSSL is reached through this plug-in's own dependencies, so no OpenSSL
// headers are needed; if it cannot be found the library initialises it on first use, as before.
void orderExitHandlers() {
  Dl_info self = {};
  if (::dladdr(reinterpret_cast<void*>(&orderExitHandlers), &self) != 0 &&
      self.dli_fname != nullptr) {
    if (void* plugin = ::dlopen(self.dli_fname, RTLD_NOW | RTLD_NOLOAD)) {
      using Initialise = int (*)(std::uint64_t, const void*);
      // OPENSSL_INIT_ADD_ALL_CIPHERS | OPENSSL_INIT_ADD_ALL_DIGESTS: with no option at all
      // OpenSSL returns before it registers its exit handler.
      constexpr std::uint64_t kCiphersAndDigests = 0x04 | 0x08;
      if (const auto initialise =
              reinterpret_cast<Initialise>(::dlsym(plugin, "OPENSSL_init_crypto"))) {
        initialise(kCiphersAndDigests, nullptr);
      }
      ::dlclose(plugin);
    }
  }
  std::atexit(stopEngineAtExit);
}

void setResult(BluelightIpmiLanResult& result, int outcome, const unsigned char* data,
               unsigned int length, const std::string& reason) {
  result.outcome = outcome;
  result.length = data != nullptr ? std::min(length, BLUELIGHT_IPMI_LAN_MAX_DATA) : 0;
  if (data != nullptr && result.length != 0) {
    std::memcpy(result.data, data, result.length);
  }
  std::snprintf(result.reason, sizeof result.reason, "%s", reason.c_str());
}

// One request and the caller waiting for it. Shared between the caller and the engine, so
// either may go first.
struct Job {
  SessionKey key;
  unsigned char netFn = 0;
  unsigned char command = 0;
  std::vector<unsigned char> data;
  Clock::time_point deadline;

  std::mutex mutex;
  std::condition_variable changed;
  bool finished = false;  // guarded by mutex
  bool sent = false;      // guarded by mutex: the request went out on an open session
  BluelightIpmiLanResult result = {};

  void markSent() {
    std::lock_guard<std::mutex> lock(mutex);
    sent = true;
  }
  void finish(int outcome, const unsigned char* answer, unsigned int length,
              const std::string& reason) {
    {
      std::lock_guard<std::mutex> lock(mutex);
      if (finished) {
        return;
      }
      setResult(result, outcome, answer, length, reason);
      finished = true;
    }
    changed.notify_all();
  }
  void fail(const std::string& reason) { finish(BLUELIGHT_IPMI_LAN_FAILED, nullptr, 0, reason); }
};

class Engine;

// One OpenIPMI connection (an RMCP+ session) to one BMC with one account. Engine thread only.
struct Session {
  enum class State { Connecting, Up, Failed };

  Engine* engine = nullptr;
  SessionKey key;
  ipmi_con_t* connection = nullptr;
  State state = State::Connecting;
  std::string failure;
  std::vector<std::shared_ptr<Job>> waiting;  // jobs that came before the session was up
  Clock::time_point lastUsed = Clock::now();
};

class Engine {
 public:
  // The one engine of the process, started on first use and never destroyed (callers may still
  // hold its jobs while the process ends).
  static Engine& instance() {
    static Engine* engine = new Engine();
    return *engine;
  }
  static Engine* existing() { return running.load(); }

  void transact(const BluelightIpmiLanTarget& target, unsigned char netFn, unsigned char command,
                const unsigned char* data, unsigned int length, unsigned int timeoutMilliseconds,
                BluelightIpmiLanResult& result);

  // Stops the thread, closing every session; called when the plug-in is unloaded or the
  // process ends.
  void stop();

 private:
  Engine();

  void run();
  bool setUp(std::string& why);
  void tearDown();
  // Frees the OS handler and what its selector still holds (engine thread, last).
  void releaseOs();
  void takeQueuedJobs();
  void start(const std::shared_ptr<Job>& job);
  void send(Session& session, const std::shared_ptr<Job>& job);
  void reapSessions();
  void close(Session& session, const std::string& why);

  static void onWake(int fd, void* data, os_hnd_fd_id_t* id);
  static void onConnectionChange(ipmi_con_t* connection, int error, unsigned int port,
                                 int anyPortUp, void* data);
  static int onAnswer(ipmi_con_t* connection, ipmi_msgi_t* item);
  static void onClosed(ipmi_con_t* connection, void* data);
  static void discardLog(os_handler_t* handler, const char* format, enum ipmi_log_type_e type,
                         va_list arguments);

  static std::atomic<Engine*> running;

  const pid_t owner_ = ::getpid();
  std::mutex mutex_;
  std::condition_variable endedChanged_;
  std::deque<std::shared_ptr<Job>> queue_;  // guarded by mutex_
  bool stopping_ = false;                   // guarded by mutex_
  bool ended_ = false;                      // guarded by mutex_
  std::string broken_;                      // guarded by mutex_: why the engine cannot work
  int wakeFd_ = -1;
  std::thread thread_;

  // Engine thread only.
  os_handler_t* os_ = nullptr;
  os_hnd_fd_id_t* wakeId_ = nullptr;
  std::map<SessionKey, std::unique_ptr<Session>> sessions_;
  int openConnections_ = 0;
};

std::atomic<Engine*> Engine::running{nullptr};

Engine::Engine() {
  wakeFd_ = ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
  if (wakeFd_ < 0) {
    broken_ = "the network transport cannot start: no eventfd (" +
              std::string(std::strerror(errno)) + ")";
    ended_ = true;
    return;
  }
  thread_ = std::thread([this] { run(); });
  running.store(this);
}

void Engine::transact(const BluelightIpmiLanTarget& target, unsigned char netFn,
                      unsigned char command, const unsigned char* data, unsigned int length,
                      unsigned int timeoutMilliseconds, BluelightIpmiLanResult& result) {
  if (::getpid() != owner_) {
    setResult(result, BLUELIGHT_IPMI_LAN_FAILED, nullptr, 0,
              "the network transport cannot be used in a process forked after it started");
    return;
  }
  const auto job = std::make_shared<Job>();
  job->key.host = target.host != nullptr ? target.host : "";
  job->key.port = target.port;
  job->key.user.assign(reinterpret_cast<const char*>(target.user), target.userLength);
  job->key.password.assign(reinterpret_cast<const char*>(target.password), target.passwordLength);
  job->key.privilege = target.privilege;
  job->key.cipherSuite = target.cipherSuite;
  job->netFn = netFn;
  job->command = command;
  if (length != 0) {
    job->data.assign(data, data + length);
  }
  job->deadline = Clock::now() + std::chrono::milliseconds(timeoutMilliseconds);

  {
    std::lock_guard<std::mutex> lock(mutex_);
    if (!broken_.empty() || stopping_) {
      setResult(result, BLUELIGHT_IPMI_LAN_FAILED, nullptr, 0,
                broken_.empty() ? "the network transport is shutting down" : broken_);
      return;
    }
    queue_.push_back(job);
  }
  const std::uint64_t one = 1;
  if (::write(wakeFd_, &one, sizeof one) < 0 && errno != EAGAIN) {
    // The counter cannot overflow in practice; a failed wake only delays the job to the next
    // tick of the engine.
  }

  std::unique_lock<std::mutex> lock(job->mutex);
  if (job->changed.wait_until(lock, job->deadline, [&job] { return job->finished; })) {
    result = job->result;
    return;
  }
  // The caller adds how long it waited.
  setResult(result, BLUELIGHT_IPMI_LAN_TIMED_OUT, nullptr, 0,
            job->sent ? "no answer from the BMC"
                      : "no session with the BMC (it does not answer, or does not accept the "
                        "login)");
}

void Engine::stop() {
  std::unique_lock<std::mutex> lock(mutex_);
  if (!thread_.joinable()) {
    return;
  }
  stopping_ = true;
  const std::uint64_t one = 1;
  if (::write(wakeFd_, &one, sizeof one) < 0) {
    // The engine also looks at stopping_ on every tick.
  }
  const bool ended = endedChanged_.wait_for(lock, kShutdownGrace + std::chrono::seconds(1),
                                            [this] { return ended_; });
  lock.unlock();
  if (ended) {
    thread_.join();
  } else {
    // Stuck inside the library (a name lookup, say): leave it rather than hang the exit.
    thread_.detach();
  }
}

void Engine::run() {
  std::string why;
  if (!setUp(why)) {
    std::deque<std::shared_ptr<Job>> orphans;
    {
      std::lock_guard<std::mutex> lock(mutex_);
      broken_ = "the network transport cannot start: " + why;
      orphans.swap(queue_);
      ended_ = true;
    }
    for (const std::shared_ptr<Job>& job : orphans) {
      job->fail(broken_);
    }
    endedChanged_.notify_all();
    return;
  }
  for (;;) {
    struct timeval tick = {0, kIdleTickMicroseconds};
    os_->perform_one_op(os_, &tick);
    takeQueuedJobs();
    reapSessions();
    std::lock_guard<std::mutex> lock(mutex_);
    if (stopping_) {
      break;
    }
  }
  tearDown();
  {
    std::lock_guard<std::mutex> lock(mutex_);
    ended_ = true;
  }
  endedChanged_.notify_all();
}

bool Engine::setUp(std::string& why) {
  orderExitHandlers();
  os_ = ::ipmi_posix_get_os_handler();
  if (os_ == nullptr) {
    why = "OpenIPMI has no OS handler";
    return false;
  }
  struct selector_s* selector = nullptr;
  if (const int error = ::sel_alloc_selector_nothread(&selector); error != 0) {
    why = "OpenIPMI has no selector (" + openIpmiError(error) + ")";
    os_->free_os_handler(os_);  // nothing to run a round with yet
    os_ = nullptr;
    return false;
  }
  ::ipmi_posix_os_handler_set_sel(os_, selector);
  // The library's own messages would go to the object manager's standard error; the platform
  // logs what matters (the outcome of each read) itself.
  os_->set_log_handler(os_, discardLog);
  if (const int error = ::ipmi_init(os_); error != 0) {
    why = "OpenIPMI cannot be initialised (" + openIpmiError(error) + ")";
    releaseOs();
    return false;
  }
  if (const int error = os_->add_fd_to_wait_for(os_, wakeFd_, onWake, this, nullptr, &wakeId_);
      error != 0) {
    why = "the engine cannot wait for requests (" + openIpmiError(error) + ")";
    ::ipmi_shutdown();
    releaseOs();
    return false;
  }
  return true;
}

void Engine::tearDown() {
  std::deque<std::shared_ptr<Job>> orphans;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    orphans.swap(queue_);
  }
  for (const std::shared_ptr<Job>& job : orphans) {
    job->fail("the network transport is shutting down");
  }
  for (auto& entry : sessions_) {
    close(*entry.second, "the network transport is shutting down");
  }
  sessions_.clear();
  const Clock::time_point giveUp = Clock::now() + kShutdownGrace;
  while (openConnections_ > 0 && Clock::now() < giveUp) {
    struct timeval tick = {0, 50000};
    os_->perform_one_op(os_, &tick);
  }
  os_->remove_fd_to_wait_for(os_, wakeId_);
  ::ipmi_shutdown();
  releaseOs();
}

void Engine::releaseOs() {
  if (os_ == nullptr) {
    return;
  }
  // The selector frees the records of the descriptors it no longer watches (the wake-up eventfd,
  // the sockets of the closed sessions) only in its next round; without one they would leak.
  struct timeval now = {0, 0};
  os_->perform_one_op(os_, &now);
  os_->free_os_handler(os_);
  os_ = nullptr;
}

void Engine::takeQueuedJobs() {
  std::deque<std::shared_ptr<Job>> jobs;
  {
    std::lock_guard<std::mutex> lock(mutex_);
    jobs.swap(queue_);
  }
  for (const std::shared_ptr<Job>& job : jobs) {
    start(job);
  }
}

void Engine::start(const std::shared_ptr<Job>& job) {
  const auto found = sessions_.find(job->key);
  if (found != sessions_.end() && found->second->state != Session::State::Failed) {
    Session& session = *found->second;
    session.lastUsed = Clock::now();
    if (session.state == Session::State::Up) {
      send(session, job);
    } else {
      session.waiting.push_back(job);
    }
    return;
  }
  if (found != sessions_.end()) {
    close(*found->second, "the session failed");
    sessions_.erase(found);
  }

  const CipherSuite* suite = findCipherSuite(job->key.cipherSuite);
  if (suite == nullptr) {
    job->fail("cipher suite " + std::to_string(job->key.cipherSuite) + " is not supported");
    return;
  }
  auto session = std::make_unique<Session>();
  session->engine = this;
  session->key = job->key;

  // OpenIPMI copies what it needs from these while it sets the connection up.
  std::string port = std::to_string(session->key.port);
  char* addresses[1] = {session->key.host.data()};
  char* ports[1] = {port.data()};
  std::vector<ipmi_lanp_parm_t> parameters = {
      {IPMI_LANP_PARMID_ADDRS, 0, addresses, 1},
      {IPMI_LANP_PARMID_PORTS, 0, ports, 1},
      {IPMI_LANP_PARMID_AUTHTYPE, IPMI_AUTHTYPE_RMCP_PLUS, nullptr, 0},
      {IPMI_LANP_PARMID_PRIVILEGE, static_cast<int>(session->key.privilege), nullptr, 0},
      {IPMI_LANP_PARMID_USERNAME, 0, session->key.user.data(),
       static_cast<unsigned int>(session->key.user.size())},
      {IPMI_LANP_PARMID_PASSWORD, 0, session->key.password.data(),
       static_cast<unsigned int>(session->key.password.size())},
      {IPMI_LANP_AUTHENTICATION_ALGORITHM, suite->authentication, nullptr, 0},
      {IPMI_LANP_INTEGRITY_ALGORITHM, suite->integrity, nullptr, 0},
      {IPMI_LANP_CONFIDENTIALITY_ALGORITHM, suite->confidentiality, nullptr, 0},
  };
  ipmi_con_t* connection = nullptr;
  int error = ::ipmi_lanp_setup_con(parameters.data(), static_cast<unsigned int>(parameters.size()),
                                    os_, nullptr, &connection);
  if (error != 0 || connection == nullptr) {
    job->fail("cannot set up a session with " + session->key.host + ": " + openIpmiError(error));
    return;
  }
  session->connection = connection;
  ++openConnections_;
  connection->add_con_change_handler(connection, onConnectionChange, session.get());
  session->waiting.push_back(job);
  Session& started = *session;
  sessions_.emplace(started.key, std::move(session));
  error = connection->start_con(connection);
  if (error != 0) {
    started.state = Session::State::Failed;
    started.failure = "cannot start a session with the BMC: " + openIpmiError(error);
    for (const std::shared_ptr<Job>& waiting : started.waiting) {
      waiting->fail(started.failure);
    }
    started.waiting.clear();
  }
}

void Engine::send(Session& session, const std::shared_ptr<Job>& job) {
  if (Clock::now() >= job->deadline) {
    // Its caller has given up; asking the BMC now would only add load.
    job->finish(BLUELIGHT_IPMI_LAN_TIMED_OUT, nullptr, 0, "the caller stopped waiting");
    return;
  }
  ipmi_system_interface_addr address = {};
  address.addr_type = IPMI_SYSTEM_INTERFACE_ADDR_TYPE;
  address.channel = IPMI_BMC_CHANNEL;
  address.lun = 0;
  ipmi_msg_t message = {};
  message.netfn = job->netFn;
  message.cmd = job->command;
  message.data_len = static_cast<unsigned short>(job->data.size());
  message.data = job->data.empty() ? nullptr : job->data.data();

  ipmi_msgi_t* item = ::ipmi_alloc_msg_item();
  if (item == nullptr) {
    job->fail("out of memory");
    return;
  }
  auto* holder = new std::shared_ptr<Job>(job);
  item->data1 = holder;
  job->markSent();
  const int error =
      session.connection->send_command(session.connection, reinterpret_cast<ipmi_addr_t*>(&address),
                                       sizeof address, &message, onAnswer, item);
  if (error != 0) {
    delete holder;
    ::ipmi_free_msg_item(item);
    job->fail("cannot send the request to the BMC: " + openIpmiError(error));
    session.state = Session::State::Failed;
    session.failure = "the session failed";
  }
}

void Engine::reapSessions() {
  const Clock::time_point now = Clock::now();
  for (auto entry = sessions_.begin(); entry != sessions_.end();) {
    Session& session = *entry->second;
    const bool idle = session.state == Session::State::Up && session.waiting.empty() &&
                      now - session.lastUsed > kIdleSession;
    if (session.state == Session::State::Failed || idle) {
      close(session, session.failure.empty() ? "the session was closed" : session.failure);
      entry = sessions_.erase(entry);
    } else {
      ++entry;
    }
  }
}

void Engine::close(Session& session, const std::string& why) {
  for (const std::shared_ptr<Job>& job : session.waiting) {
    job->fail(why);
  }
  session.waiting.clear();
  if (session.connection == nullptr) {
    return;
  }
  ipmi_con_t* connection = session.connection;
  session.connection = nullptr;
  connection->remove_con_change_handler(connection, onConnectionChange, &session);
  // Answers still outstanding on it are delivered to onAnswer as failures by the library.
  if (connection->close_connection_done != nullptr) {
    if (connection->close_connection_done(connection, onClosed, this) == 0) {
      return;
    }
  } else {
    connection->close_connection(connection);
  }
  --openConnections_;
}

void Engine::onWake(int fd, void* data, os_hnd_fd_id_t* id) {
  (void)data;
  (void)id;
  std::uint64_t count = 0;
  while (::read(fd, &count, sizeof count) > 0) {
  }
  // The queued jobs are taken right after this operation returns to the engine loop.
}

void Engine::onConnectionChange(ipmi_con_t* connection, int error, unsigned int port, int anyPortUp,
                                void* data) {
  (void)connection;
  (void)port;
  auto* session = static_cast<Session*>(data);
  if (error == 0) {
    session->state = Session::State::Up;
    std::vector<std::shared_ptr<Job>> waiting;
    waiting.swap(session->waiting);
    for (const std::shared_ptr<Job>& job : waiting) {
      session->engine->send(*session, job);
    }
    return;
  }
  if (anyPortUp != 0) {
    return;
  }
  session->state = Session::State::Failed;
  session->failure = "the session with the BMC failed (" + openIpmiError(error) +
                     "); check the host, the port, the account and the cipher suite";
  for (const std::shared_ptr<Job>& job : session->waiting) {
    job->fail(session->failure);
  }
  session->waiting.clear();
  // The connection itself is closed by the engine loop, outside the library's callback.
}

int Engine::onAnswer(ipmi_con_t* connection, ipmi_msgi_t* item) {
  (void)connection;
  auto* holder = static_cast<std::shared_ptr<Job>*>(item->data1);
  const std::shared_ptr<Job> job = *holder;
  delete holder;
  item->data1 = nullptr;
  const ipmi_msg_t& answer = item->msg;
  if (answer.netfn != (job->netFn | 1u) || answer.cmd != job->command) {
    job->fail("the BMC answered another command (NetFn " + std::to_string(answer.netfn) +
              ", command " + std::to_string(answer.cmd) + ")");
  } else {
    job->finish(BLUELIGHT_IPMI_LAN_ANSWERED, answer.data, answer.data_len, std::string());
  }
  return IPMI_MSG_ITEM_NOT_USED;
}

void Engine::onClosed(ipmi_con_t* connection, void* data) {
  (void)connection;
  --static_cast<Engine*>(data)->openConnections_;
}

void Engine::discardLog(os_handler_t* handler, const char* format, enum ipmi_log_type_e type,
                        va_list arguments) {
  (void)handler;
  (void)format;
  (void)type;
  (void)arguments;
}

void transact(const BluelightIpmiLanTarget* target, unsigned char netFn, unsigned char command,
              const unsigned char* data, unsigned int length, unsigned int timeoutMilliseconds,
              BluelightIpmiLanResult* result) {
  if (result == nullptr) {
    return;
  }
  *result = BluelightIpmiLanResult{};
  if (target == nullptr || target->host == nullptr || (data == nullptr && length != 0)) {
    setResult(*result, BLUELIGHT_IPMI_LAN_FAILED, nullptr, 0, "invalid request");
    return;
  }
  try {
    Engine::instance().transact(*target, netFn, command, data, length, timeoutMilliseconds,
                                *result);
  } catch (const std::exception& error) {
    // Nothing may cross the C boundary; memory or thread exhaustion ends up as a failed read.
    setResult(*result, BLUELIGHT_IPMI_LAN_FAILED, nullptr, 0,
              std::string("the network transport failed: ") + error.what());
  }
}

constexpr BluelightIpmiLanApi kApi = {BLUELIGHT_IPMI_LAN_ABI_VERSION, transact};

// Runs when the process ends (the platform never unloads the plug-in), before OpenSSL's own
// exit handler: closes the sessions, so the BMC frees their slots now rather than when they time
// out, and stops the engine thread.
void stopEngineAtExit() {
  if (Engine* engine = Engine::existing(); engine != nullptr) {
    engine->stop();
  }
}

}  // namespace

extern "C" __attribute__((visibility("default"))) const BluelightIpmiLanApi* bluelight_ipmi_lan_api(
    void) {
  return &kApi;
}
