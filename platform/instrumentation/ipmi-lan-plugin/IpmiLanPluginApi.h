// The boundary between the platform and the network transport for "ipmi-lan:" sources.
//
// The network transport (RMCP+) is built on OpenIPMI and lives in a separate shared object,
// bluelight-ipmi-lan.so, which the platform opens with dlopen only when a network source is
// configured. So the provider library never needs OpenIPMI to load, and a server that reads its
// BMC in-band does not need it installed at all. Only this plain C interface crosses the
// boundary: no C++ types, no exceptions, no memory owned by the other side.
#ifndef KESTA_PLATFORM_INSTRUMENTATION_IPMI_LAN_PLUGIN_IPMILANPLUGINAPI_H
#define KESTA_PLATFORM_INSTRUMENTATION_IPMI_LAN_PLUGIN_IPMILANPLUGINAPI_H

#ifdef __cplusplus
extern "C" {
#endif

// Raised whenever the structures or the meaning of a field change; the platform refuses a
// transport of another version rather than guess.
#define BLUELIGHT_IPMI_LAN_ABI_VERSION 1u

// The symbol the platform looks up in the transport.
#define BLUELIGHT_IPMI_LAN_ENTRY_POINT "bluelight_ipmi_lan_api"

// The interface is C, so that the transport can be built with any compiler: typedef, not using.
// NOLINTBEGIN(modernize-use-using)

// Where and how to open a session. Everything is read during the call only.
typedef struct BluelightIpmiLanTarget {
  const char* host;  // host name or address, NUL-terminated (IPv6 without brackets)
  unsigned int port;
  const unsigned char* user;  // not NUL-terminated; may be empty (the anonymous user)
  unsigned int userLength;    // at most 16
  const unsigned char* password;
  unsigned int passwordLength;  // at most 20
  unsigned int privilege;       // 2 user, 3 operator, 4 administrator
  unsigned int cipherSuite;     // 1, 2, 3, 6, 7, 8, 11 or 12
} BluelightIpmiLanTarget;

// What became of one request.
enum BluelightIpmiLanOutcome {
  BLUELIGHT_IPMI_LAN_ANSWERED = 0,   // data holds the answer, completion code first
  BLUELIGHT_IPMI_LAN_TIMED_OUT = 1,  // no session or no answer before the time was up (the
                                     // reason says which, without the time)
  BLUELIGHT_IPMI_LAN_FAILED = 2      // the session or the request failed; reason says why
};

#define BLUELIGHT_IPMI_LAN_MAX_DATA 256u
#define BLUELIGHT_IPMI_LAN_MAX_REASON 256u

typedef struct BluelightIpmiLanResult {
  int outcome;  // a BluelightIpmiLanOutcome
  unsigned int length;
  unsigned char data[BLUELIGHT_IPMI_LAN_MAX_DATA];
  char reason[BLUELIGHT_IPMI_LAN_MAX_REASON];  // NUL-terminated; never holds the credentials
} BluelightIpmiLanResult;

typedef struct BluelightIpmiLanApi {
  unsigned int abiVersion;  // BLUELIGHT_IPMI_LAN_ABI_VERSION
  // Sends one request to the BMC of `target` (reusing an open session with the same target and
  // credentials when there is one) and waits for the answer, but never longer than
  // timeoutMilliseconds. Safe to call from several threads at once.
  void (*transact)(const BluelightIpmiLanTarget* target, unsigned char netFn, unsigned char command,
                   const unsigned char* data, unsigned int length, unsigned int timeoutMilliseconds,
                   BluelightIpmiLanResult* result);
} BluelightIpmiLanApi;

typedef const BluelightIpmiLanApi* (*BluelightIpmiLanEntryPoint)(void);

// NOLINTEND(modernize-use-using)

#ifdef __cplusplus
}
#endif

#endif  // KESTA_PLATFORM_INSTRUMENTATION_IPMI_LAN_PLUGIN_IPMILANPLUGINAPI_H
