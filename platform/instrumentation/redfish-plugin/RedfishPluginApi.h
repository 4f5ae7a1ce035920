// The boundary between the platform and the HTTPS transport of "redfish:" sources.
//
// The transport is built on libcurl and lives in a separate shared object, bluelight-redfish.so,
// which the platform opens with dlopen only when a Redfish source is read. So the provider library
// never needs libcurl (nor the TLS library under it) to load, and a server that reads no Redfish
// service does not need them installed at all. Only this plain C interface crosses the boundary:
// no C++ types, no exceptions, no memory owned by the other side. The body of an answer is handed
// over in pieces through a callback, so the platform keeps its own copy and the plug-in frees its
// own buffers.
//
// A session is made for one walk of a service and used by one thread at a time; it keeps one
// connection open and reuses it for every request, so a walk costs one TLS handshake. Several
// sessions may be used at once from different threads.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_REDFISH_PLUGIN_REDFISHPLUGINAPI_H
#define KESTA_PLATFORM_INSTRUMENTATION_REDFISH_PLUGIN_REDFISHPLUGINAPI_H

#ifdef __cplusplus
extern "C" {
#endif

// Raised whenever the structures or the meaning of a field change; the platform refuses a
// transport of another version rather than guess.
#define BLUELIGHT_REDFISH_ABI_VERSION 1u

// The symbol the platform looks up in the transport.
#define BLUELIGHT_REDFISH_ENTRY_POINT "bluelight_redfish_api"

#define BLUELIGHT_REDFISH_MAX_REASON 256u
#define BLUELIGHT_REDFISH_MAX_LOCATION 2048u

// The interface is C, so that the transport can be built with any compiler: typedef, not using.
// NOLINTBEGIN(modernize-use-using)

// The service a session talks to and how. Everything is read during the call that opens the
// session; the session keeps copies of what it needs (libcurl keeps its own copy of the account
// until the session is closed; the plug-in's own copies are overwritten at once).
typedef struct BluelightRedfishService {
  const char* host;  // host name or address, NUL-terminated; an IPv6 address without brackets
  unsigned int port;
  const char* user;  // not NUL-terminated; never logged, never in a reason
  unsigned int userLength;
  const char* password;  // not NUL-terminated; never logged, never in a reason
  unsigned int passwordLength;
  const char* caFile;  // a file of trusted authorities (PEM), or NULL for the system's own
  int verify;          // 1: verify the certificate and the host name; 0: verify neither
} BluelightRedfishService;

// One walk's connection to a service; opaque to the platform.
typedef struct BluelightRedfishSession BluelightRedfishSession;

// What became of one GET.
enum BluelightRedfishOutcome {
  BLUELIGHT_REDFISH_ANSWERED = 0,     // an answer came: httpStatus holds its status (any status)
                                      // and the body went to the callback
  BLUELIGHT_REDFISH_TIMED_OUT = 1,    // the time was up before the whole answer was there
  BLUELIGHT_REDFISH_TOO_LARGE = 2,    // the body is (or announces itself as) larger than the limit
  BLUELIGHT_REDFISH_CERTIFICATE = 3,  // the service's certificate or host name was not accepted
  BLUELIGHT_REDFISH_UNREACHABLE = 4,  // no connection: the name did not resolve, nobody listens
  BLUELIGHT_REDFISH_FAILED = 5        // anything else (TLS, protocol, the callback stopped it)
};

// Receives the body of an answer in pieces, in order. Returns 0 to go on, anything else to stop
// the transfer (the outcome is then BLUELIGHT_REDFISH_FAILED).
typedef int (*BluelightRedfishBodySink)(void* context, const char* bytes, unsigned long length);

typedef struct BluelightRedfishResult {
  int outcome;              // a BluelightRedfishOutcome
  unsigned int httpStatus;  // when answered
  // When answered with a redirection (3xx) that names a target: the target as an absolute URL,
  // NUL-terminated (empty otherwise). The transport never follows it itself.
  char location[BLUELIGHT_REDFISH_MAX_LOCATION];
  char reason[BLUELIGHT_REDFISH_MAX_REASON];  // NUL-terminated; never holds the credentials
} BluelightRedfishResult;

typedef struct BluelightRedfishApi {
  unsigned int abiVersion;  // BLUELIGHT_REDFISH_ABI_VERSION; always the first member

  // Makes a session for one walk; nothing is sent yet. NULL when it cannot, with the reason
  // (NUL-terminated, at most reasonSize bytes with the NUL) in `reason`.
  BluelightRedfishSession* (*open)(const BluelightRedfishService* service, char* reason,
                                   unsigned int reasonSize);

  // Sends GET <path> (an absolute path of the service, e.g. "/redfish/v1/Chassis") over the
  // session's connection - opening it first when there is none or the service closed it - and
  // hands the body to `sink`. Gives up when timeoutMilliseconds have passed, and refuses a body
  // of more than maxBytes bytes. Never sends anything but GET; never follows a redirection.
  void (*get)(BluelightRedfishSession* session, const char* path, unsigned int timeoutMilliseconds,
              unsigned long maxBytes, BluelightRedfishBodySink sink, void* context,
              BluelightRedfishResult* result);

  // How many connections (each one TLS handshake) the session has opened so far.
  unsigned int (*connections)(const BluelightRedfishSession* session);

  // Closes the connection and frees the session, with everything it kept of the service. NULL is
  // ignored.
  void (*close)(BluelightRedfishSession* session);
} BluelightRedfishApi;

typedef const BluelightRedfishApi* (*BluelightRedfishEntryPoint)(void);

// NOLINTEND(modernize-use-using)

#ifdef __cplusplus
}
#endif

#endif  // KESTA_PLATFORM_INSTRUMENTATION_REDFISH_PLUGIN_REDFISHPLUGINAPI_H
