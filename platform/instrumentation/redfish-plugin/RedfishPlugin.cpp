// The HTTPS transport of "redfish:" sources, built into its own shared object
// (bluelight-redfish.so) on libcurl. The platform opens it with dlopen only when a Redfish source
// is read; see RedfishPluginApi.h for why.
//
// One curl easy handle is one session: curl keeps the connection of a handle open between its
// transfers, so every GET of a walk goes over the one connection (one TLS handshake), and the
// handle is cleaned up when the walk is over. The transport only carries requests; what to ask
// for, which redirections to follow and what an answer means is the platform's business. It never
// sends anything but GET and never follows a redirection on its own, so the credentials go to the
// service named by the source and nowhere else.
#include <curl/curl.h>
#include <string.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <new>
#include <string>

#include "instrumentation/redfish-plugin/RedfishPluginApi.h"

struct BluelightRedfishSession {
  CURL* curl = nullptr;
  curl_slist* headers = nullptr;
  std::string origin;  // "https://<host>:<port>"
  std::string caFile;
  unsigned int connections = 0;
  char errors[CURL_ERROR_SIZE] = {};

  // The transfer under way.
  BluelightRedfishBodySink sink = nullptr;
  void* context = nullptr;
  unsigned long maxBytes = 0;
  unsigned long received = 0;
  bool tooLarge = false;
  bool stopped = false;

  BluelightRedfishSession() = default;
  BluelightRedfishSession(const BluelightRedfishSession&) = delete;
  BluelightRedfishSession& operator=(const BluelightRedfishSession&) = delete;
  ~BluelightRedfishSession();
};

namespace {

void wipeText(std::string& text) noexcept {
  if (!text.empty()) {
    ::explicit_bzero(text.data(), text.size());
  }
  text.clear();
}

void copyText(char* buffer, std::size_t size, const std::string& text) {
  if (buffer == nullptr || size == 0) {
    return;
  }
  const std::size_t length = std::min(text.size(), size - 1);
  std::memcpy(buffer, text.data(), length);
  buffer[length] = '\0';
}

// A copy of a secret that is overwritten when it goes.
struct Secret {
  std::string text;
  Secret(const char* bytes, unsigned int length) {
    if (bytes != nullptr) {
      text.assign(bytes, length);
    }
  }
  Secret(const Secret&) = delete;
  Secret& operator=(const Secret&) = delete;
  ~Secret() { wipeText(text); }
};

// curl_global_init is called once, before the first handle, as libcurl asks; it is never undone,
// because the plug-in is never unloaded and other code in the process may use libcurl too.
bool initialiseCurl() {
  static std::once_flag once;
  static CURLcode initialised = CURLE_FAILED_INIT;
  std::call_once(once, [] { initialised = ::curl_global_init(CURL_GLOBAL_DEFAULT); });
  return initialised == CURLE_OK;
}

std::size_t receive(char* bytes, std::size_t size, std::size_t count, void* user) {
  auto* session = static_cast<BluelightRedfishSession*>(user);
  const std::size_t length = size * count;
  if (length > session->maxBytes - std::min(session->received, session->maxBytes)) {
    session->tooLarge = true;
    return 0;  // curl stops the transfer
  }
  session->received += length;
  if (session->sink != nullptr && length > 0 &&
      session->sink(session->context, bytes, static_cast<unsigned long>(length)) != 0) {
    session->stopped = true;
    return 0;
  }
  return length;
}

bool isPrintablePath(const char* path) {
  if (path == nullptr || path[0] != '/') {
    return false;
  }
  for (const char* c = path; *c != '\0'; ++c) {
    const auto byte = static_cast<unsigned char>(*c);
    if (byte <= 0x20 || byte >= 0x7f) {
      return false;
    }
  }
  return true;
}

int outcomeOf(CURLcode code) {
  switch (code) {
    case CURLE_OPERATION_TIMEDOUT:
      return BLUELIGHT_REDFISH_TIMED_OUT;
    case CURLE_FILESIZE_EXCEEDED:
      return BLUELIGHT_REDFISH_TOO_LARGE;
    case CURLE_PEER_FAILED_VERIFICATION:
    case CURLE_SSL_CACERT_BADFILE:
    case CURLE_SSL_ISSUER_ERROR:
    case CURLE_SSL_INVALIDCERTSTATUS:
      return BLUELIGHT_REDFISH_CERTIFICATE;
    case CURLE_COULDNT_RESOLVE_HOST:
    case CURLE_COULDNT_CONNECT:
      return BLUELIGHT_REDFISH_UNREACHABLE;
    default:
      return BLUELIGHT_REDFISH_FAILED;
  }
}

BluelightRedfishSession* openSession(const BluelightRedfishService* service, char* reason,
                                     unsigned int reasonSize) {
  if (service == nullptr || service->host == nullptr || service->host[0] == '\0' ||
      service->port == 0 || service->port > 65535) {
    copyText(reason, reasonSize, "no service was named");
    return nullptr;
  }
  if (!initialiseCurl()) {
    copyText(reason, reasonSize, "libcurl cannot be initialised");
    return nullptr;
  }
  auto* session = new (std::nothrow) BluelightRedfishSession;
  if (session == nullptr) {
    copyText(reason, reasonSize, "out of memory");
    return nullptr;
  }
  try {
    const std::string host = service->host;
    const bool ipv6 = host.find(':') != std::string::npos;
    session->origin =
        "https://" + (ipv6 ? "[" + host + "]" : host) + ":" + std::to_string(service->port);
    // curl keeps its own copies of the account for as long as the handle lives; these, made
    // only because curl wants NUL-terminated text, are overwritten as soon as it has them.
    const Secret user(service->user, service->userLength);
    const Secret password(service->password, service->passwordLength);
    if (service->caFile != nullptr) {
      session->caFile = service->caFile;
    }
    session->curl = ::curl_easy_init();
    if (session->curl == nullptr) {
      copyText(reason, reasonSize, "libcurl cannot make a handle");
      delete session;
      return nullptr;
    }
    session->headers = ::curl_slist_append(nullptr, "Accept: application/json");
    if (session->headers != nullptr) {
      curl_slist* more = ::curl_slist_append(session->headers, "OData-Version: 4.0");
      if (more != nullptr) {
        session->headers = more;
      }
    }

    CURL* curl = session->curl;
    CURLcode set = CURLE_OK;
    const auto option = [&set](CURLcode code) {
      if (set == CURLE_OK) {
        set = code;
      }
    };
    // Threads of the object manager must not get signals from name look-ups.
    option(::curl_easy_setopt(curl, CURLOPT_NOSIGNAL, 1L));
    option(::curl_easy_setopt(curl, CURLOPT_PROTOCOLS_STR, "https"));
    option(::curl_easy_setopt(curl, CURLOPT_REDIR_PROTOCOLS_STR, "https"));
    option(::curl_easy_setopt(curl, CURLOPT_FOLLOWLOCATION, 0L));
    option(::curl_easy_setopt(curl, CURLOPT_HTTPGET, 1L));
    option(
        ::curl_easy_setopt(curl, CURLOPT_HTTP_VERSION, static_cast<long>(CURL_HTTP_VERSION_1_1)));
    // A management controller is reached directly: proxies named in the environment of the
    // object manager are not for it.
    option(::curl_easy_setopt(curl, CURLOPT_PROXY, ""));
    option(::curl_easy_setopt(curl, CURLOPT_MAXCONNECTS, 1L));
    option(::curl_easy_setopt(curl, CURLOPT_HTTPAUTH, static_cast<long>(CURLAUTH_BASIC)));
    option(::curl_easy_setopt(curl, CURLOPT_USERNAME, user.text.c_str()));
    option(::curl_easy_setopt(curl, CURLOPT_PASSWORD, password.text.c_str()));
    option(::curl_easy_setopt(curl, CURLOPT_SSL_VERIFYPEER, service->verify != 0 ? 1L : 0L));
    option(::curl_easy_setopt(curl, CURLOPT_SSL_VERIFYHOST, service->verify != 0 ? 2L : 0L));
    if (!session->caFile.empty()) {
      option(::curl_easy_setopt(curl, CURLOPT_CAINFO, session->caFile.c_str()));
    }
    option(::curl_easy_setopt(curl, CURLOPT_HTTPHEADER, session->headers));
    option(::curl_easy_setopt(curl, CURLOPT_USERAGENT, "bluelight-redfish/1"));
    option(::curl_easy_setopt(curl, CURLOPT_WRITEFUNCTION, receive));
    option(::curl_easy_setopt(curl, CURLOPT_WRITEDATA, session));
    option(::curl_easy_setopt(curl, CURLOPT_ERRORBUFFER, session->errors));
    if (set != CURLE_OK) {
      copyText(reason, reasonSize,
               std::string("libcurl refuses a setting: ") + ::curl_easy_strerror(set));
      delete session;
      return nullptr;
    }
    return session;
  } catch (...) {
    copyText(reason, reasonSize, "out of memory");
    delete session;
    return nullptr;
  }
}

void get(BluelightRedfishSession* session, const char* path, unsigned int timeoutMilliseconds,
         unsigned long maxBytes, BluelightRedfishBodySink sink, void* context,
         BluelightRedfishResult* result) {
  if (result == nullptr) {
    return;
  }
  std::memset(result, 0, sizeof *result);
  result->outcome = BLUELIGHT_REDFISH_FAILED;
  if (session == nullptr || session->curl == nullptr) {
    copyText(result->reason, sizeof result->reason, "no session");
    return;
  }
  if (!isPrintablePath(path)) {
    copyText(result->reason, sizeof result->reason, "the path is not an absolute path");
    return;
  }
  if (timeoutMilliseconds == 0) {
    result->outcome = BLUELIGHT_REDFISH_TIMED_OUT;
    copyText(result->reason, sizeof result->reason, "no time was left");
    return;
  }
  try {
    const std::string url = session->origin + path;
    CURL* curl = session->curl;
    session->sink = sink;
    session->context = context;
    session->maxBytes = maxBytes;
    session->received = 0;
    session->tooLarge = false;
    session->stopped = false;
    session->errors[0] = '\0';
    ::curl_easy_setopt(curl, CURLOPT_URL, url.c_str());
    ::curl_easy_setopt(curl, CURLOPT_TIMEOUT_MS, static_cast<long>(timeoutMilliseconds));
    ::curl_easy_setopt(curl, CURLOPT_MAXFILESIZE_LARGE, static_cast<curl_off_t>(maxBytes));

    const CURLcode code = ::curl_easy_perform(curl);
    session->sink = nullptr;
    session->context = nullptr;

    long connects = 0;
    if (::curl_easy_getinfo(curl, CURLINFO_NUM_CONNECTS, &connects) == CURLE_OK && connects > 0) {
      session->connections += static_cast<unsigned int>(connects);
    }
    if (code == CURLE_OK) {
      long status = 0;
      ::curl_easy_getinfo(curl, CURLINFO_RESPONSE_CODE, &status);
      result->outcome = BLUELIGHT_REDFISH_ANSWERED;
      result->httpStatus = static_cast<unsigned int>(status);
      if (status >= 300 && status < 400) {
        char* location = nullptr;
        if (::curl_easy_getinfo(curl, CURLINFO_REDIRECT_URL, &location) == CURLE_OK &&
            location != nullptr) {
          copyText(result->location, sizeof result->location, location);
        }
      }
      return;
    }
    if (code == CURLE_WRITE_ERROR && session->tooLarge) {
      result->outcome = BLUELIGHT_REDFISH_TOO_LARGE;
      copyText(result->reason, sizeof result->reason, "the body is larger than the limit");
      return;
    }
    if (code == CURLE_WRITE_ERROR && session->stopped) {
      copyText(result->reason, sizeof result->reason, "the transfer was stopped by the caller");
      return;
    }
    result->outcome = outcomeOf(code);
    // curl's own words, which say more than the code's (the certificate problem, the address
    // it could not reach); they hold neither the account nor the password, which never are in
    // the URL.
    const std::string detail =
        session->errors[0] != '\0' ? session->errors : ::curl_easy_strerror(code);
    copyText(result->reason, sizeof result->reason, detail);
  } catch (...) {
    result->outcome = BLUELIGHT_REDFISH_FAILED;
    copyText(result->reason, sizeof result->reason, "out of memory");
  }
}

unsigned int connections(const BluelightRedfishSession* session) {
  return session != nullptr ? session->connections : 0;
}

void closeSession(BluelightRedfishSession* session) { delete session; }

const BluelightRedfishApi kApi = {BLUELIGHT_REDFISH_ABI_VERSION, openSession, get, connections,
                                  closeSession};

}  // namespace

BluelightRedfishSession::~BluelightRedfishSession() {
  if (curl != nullptr) {
    ::curl_easy_cleanup(curl);
  }
  if (headers != nullptr) {
    ::curl_slist_free_all(headers);
  }
}

extern "C" __attribute__((visibility("default"))) const BluelightRedfishApi* bluelight_redfish_api(
    void) {
  return &kApi;
}
