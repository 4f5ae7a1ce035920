/*
 * A plug-in for OpenIPMI's BMC simulator (ipmi_sim, "loadlib" in lan.conf) that gives the
 * simulated BMC a chassis identify light, so the IPMI source can be tested against a real RMCP+
 * peer. As shipped, the simulator answers Get Chassis Status without an identify state and
 * rejects Chassis Identify; with this plug-in it keeps the state the way a BMC does:
 *
 *   Chassis Identify (NetFn 00h, cmd 04h), data [interval [force]]:
 *     force bit 0 set      -> on until switched off
 *     interval 0           -> off
 *     interval n (1..255)  -> on for n seconds, then off by itself
 *     no data              -> on for 15 seconds
 *   Get Chassis Status (NetFn 00h, cmd 01h):
 *     power on, no last power event, misc byte = 40h | state << 4 (state reported)
 *
 * The seconds of an interval are those of a clock of the plug-in's own, which moves only when a
 * test says so, with a command no real BMC has:
 *   Let Time Pass (NetFn 30h, OEM, cmd 01h), data [seconds]: the clock moves on by that many
 *     seconds; an interval that has run its time is over.
 * So a test sees a light that is on for an interval, and then off by itself, without waiting
 * for real seconds and without depending on how fast the machine runs it.
 *
 * The options string of the loadlib line makes Get Chassis Status misbehave, for the tests of
 * how the source copes with a BMC that answers badly:
 *   "reply=short"      answer with the completion code and two bytes only
 *   "reply=cc:<hex>"   answer with that completion code alone, e.g. "reply=cc:c0"
 *   "" or absent       answer properly
 * Chassis Identify and Let Time Pass work in every mode, so a test can tell the answers apart.
 */
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <OpenIPMI/mcserv.h>

#define CHASSIS_NETFN 0x00
#define GET_CHASSIS_STATUS_CMD 0x01
#define CHASSIS_IDENTIFY_CMD 0x04
#define OEM_NETFN 0x30
#define LET_TIME_PASS_CMD 0x01

#define CC_OK 0x00
#define CC_REQUEST_DATA_LENGTH_INVALID 0xc7

#define DEFAULT_IDENTIFY_SECONDS 15

/* Bits 5:4 of the misc chassis state byte. */
enum identify_state { IDENTIFY_OFF = 0, IDENTIFY_TIMED = 1, IDENTIFY_INDEFINITE = 2 };

enum reply_mode { REPLY_PROPER, REPLY_SHORT, REPLY_COMPLETION_CODE };

/* ipmi_sim runs every handler on its one thread, so plain statics are enough. */
static enum identify_state identify = IDENTIFY_OFF;
static unsigned int identify_seconds_left; /* while IDENTIFY_TIMED */
static enum reply_mode reply = REPLY_PROPER;
static unsigned char reply_completion_code = CC_OK;

/* The build hides every symbol by default; the simulator looks these two up by name. */
#define SIM_EXPORT __attribute__((visibility("default")))
SIM_EXPORT int ipmi_sim_module_print_version(sys_data_t* sys, char* options);
SIM_EXPORT int ipmi_sim_module_init(sys_data_t* sys, const char* options);

static void handle_let_time_pass(lmc_data_t* mc, msg_t* msg, unsigned char* rdata,
                                 unsigned int* rdata_len, void* cb_data) {
  (void)mc;
  (void)cb_data;
  if (msg->len != 1) {
    rdata[0] = CC_REQUEST_DATA_LENGTH_INVALID;
    *rdata_len = 1;
    return;
  }
  if (identify == IDENTIFY_TIMED) {
    if (msg->data[0] >= identify_seconds_left) {
      identify = IDENTIFY_OFF;
      identify_seconds_left = 0;
    } else {
      identify_seconds_left -= msg->data[0];
    }
  }
  rdata[0] = CC_OK;
  *rdata_len = 1;
}

static void handle_get_chassis_status(lmc_data_t* mc, msg_t* msg, unsigned char* rdata,
                                      unsigned int* rdata_len, void* cb_data) {
  (void)mc;
  (void)msg;
  (void)cb_data;
  switch (reply) {
    case REPLY_COMPLETION_CODE:
      rdata[0] = reply_completion_code;
      *rdata_len = 1;
      return;
    case REPLY_SHORT:
      rdata[0] = CC_OK;
      rdata[1] = 0x01;
      rdata[2] = 0x00;
      *rdata_len = 3;
      return;
    case REPLY_PROPER:
      break;
  }
  rdata[0] = CC_OK;
  rdata[1] = 0x01; /* power is on */
  rdata[2] = 0x00; /* no last power event */
  rdata[3] = (unsigned char)(0x40 | ((unsigned)identify << 4));
  *rdata_len = 4;
}

static void handle_chassis_identify(lmc_data_t* mc, msg_t* msg, unsigned char* rdata,
                                    unsigned int* rdata_len, void* cb_data) {
  unsigned int seconds = DEFAULT_IDENTIFY_SECONDS;
  int force = 0;
  (void)mc;
  (void)cb_data;
  if (msg->len > 2) {
    rdata[0] = CC_REQUEST_DATA_LENGTH_INVALID;
    *rdata_len = 1;
    return;
  }
  if (msg->len >= 1) {
    seconds = msg->data[0];
  }
  if (msg->len >= 2) {
    force = msg->data[1] & 0x01;
  }

  identify_seconds_left = 0;
  if (force) {
    identify = IDENTIFY_INDEFINITE;
  } else if (seconds == 0) {
    identify = IDENTIFY_OFF;
  } else {
    identify = IDENTIFY_TIMED;
    identify_seconds_left = seconds;
  }
  rdata[0] = CC_OK;
  *rdata_len = 1;
}

/* Reads the options string; returns 0 when it is understood. */
static int parse_options(const char* options) {
  if (options == NULL || options[0] == '\0') {
    reply = REPLY_PROPER;
    return 0;
  }
  if (strcmp(options, "reply=short") == 0) {
    reply = REPLY_SHORT;
    return 0;
  }
  if (strncmp(options, "reply=cc:", 9) == 0) {
    char* end = NULL;
    const unsigned long code = strtoul(options + 9, &end, 16);
    if (end != options + 9 && *end == '\0' && code <= 0xff) {
      reply = REPLY_COMPLETION_CODE;
      reply_completion_code = (unsigned char)code;
      return 0;
    }
  }
  return -1;
}

int ipmi_sim_module_print_version(sys_data_t* sys, char* options) {
  (void)sys;
  (void)options;
  printf("Kesta chassis identify simulator plug-in 1.0\n");
  return 0;
}

int ipmi_sim_module_init(sys_data_t* sys, const char* options) {
  int rv;
  (void)sys;
  if (parse_options(options) != 0) {
    fprintf(stderr, "identify plug-in: options \"%s\" not understood\n", options);
    return -1;
  }
  rv = ipmi_emu_register_cmd_handler(CHASSIS_NETFN, GET_CHASSIS_STATUS_CMD,
                                     handle_get_chassis_status, NULL);
  if (rv == 0) {
    rv = ipmi_emu_register_cmd_handler(CHASSIS_NETFN, CHASSIS_IDENTIFY_CMD, handle_chassis_identify,
                                       NULL);
  }
  if (rv == 0) {
    rv = ipmi_emu_register_cmd_handler(OEM_NETFN, LET_TIME_PASS_CMD, handle_let_time_pass, NULL);
  }
  if (rv != 0) {
    fprintf(stderr, "identify plug-in: cannot register the command handlers (%d)\n", rv);
  }
  return rv;
}
