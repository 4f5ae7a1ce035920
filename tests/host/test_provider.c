/*
 * A small C provider for the host's loader and driver tests. It is written the way providers
 * are, with the stub macros and the convenience macros, and serves KESTA_BlueLight-like
 * instances with two lights, plus association operations that go through the broker's up-calls
 * for KESTA_ComputerSystem.
 *
 * Besides the regular provider "HostTestProvider" the library exports factories that fail on
 * purpose, so that the loader's error paths can be checked:
 *   HostTestNullProvider_Create_InstanceMI     returns NULL and reports CMPI_RC_ERR_FAILED
 *   HostTestFutureProvider_Create_InstanceMI   an MI whose miVersion (300) is newer than 200
 *   HostTestNoTableProvider_Create_InstanceMI  an MI without a function table
 */
#include <cmpidt.h>
#include <cmpift.h>
#include <cmpimacs.h>

#include <stdio.h>
#include <string.h>

static const CMPIBroker* broker;

static const char* const kComponent = "HostTestProvider";
static const char* const kLightClass = "KESTA_BlueLight";
static const char* const kSystemClass = "KESTA_ComputerSystem";
static const char* const kSystemDeviceClass = "KESTA_BlueLightSystemDevice";
static const int kLightCount = 2;

/* The namespace of a path, or "" when it cannot be read. */
static const char* nameSpaceOf(const CMPIObjectPath* ref) {
  CMPIString* ns = CMGetNameSpace(ref, NULL);
  return (ns != NULL && ns->hdl != NULL) ? CMGetCharPtr(ns) : "";
}

static void deviceId(int index, char* buffer, size_t size) {
  snprintf(buffer, size, "Blue Light:%d", index);
}

static CMPIObjectPath* makeLightPath(const CMPIObjectPath* ref, const char* id, CMPIStatus* rc) {
  CMPIObjectPath* path = CMNewObjectPath(broker, nameSpaceOf(ref), kLightClass, rc);
  if (CMIsNullObject(path)) return NULL;
  CMAddKey(path, "CreationClassName", kLightClass, CMPI_chars);
  CMAddKey(path, "DeviceID", id, CMPI_chars);
  return path;
}

static CMPIInstance* makeLight(const CMPIObjectPath* ref, const char* id, const char** properties,
                               CMPIStatus* rc) {
  static const char* keys[] = {"CreationClassName", "DeviceID", NULL};
  CMPIObjectPath* path = makeLightPath(ref, id, rc);
  CMPIInstance* instance;
  CMPIArray* status;
  CMPIUint16 ok = 2;
  CMPIUint32 count = 7;
  if (path == NULL) return NULL;
  instance = CMNewInstance(broker, path, rc);
  if (CMIsNullObject(instance)) return NULL;
  CMSetPropertyFilter(instance, properties, keys);
  CMSetProperty(instance, "CreationClassName", kLightClass, CMPI_chars);
  CMSetProperty(instance, "DeviceID", id, CMPI_chars);
  CMSetProperty(instance, "ElementName", "Blue light", CMPI_chars);
  status = CMNewArray(broker, 1, CMPI_uint16, rc);
  if (!CMIsNullObject(status)) {
    CMSetArrayElementAt(status, 0, &ok, CMPI_uint16);
    CMSetProperty(instance, "OperationalStatus", &status, CMPI_uint16A);
  }
  CMSetProperty(instance, "Count", &count, CMPI_uint32);
  return instance;
}

/* ---- Instance MI ---------------------------------------------------------------------------- */

static CMPIStatus TestCleanup(CMPIInstanceMI* mi, const CMPIContext* ctx, CMPIBoolean terminating) {
  (void)mi;
  (void)ctx;
  (void)terminating;
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestEnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                        const CMPIResult* rslt, const CMPIObjectPath* ref) {
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  char id[32];
  int i;
  (void)mi;
  (void)ctx;
  CMTraceMessage(broker, CMPI_LEV_INFO, kComponent, "enumerating names", NULL);
  for (i = 1; i <= kLightCount; ++i) {
    CMPIObjectPath* path;
    deviceId(i, id, sizeof id);
    path = makeLightPath(ref, id, &rc);
    if (path == NULL) {
      CMTraceMessage(broker, CMPI_LEV_WARNING, kComponent, "newObjectPath failed", NULL);
      CMReturnWithChars(broker, CMPI_RC_ERR_FAILED, "cannot create a path");
    }
    CMReturnObjectPath(rslt, path);
  }
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestEnumInstances(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                    const CMPIResult* rslt, const CMPIObjectPath* ref,
                                    const char** properties) {
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  char id[32];
  int i;
  (void)mi;
  (void)ctx;
  /* The text comes from the string argument here, to exercise that form of the trace call. */
  CMTraceMessage(broker, CMPI_LEV_INFO, kComponent, NULL,
                 CMNewString(broker, "enumerating instances", NULL));
  for (i = 1; i <= kLightCount; ++i) {
    CMPIInstance* instance;
    deviceId(i, id, sizeof id);
    instance = makeLight(ref, id, properties, &rc);
    if (instance == NULL) {
      CMTraceMessage(broker, CMPI_LEV_WARNING, kComponent, "cannot create an instance", NULL);
      return rc.rc != CMPI_RC_OK ? rc : (CMPIStatus){CMPI_RC_ERR_FAILED, NULL};
    }
    CMReturnInstance(rslt, instance);
  }
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestGetInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                  const CMPIResult* rslt, const CMPIObjectPath* cop,
                                  const char** properties) {
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  CMPIData key = CMGetKey(cop, "DeviceID", &rc);
  CMPIInstance* instance;
  (void)mi;
  (void)ctx;
  if (rc.rc != CMPI_RC_OK || key.value.string == NULL || key.value.string->hdl == NULL) {
    CMReturnWithChars(broker, CMPI_RC_ERR_NOT_FOUND, "no DeviceID key");
  }
  instance = makeLight(cop, CMGetCharPtr(key.value.string), properties, &rc);
  if (instance == NULL) return rc;
  CMReturnInstance(rslt, instance);
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestCreateInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                     const CMPIResult* rslt, const CMPIObjectPath* cop,
                                     const CMPIInstance* inst) {
  (void)mi;
  (void)ctx;
  (void)rslt;
  (void)cop;
  (void)inst;
  CMReturn(CMPI_RC_ERR_NOT_SUPPORTED);
}

static CMPIStatus TestModifyInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                     const CMPIResult* rslt, const CMPIObjectPath* cop,
                                     const CMPIInstance* inst, const char** properties) {
  (void)mi;
  (void)ctx;
  (void)rslt;
  (void)cop;
  (void)inst;
  (void)properties;
  CMReturn(CMPI_RC_ERR_NOT_SUPPORTED);
}

static CMPIStatus TestDeleteInstance(CMPIInstanceMI* mi, const CMPIContext* ctx,
                                     const CMPIResult* rslt, const CMPIObjectPath* cop) {
  (void)mi;
  (void)ctx;
  (void)rslt;
  (void)cop;
  CMReturn(CMPI_RC_ERR_NOT_SUPPORTED);
}

static CMPIStatus TestExecQuery(CMPIInstanceMI* mi, const CMPIContext* ctx, const CMPIResult* rslt,
                                const CMPIObjectPath* cop, const char* query, const char* lang) {
  (void)mi;
  (void)ctx;
  (void)rslt;
  (void)cop;
  (void)query;
  (void)lang;
  CMReturn(CMPI_RC_ERR_NOT_SUPPORTED);
}

/* ---- Association MI -------------------------------------------------------------------------- */

static CMPIStatus TestAssociationCleanup(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                         CMPIBoolean terminating) {
  (void)mi;
  (void)ctx;
  (void)terminating;
  CMReturn(CMPI_RC_OK);
}

/* Enumerates the computer systems through the broker; NULL (with *rc set) when that fails. */
static CMPIEnumeration* systems(const CMPIContext* ctx, const CMPIObjectPath* ref, int names,
                                CMPIStatus* rc) {
  CMPIObjectPath* classPath = CMNewObjectPath(broker, nameSpaceOf(ref), kSystemClass, rc);
  CMPIEnumeration* enumeration;
  if (CMIsNullObject(classPath)) return NULL;
  enumeration = names ? CBEnumInstanceNames(broker, ctx, classPath, rc)
                      : CBEnumInstances(broker, ctx, classPath, NULL, rc);
  if (rc->rc != CMPI_RC_OK || CMIsNullObject(enumeration)) {
    CMTraceMessage(broker, CMPI_LEV_WARNING, kComponent, "up-call failed", NULL);
    return NULL;
  }
  return enumeration;
}

static CMPIStatus TestAssociators(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                  const CMPIResult* rslt, const CMPIObjectPath* op,
                                  const char* assocClass, const char* resultClass, const char* role,
                                  const char* resultRole, const char** properties) {
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  CMPIEnumeration* enumeration;
  (void)mi;
  (void)role;
  (void)resultRole;
  (void)properties;
  /* The filter arguments are traced as they arrive, NULL included. */
  CMTraceMessage(broker, CMPI_LEV_INFO, "assocClass", assocClass, NULL);
  CMTraceMessage(broker, CMPI_LEV_INFO, "resultClass", resultClass, NULL);
  enumeration = systems(ctx, op, 0, &rc);
  if (enumeration == NULL) return rc;
  while (CMHasNext(enumeration, &rc)) {
    CMPIData item = CMGetNext(enumeration, &rc);
    CMReturnInstance(rslt, item.value.inst);
  }
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestAssociatorNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                      const CMPIResult* rslt, const CMPIObjectPath* op,
                                      const char* assocClass, const char* resultClass,
                                      const char* role, const char* resultRole) {
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  CMPIEnumeration* enumeration;
  (void)mi;
  (void)assocClass;
  (void)resultClass;
  CMTraceMessage(broker, CMPI_LEV_INFO, "role", role, NULL);
  CMTraceMessage(broker, CMPI_LEV_INFO, "resultRole", resultRole, NULL);
  enumeration = systems(ctx, op, 1, &rc);
  if (enumeration == NULL) return rc;
  while (CMHasNext(enumeration, &rc)) {
    CMPIData item = CMGetNext(enumeration, &rc);
    CMReturnObjectPath(rslt, item.value.ref);
  }
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

/* One KESTA_BlueLightSystemDevice per computer system, with the light `op` as PartComponent. */
static CMPIStatus references(const CMPIContext* ctx, const CMPIResult* rslt,
                             const CMPIObjectPath* op, const char** properties, int names) {
  static const char* keys[] = {"GroupComponent", "PartComponent", NULL};
  CMPIStatus rc = {CMPI_RC_OK, NULL};
  CMPIEnumeration* enumeration = systems(ctx, op, 1, &rc);
  if (enumeration == NULL) return rc;
  while (CMHasNext(enumeration, &rc)) {
    CMPIData item = CMGetNext(enumeration, &rc);
    CMPIObjectPath* assocPath = CMNewObjectPath(broker, nameSpaceOf(op), kSystemDeviceClass, &rc);
    CMPIInstance* instance;
    if (CMIsNullObject(assocPath)) return rc;
    instance = CMNewInstance(broker, assocPath, &rc);
    if (CMIsNullObject(instance)) return rc;
    CMSetPropertyFilter(instance, properties, keys);
    CMSetProperty(instance, "GroupComponent", &item.value, CMPI_ref);
    CMSetProperty(instance, "PartComponent", &op, CMPI_ref);
    if (names) {
      CMPIObjectPath* path = CMGetObjectPath(instance, &rc);
      if (CMIsNullObject(path)) return rc;
      CMReturnObjectPath(rslt, path);
    } else {
      CMReturnInstance(rslt, instance);
    }
  }
  CMReturnDone(rslt);
  CMReturn(CMPI_RC_OK);
}

static CMPIStatus TestReferences(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                 const CMPIResult* rslt, const CMPIObjectPath* op,
                                 const char* resultClass, const char* role,
                                 const char** properties) {
  (void)mi;
  (void)resultClass;
  (void)role;
  return references(ctx, rslt, op, properties, 0);
}

static CMPIStatus TestReferenceNames(CMPIAssociationMI* mi, const CMPIContext* ctx,
                                     const CMPIResult* rslt, const CMPIObjectPath* op,
                                     const char* resultClass, const char* role) {
  (void)mi;
  (void)resultClass;
  (void)role;
  return references(ctx, rslt, op, NULL, 1);
}

/* ---- Factories that fail on purpose ---------------------------------------------------------- */

CMPI_EXTERN_C CMPIInstanceMI* HostTestNullProvider_Create_InstanceMI(const CMPIBroker* brkr,
                                                                     const CMPIContext* ctx,
                                                                     CMPIStatus* rc) {
  (void)ctx;
  if (rc != NULL) {
    rc->rc = CMPI_RC_ERR_FAILED;
    rc->msg = CMNewString(brkr, "cannot start", NULL);
  }
  return NULL;
}

static CMPIInstanceMIFT futureTable = {CMPICurrentVersion,
                                       300,
                                       "instanceHostTestFutureProvider",
                                       TestCleanup,
                                       TestEnumInstanceNames,
                                       TestEnumInstances,
                                       TestGetInstance,
                                       TestCreateInstance,
                                       TestModifyInstance,
                                       TestDeleteInstance,
                                       TestExecQuery};

CMPI_EXTERN_C CMPIInstanceMI* HostTestFutureProvider_Create_InstanceMI(const CMPIBroker* brkr,
                                                                       const CMPIContext* ctx,
                                                                       CMPIStatus* rc) {
  static CMPIInstanceMI mi = {NULL, &futureTable};
  (void)ctx;
  (void)rc;
  broker = brkr;
  return &mi;
}

CMPI_EXTERN_C CMPIInstanceMI* HostTestNoTableProvider_Create_InstanceMI(const CMPIBroker* brkr,
                                                                        const CMPIContext* ctx,
                                                                        CMPIStatus* rc) {
  static CMPIInstanceMI mi = {NULL, NULL};
  (void)brkr;
  (void)ctx;
  (void)rc;
  return &mi;
}

/* ---- The MI tables and exported factories of HostTestProvider ------------------------------ */

/* The stub macros end without a semicolon, which the formatter cannot follow; they stay last. */
/* clang-format off */
CMInstanceMIStub(Test, HostTestProvider, broker, CMNoHook)
CMAssociationMIStub(Test, HostTestProvider, broker, CMNoHook)
