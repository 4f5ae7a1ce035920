/*
 * cmpimacs.h - CMPI 2.0 convenience macros.
 *
 * Holds the short-hand macros that call a slot of a function table (CMGetProperty(inst, n, rc)
 * instead of inst->ft->getProperty(inst, n, rc)), the status and return helpers, the message
 * argument helpers for CMGetMessage, and the MI stub macros that generate a C provider's function
 * table and its exported factory function.
 *
 * Everything here is a function-like macro. A few notes on how they are written:
 *  - The object argument is evaluated more than once (it names the table and is the first
 *    argument of the call), so pass a plain variable, not an expression with side effects.
 *  - Value arguments of the setters are cast with a C-style cast to CMPIValue *, so any pointer
 *    is accepted, also from C++ (string literals, const pointers).
 *  - CMReturn* and CMSetStatus* expand to a braced block, not to do { } while (0), because that is
 *    how provider code expects them; "if (x) CMReturn(rc); else ..." does not compile.
 *  - CMPI_INLINE (typed inline functions instead of macros) and DOC_ONLY are not supported; the
 *    macros are used regardless of those switches.
 *  - The C++ factory macros (CM*MIFactory, CMProviderBase) refer to the classes of a separate
 *    C++ provider library (CmpiBaseMI, CmpiInstanceMI, ..., CmpiProviderBase) that these headers
 *    do not declare. They are defined in C too, so that #ifdef tests see the same set of names
 *    in both languages, but they only compile when expanded in C++ next to that library.
 */
#ifndef _CMPIMACS_H_
#define _CMPIMACS_H_

#include "cmpidt.h"
#include "cmpift.h"

/* ------------------------------------------------------------------------------------------- */
/* Status and return                                                                           */
/* ------------------------------------------------------------------------------------------- */

/* Leave the calling function with a CMPIStatus of rc (a CMPIrc value) and no message. */
#define CMReturn(rc)                             \
  {                                              \
    CMPIStatus cmpiReturnStatus_ = {(rc), NULL}; \
    return cmpiReturnStatus_;                    \
  }

/* Same, with a message given as a CMPIString *. */
#define CMReturnWithString(rc, str)               \
  {                                               \
    CMPIStatus cmpiReturnStatus_ = {(rc), (str)}; \
    return cmpiReturnStatus_;                     \
  }

/* Same, with a message given as a C string (the broker turns it into a CMPIString). */
#define CMReturnWithChars(mb, rc, chars)                                              \
  {                                                                                   \
    CMPIStatus cmpiReturnStatus_ = {(rc), (mb)->eft->newString((mb), (chars), NULL)}; \
    return cmpiReturnStatus_;                                                         \
  }

/*
 * Fill in a CMPIStatus through a pointer. Like the call sites expect, st must not be NULL; check
 * optional rc pointers before using these.
 */
#define CMSetStatus(st, rcp) \
  {                          \
    (st)->rc = (rcp);        \
    (st)->msg = NULL;        \
  }

#define CMSetStatusWithString(st, rcp, string) \
  {                                            \
    (st)->rc = (rcp);                          \
    (st)->msg = (string);                      \
  }

#define CMSetStatusWithChars(mb, st, rcp, chars)           \
  {                                                        \
    (st)->rc = (rcp);                                      \
    (st)->msg = (mb)->eft->newString((mb), (chars), NULL); \
  }

/* ------------------------------------------------------------------------------------------- */
/* Tests on objects and values                                                                 */
/* ------------------------------------------------------------------------------------------- */

/* True when the object pointer or its broker handle (the first member) is NULL. */
#define CMIsNullObject(obj) ((obj) == NULL || *((void**)(obj)) == NULL)

/*
 * These yield the masked bit (256, 512 or 8192), not 1: test them directly or with != 0, never
 * store them in a CMPIBoolean, which would truncate them to 0. The argument is parenthesised, so
 * CMIsNullValue(*p) works too.
 */
#define CMIsNullValue(data) (((data).state) & CMPI_nullValue)
#define CMIsKeyValue(data) (((data).state) & CMPI_keyValue)
#define CMIsArray(data) (((data).type) & CMPI_ARRAY)

/* ------------------------------------------------------------------------------------------- */
/* Any encapsulated object (release and clone sit in the same slots of every table)            */
/* ------------------------------------------------------------------------------------------- */

#define CMClone(obj, rc) ((obj)->ft->clone((obj), (rc)))
#define CMRelease(obj) ((obj)->ft->release((obj)))

/* ------------------------------------------------------------------------------------------- */
/* Broker factory services (CMPIBrokerEncFT)                                                   */
/* ------------------------------------------------------------------------------------------- */

#define CMNewInstance(mb, op, rc) ((mb)->eft->newInstance((mb), (op), (rc)))
#define CMNewObjectPath(mb, ns, cn, rc) ((mb)->eft->newObjectPath((mb), (ns), (cn), (rc)))
#define CMNewString(mb, data, rc) ((mb)->eft->newString((mb), (data), (rc)))
#define CMNewArgs(mb, rc) ((mb)->eft->newArgs((mb), (rc)))
#define CMNewArray(mb, max, type, rc) ((mb)->eft->newArray((mb), (max), (type), (rc)))
#define CMNewDateTime(mb, rc) ((mb)->eft->newDateTime((mb), (rc)))
#define CMNewDateTimeFromBinary(mb, binTime, interval, rc) \
  ((mb)->eft->newDateTimeFromBinary((mb), (binTime), (interval), (rc)))
#define CMNewDateTimeFromChars(mb, utcTime, rc) \
  ((mb)->eft->newDateTimeFromChars((mb), (utcTime), (rc)))
#define CMNewSelectExp(mb, query, lang, projection, st) \
  ((mb)->eft->newSelectExp((mb), (query), (lang), (projection), (st)))
#define CMClassPathIsA(mb, op, type, rc) ((mb)->eft->classPathIsA((mb), (op), (type), (rc)))

/* These take any encapsulated object. */
#define CDToString(mb, object, rc) ((mb)->eft->toString((mb), (void*)(object), (rc)))
#define CDIsOfType(mb, object, type, rc) ((mb)->eft->isOfType((mb), (void*)(object), (type), (rc)))
#define CDGetType(mb, object, rc) ((mb)->eft->getType((mb), (void*)(object), (rc)))

#ifdef CMPI_VER_100
/* severity is a CMPISeverity value, level a CMPILevel value. */
#define CMLogMessage(mb, severity, id, text, string) \
  ((mb)->eft->logMessage((mb), (severity), (id), (text), (string)))
#define CMTraceMessage(mb, level, component, text, string) \
  ((mb)->eft->trace((mb), (level), (component), (text), (string)))
#endif

#ifdef CMPI_VER_85
/* fmtargs is one CMFmtArgsN(...) group: it supplies the count and the (type, value) pairs. */
#define CMGetMessage(mb, msgId, defMsg, rc, fmtargs) \
  ((mb)->eft->getMessage((mb), (msgId), (defMsg), (rc), fmtargs))
#endif

#ifdef CMPI_VER_200
#define CMNewCMPIError(mb, owner, msgID, msg, sev, pc, cimStatusCode, rc) \
  ((mb)->eft->newCMPIError((mb), (owner), (msgID), (msg), (sev), (pc), (cimStatusCode), (rc)))
#define CMOpenMessageFile(mb, msgFile, msgFileHandle) \
  ((mb)->eft->openMessageFile((mb), (msgFile), (msgFileHandle)))
#define CMCloseMessageFile(mb, msgFileHandle) ((mb)->eft->closeMessageFile((mb), (msgFileHandle)))
#define CMGetMessage2(mb, msgId, msgFileHandle, defMsg, rc, fmtargs) \
  ((mb)->eft->getMessage2((mb), (msgId), (msgFileHandle), (defMsg), (rc), fmtargs))
#endif

/* ------------------------------------------------------------------------------------------- */
/* Message arguments for CMGetMessage / CMGetMessage2                                          */
/* ------------------------------------------------------------------------------------------- */

#ifdef CMPI_VER_85
/*
 * Each CMFmtX(v) yields a type code and the value converted to the C type the broker reads for
 * that code. CMFmtString passes a CMPIString * with the CMPI_string code.
 */
#define CMFmtSint(v) CMPI_sint32, ((long int)(v))
#define CMFmtUint(v) CMPI_uint32, ((unsigned long int)(v))
#define CMFmtSint64(v) CMPI_sint64, ((long long int)(v))
#define CMFmtUint64(v) CMPI_uint64, ((unsigned long long int)(v))
#define CMFmtReal(v) CMPI_real64, ((double)(v))
#define CMFmtBoolean(v) CMPI_boolean, ((int)(v))
#define CMFmtChars(v) CMPI_chars, ((char*)(v))
#define CMFmtString(v) CMPI_string, ((CMPIString*)(v))

/* A count followed by its arguments. */
#define CMFmtArgs0() 0
#define CMFmtArgs1(v1) 1, v1
#define CMFmtArgs2(v1, v2) 2, v1, v2
#define CMFmtArgs3(v1, v2, v3) 3, v1, v2, v3
#define CMFmtArgs4(v1, v2, v3, v4) 4, v1, v2, v3, v4
#define CMFmtArgs5(v1, v2, v3, v4, v5) 5, v1, v2, v3, v4, v5
#define CMFmtArgs6(v1, v2, v3, v4, v5, v6) 6, v1, v2, v3, v4, v5, v6
#define CMFmtArgs7(v1, v2, v3, v4, v5, v6, v7) 7, v1, v2, v3, v4, v5, v6, v7
#define CMFmtArgs8(v1, v2, v3, v4, v5, v6, v7, v8) 8, v1, v2, v3, v4, v5, v6, v7, v8
#define CMFmtArgs9(v1, v2, v3, v4, v5, v6, v7, v8, v9) 9, v1, v2, v3, v4, v5, v6, v7, v8, v9
#define CMFmtArgs10(v1, v2, v3, v4, v5, v6, v7, v8, v9, v10) \
  10, v1, v2, v3, v4, v5, v6, v7, v8, v9, v10
#endif

/* ------------------------------------------------------------------------------------------- */
/* Broker up-calls (CMPIBrokerFT)                                                              */
/* ------------------------------------------------------------------------------------------- */

#define CBPrepareAttachThread(mb, ctx) ((mb)->bft->prepareAttachThread((mb), (ctx)))
#define CBAttachThread(mb, ctx) ((mb)->bft->attachThread((mb), (ctx)))
#define CBDetachThread(mb, ctx) ((mb)->bft->detachThread((mb), (ctx)))
#define CBDeliverIndication(mb, ctx, ns, ind) \
  ((mb)->bft->deliverIndication((mb), (ctx), (ns), (ind)))
#define CBEnumInstanceNames(mb, ctx, op, rc) \
  ((mb)->bft->enumerateInstanceNames((mb), (ctx), (op), (rc)))
#define CBEnumInstances(mb, ctx, op, properties, rc) \
  ((mb)->bft->enumerateInstances((mb), (ctx), (op), (properties), (rc)))
#define CBGetInstance(mb, ctx, op, properties, rc) \
  ((mb)->bft->getInstance((mb), (ctx), (op), (properties), (rc)))
#define CBCreateInstance(mb, ctx, op, inst, rc) \
  ((mb)->bft->createInstance((mb), (ctx), (op), (inst), (rc)))
#ifdef CMPI_VER_100
#define CBModifyInstance(mb, ctx, op, inst, properties) \
  ((mb)->bft->modifyInstance((mb), (ctx), (op), (inst), (properties)))
#endif
#define CBDeleteInstance(mb, ctx, op) ((mb)->bft->deleteInstance((mb), (ctx), (op)))
/* The query comes before the query language. */
#define CBExecQuery(mb, ctx, op, query, lang, rc) \
  ((mb)->bft->execQuery((mb), (ctx), (op), (query), (lang), (rc)))
#define CBAssociators(mb, ctx, op, assocClass, resultClass, role, resultRole, properties, rc)   \
  ((mb)->bft->associators((mb), (ctx), (op), (assocClass), (resultClass), (role), (resultRole), \
                          (properties), (rc)))
#define CBAssociatorNames(mb, ctx, op, assocClass, resultClass, role, resultRole, rc) \
  ((mb)->bft->associatorNames((mb), (ctx), (op), (assocClass), (resultClass), (role), \
                              (resultRole), (rc)))
#define CBReferences(mb, ctx, op, resultClass, role, properties, rc) \
  ((mb)->bft->references((mb), (ctx), (op), (resultClass), (role), (properties), (rc)))
#define CBReferenceNames(mb, ctx, op, resultClass, role, rc) \
  ((mb)->bft->referenceNames((mb), (ctx), (op), (resultClass), (role), (rc)))
#define CBInvokeMethod(mb, ctx, op, method, in, out, rc) \
  ((mb)->bft->invokeMethod((mb), (ctx), (op), (method), (in), (out), (rc)))
#define CBSetProperty(mb, ctx, op, name, value, type) \
  ((mb)->bft->setProperty((mb), (ctx), (op), (name), (CMPIValue*)(value), (type)))
#define CBGetProperty(mb, ctx, op, name, rc) \
  ((mb)->bft->getProperty((mb), (ctx), (op), (name), (rc)))

/* Broker data fields. */
#define CBBrokerVersion(mb) ((mb)->bft->brokerVersion)
#define CBBrokerName(mb) ((mb)->bft->brokerName)
/* The broker's CMPI_MB_* capability bits, kept in brokerCapabilities. */
#define CBGetClassification(mb) ((mb)->bft->brokerCapabilities)

/* ------------------------------------------------------------------------------------------- */
/* Instances (CMPIInstanceFT)                                                                  */
/* ------------------------------------------------------------------------------------------- */

#define CMGetProperty(inst, name, rc) ((inst)->ft->getProperty((inst), (name), (rc)))
#define CMGetPropertyAt(inst, index, name, rc) \
  ((inst)->ft->getPropertyAt((inst), (index), (name), (rc)))
#define CMSetProperty(inst, name, value, type) \
  ((inst)->ft->setProperty((inst), (name), (CMPIValue*)(value), (type)))
#define CMGetPropertyCount(inst, rc) ((inst)->ft->getPropertyCount((inst), (rc)))
#define CMGetObjectPath(inst, rc) ((inst)->ft->getObjectPath((inst), (rc)))
#ifdef CMPI_VER_100
#define CMSetObjectPath(inst, op) ((inst)->ft->setObjectPath((inst), (op)))
#endif
#define CMSetPropertyFilter(inst, propertyList, keys) \
  ((inst)->ft->setPropertyFilter((inst), (propertyList), (keys)))
#ifdef CMPI_VER_200
#define CMSetPropertyWithOrigin(inst, name, value, type, origin) \
  ((inst)->ft->setPropertyWithOrigin((inst), (name), (CMPIValue*)(value), (type), (origin)))
#endif

/* ------------------------------------------------------------------------------------------- */
/* Object paths (CMPIObjectPathFT)                                                             */
/* ------------------------------------------------------------------------------------------- */

#define CMSetNameSpace(op, ns) ((op)->ft->setNameSpace((op), (ns)))
#define CMGetNameSpace(op, rc) ((op)->ft->getNameSpace((op), (rc)))
#define CMSetHostname(op, hn) ((op)->ft->setHostname((op), (hn)))
#define CMGetHostname(op, rc) ((op)->ft->getHostname((op), (rc)))
#define CMSetClassName(op, cn) ((op)->ft->setClassName((op), (cn)))
#define CMGetClassName(op, rc) ((op)->ft->getClassName((op), (rc)))
#define CMAddKey(op, name, value, type) \
  ((op)->ft->addKey((op), (name), (CMPIValue*)(value), (type)))
#define CMGetKey(op, name, rc) ((op)->ft->getKey((op), (name), (rc)))
#define CMGetKeyAt(op, index, name, rc) ((op)->ft->getKeyAt((op), (index), (name), (rc)))
#define CMGetKeyCount(op, rc) ((op)->ft->getKeyCount((op), (rc)))
#define CMSetNameSpaceFromObjectPath(op, src) ((op)->ft->setNameSpaceFromObjectPath((op), (src)))
#define CMSetHostAndNameSpaceFromObjectPath(op, src) \
  ((op)->ft->setHostAndNameSpaceFromObjectPath((op), (src)))
#define CMGetClassQualifier(op, qName, rc) ((op)->ft->getClassQualifier((op), (qName), (rc)))
#define CMGetPropertyQualifier(op, pName, qName, rc) \
  ((op)->ft->getPropertyQualifier((op), (pName), (qName), (rc)))
#define CMGetMethodQualifier(op, methodName, qName, rc) \
  ((op)->ft->getMethodQualifier((op), (methodName), (qName), (rc)))
#define CMGetParameterQualifier(op, mName, pName, qName, rc) \
  ((op)->ft->getParameterQualifier((op), (mName), (pName), (qName), (rc)))
#ifdef CMPI_VER_86
#define CMObjectPathToString(op, rc) ((op)->ft->toString((op), (rc)))
#endif

/* ------------------------------------------------------------------------------------------- */
/* Arrays, arguments, strings, date/time values, enumerations                                  */
/* ------------------------------------------------------------------------------------------- */

#define CMGetArrayCount(ar, rc) ((ar)->ft->getSize((ar), (rc)))
#define CMGetArrayType(ar, rc) ((ar)->ft->getSimpleType((ar), (rc)))
#define CMGetArrayElementAt(ar, index, rc) ((ar)->ft->getElementAt((ar), (index), (rc)))
#define CMSetArrayElementAt(ar, index, value, type) \
  ((ar)->ft->setElementAt((ar), (index), (CMPIValue*)(value), (type)))

#define CMAddArg(as, name, value, type) \
  ((as)->ft->addArg((as), (name), (CMPIValue*)(value), (type)))
#define CMGetArg(as, name, rc) ((as)->ft->getArg((as), (name), (rc)))
#define CMGetArgAt(as, index, name, rc) ((as)->ft->getArgAt((as), (index), (name), (rc)))
#define CMGetArgCount(as, rc) ((as)->ft->getArgCount((as), (rc)))

#define CMGetCharsPtr(st, rc) ((st)->ft->getCharPtr((st), (rc)))
/*
 * Reads the character pointer straight from the string's handle without calling the broker; it
 * relies on the broker keeping the characters in hdl. Prefer CMGetCharsPtr.
 */
#define CMGetCharPtr(str) ((char*)(str)->hdl)

#define CMGetStringFormat(dt, rc) ((dt)->ft->getStringFormat((dt), (rc)))
#define CMGetBinaryFormat(dt, rc) ((dt)->ft->getBinaryFormat((dt), (rc)))
#define CMIsInterval(dt, rc) ((dt)->ft->isInterval((dt), (rc)))

#define CMHasNext(en, rc) ((en)->ft->hasNext((en), (rc)))
#define CMGetNext(en, rc) ((en)->ft->getNext((en), (rc)))
#define CMToArray(en, rc) ((en)->ft->toArray((en), (rc)))

/* ------------------------------------------------------------------------------------------- */
/* Results, contexts, queries                                                                  */
/* ------------------------------------------------------------------------------------------- */

/* Unlike CMReturn these do not leave the caller; they yield the CMPIStatus of the call. */
#define CMReturnData(rslt, value, type) \
  ((rslt)->ft->returnData((rslt), (CMPIValue*)(value), (type)))
#define CMReturnInstance(rslt, inst) ((rslt)->ft->returnInstance((rslt), (inst)))
#define CMReturnObjectPath(rslt, ref) ((rslt)->ft->returnObjectPath((rslt), (ref)))
#define CMReturnDone(rslt) ((rslt)->ft->returnDone((rslt)))
#ifdef CMPI_VER_200
#define CMReturnError(rslt, er) ((rslt)->ft->returnError((rslt), (er)))
#endif

#define CMGetContextEntry(ctx, name, rc) ((ctx)->ft->getEntry((ctx), (name), (rc)))
#define CMGetContextEntryAt(ctx, index, name, rc) \
  ((ctx)->ft->getEntryAt((ctx), (index), (name), (rc)))
#define CMGetContextEntryCount(ctx, rc) ((ctx)->ft->getEntryCount((ctx), (rc)))
#define CMAddContextEntry(ctx, name, value, type) \
  ((ctx)->ft->addEntry((ctx), (name), (CMPIValue*)(value), (type)))

#define CMGetSelExpString(se, rc) ((se)->ft->getString((se), (rc)))
#define CMEvaluateSelExp(se, inst, rc) ((se)->ft->evaluate((se), (inst), (rc)))
#ifdef CMPI_VER_87
#define CMEvaluateSelExpUsingAccessor(se, accessor, parm, rc) \
  ((se)->ft->evaluateUsingAccessor((se), (accessor), (parm), (rc)))
#endif
#define CMGetDoc(se, rc) ((se)->ft->getDOC((se), (rc)))
#define CMGetCod(se, rc) ((se)->ft->getCOD((se), (rc)))

#define CMGetSubCondCountAndType(sc, type, rc) ((sc)->ft->getCountAndType((sc), (type), (rc)))
#define CMGetSubCondAt(sc, index, rc) ((sc)->ft->getSubCondAt((sc), (index), (rc)))

#define CMGetPredicateCount(sc, rc) ((sc)->ft->getCount((sc), (rc)))
#define CMGetPredicateAt(sc, index, rc) ((sc)->ft->getPredicateAt((sc), (index), (rc)))
#define CMGetPredicate(sc, name, rc) ((sc)->ft->getPredicate((sc), (name), (rc)))

#define CMGetPredicateData(pr, type, op, lhs, rhs) \
  ((pr)->ft->getData((pr), (type), (op), (lhs), (rhs)))
#ifdef CMPI_VER_100
#define CMEvaluatePredicateUsingAccessor(pr, accessorFnc, parm, rc) \
  ((pr)->ft->evaluateUsingAccessor((pr), (accessorFnc), (parm), (rc)))
#endif

/* ------------------------------------------------------------------------------------------- */
/* Extended errors (CMPIErrorFT)                                                               */
/* ------------------------------------------------------------------------------------------- */

#ifdef CMPI_VER_200
#define CMGetErrorType(err, rc) ((err)->ft->getErrorType((err), (rc)))
#define CMGetOtherErrorType(err, rc) ((err)->ft->getOtherErrorType((err), (rc)))
#define CMGetOwningEntity(err, rc) ((err)->ft->getOwningEntity((err), (rc)))
#define CMGetMessageID(err, rc) ((err)->ft->getMessageID((err), (rc)))
/* Named so that it does not clash with the broker's CMGetMessage. */
#define CMGetErrorMessage(err, rc) ((err)->ft->getMessage((err), (rc)))
#define CMGetPerceivedSeverity(err, rc) ((err)->ft->getPerceivedSeverity((err), (rc)))
#define CMGetProbableCause(err, rc) ((err)->ft->getProbableCause((err), (rc)))
#define CMGetProbableCauseDescription(err, rc) ((err)->ft->getProbableCauseDescription((err), (rc)))
#define CMGetRecommendedActions(err, rc) ((err)->ft->getRecommendedActions((err), (rc)))
#define CMGetErrorSource(err, rc) ((err)->ft->getErrorSource((err), (rc)))
#define CMGetErrorSourceFormat(err, rc) ((err)->ft->getErrorSourceFormat((err), (rc)))
#define CMGetOtherErrorSourceFormat(err, rc) ((err)->ft->getOtherErrorSourceFormat((err), (rc)))
#define CMGetCIMStatusCode(err, rc) ((err)->ft->getCIMStatusCode((err), (rc)))
#define CMGetCIMStatusCodeDescription(err, rc) ((err)->ft->getCIMStatusCodeDescription((err), (rc)))
#define CMGetMessageArguments(err, rc) ((err)->ft->getMessageArguments((err), (rc)))

#define CMSetErrorType(err, errType) ((err)->ft->setErrorType((err), (errType)))
#define CMSetOtherErrorType(err, otherType) ((err)->ft->setOtherErrorType((err), (otherType)))
#define CMSetProbableCauseDescription(err, description) \
  ((err)->ft->setProbableCauseDescription((err), (description)))
#define CMSetRecommendedActions(err, actions) ((err)->ft->setRecommendedActions((err), (actions)))
#define CMSetErrorSource(err, source) ((err)->ft->setErrorSource((err), (source)))
#define CMSetErrorSourceFormat(err, sourceFormat) \
  ((err)->ft->setErrorSourceFormat((err), (sourceFormat)))
#define CMSetOtherErrorSourceFormat(err, otherFormat) \
  ((err)->ft->setOtherErrorSourceFormat((err), (otherFormat)))
#define CMSetCIMStatusCodeDescription(err, description) \
  ((err)->ft->setCIMStatusCodeDescription((err), (description)))
#define CMSetMessageArguments(err, msgArgs) ((err)->ft->setMessageArguments((err), (msgArgs)))
#endif

/* ------------------------------------------------------------------------------------------- */
/* MI stubs for C providers                                                                    */
/* ------------------------------------------------------------------------------------------- */

/*
 * Each stub defines the static function table of one MI type, filled with the provider's
 * functions <pfx>Xxx in slot order, and the exported factory <pn>_Create_<Type>MI that the broker
 * looks up by name. The factory stores the broker pointer in the provider's variable 'broker'
 * (declared by the provider as const CMPIBroker *), runs 'hook' (CMNoHook for none) and returns
 * a static MI record. ftVersion and miVersion are both CMPICurrentVersion.
 *
 * The tables have fixed names, so a translation unit holds at most one stub of each kind.
 */

#define CMNoHook

#ifdef CMPI_VER_100
#define CMInstanceMIStubChange(pfx) pfx##ModifyInstance
#else
#define CMInstanceMIStubChange(pfx) pfx##SetInstance
#endif

#define CMInstanceMIStub(pfx, pn, broker, hook)                                                  \
  static CMPIInstanceMIFT instMIFT__ = {                                                         \
      CMPICurrentVersion,          CMPICurrentVersion,  "instance" #pn,   pfx##Cleanup,          \
      pfx##EnumInstanceNames,      pfx##EnumInstances,  pfx##GetInstance, pfx##CreateInstance,   \
      CMInstanceMIStubChange(pfx), pfx##DeleteInstance, pfx##ExecQuery};                         \
  CMPI_EXTERN_C CMPIInstanceMI* pn##_Create_InstanceMI(const CMPIBroker* brkr,                   \
                                                       const CMPIContext* ctx, CMPIStatus* rc) { \
    static CMPIInstanceMI mi = {NULL, &instMIFT__};                                              \
    (void)ctx;                                                                                   \
    (void)rc;                                                                                    \
    broker = brkr;                                                                               \
    hook;                                                                                        \
    return &mi;                                                                                  \
  }

#define CMAssociationMIStub(pfx, pn, broker, hook)                                          \
  static CMPIAssociationMIFT assocMIFT__ = {                                                \
      CMPICurrentVersion, CMPICurrentVersion,   "association" #pn, pfx##AssociationCleanup, \
      pfx##Associators,   pfx##AssociatorNames, pfx##References,   pfx##ReferenceNames};    \
  CMPI_EXTERN_C CMPIAssociationMI* pn##_Create_AssociationMI(                               \
      const CMPIBroker* brkr, const CMPIContext* ctx, CMPIStatus* rc) {                     \
    static CMPIAssociationMI mi = {NULL, &assocMIFT__};                                     \
    (void)ctx;                                                                              \
    (void)rc;                                                                               \
    broker = brkr;                                                                          \
    hook;                                                                                   \
    return &mi;                                                                             \
  }

#define CMMethodMIStub(pfx, pn, broker, hook)                                                      \
  static CMPIMethodMIFT methMIFT__ = {CMPICurrentVersion, CMPICurrentVersion, "method" #pn,        \
                                      pfx##MethodCleanup, pfx##InvokeMethod};                      \
  CMPI_EXTERN_C CMPIMethodMI* pn##_Create_MethodMI(const CMPIBroker* brkr, const CMPIContext* ctx, \
                                                   CMPIStatus* rc) {                               \
    static CMPIMethodMI mi = {NULL, &methMIFT__};                                                  \
    (void)ctx;                                                                                     \
    (void)rc;                                                                                      \
    broker = brkr;                                                                                 \
    hook;                                                                                          \
    return &mi;                                                                                    \
  }

/* The 2.0 slot setPropertyWithOrigin is left NULL. */
#ifdef CMPI_VER_200
#define CMPropertyMIStubExtensions_ , NULL
#else
#define CMPropertyMIStubExtensions_
#endif

#define CMPropertyMIStub(pfx, pn, broker, hook)                                                  \
  static CMPIPropertyMIFT propMIFT__ = {                                                         \
      CMPICurrentVersion,   CMPICurrentVersion, "property" #pn,                                  \
      pfx##PropertyCleanup, pfx##SetProperty,   pfx##GetProperty CMPropertyMIStubExtensions_};   \
  CMPI_EXTERN_C CMPIPropertyMI* pn##_Create_PropertyMI(const CMPIBroker* brkr,                   \
                                                       const CMPIContext* ctx, CMPIStatus* rc) { \
    static CMPIPropertyMI mi = {NULL, &propMIFT__};                                              \
    (void)ctx;                                                                                   \
    (void)rc;                                                                                    \
    broker = brkr;                                                                               \
    hook;                                                                                        \
    return &mi;                                                                                  \
  }

#ifdef CMPI_VER_86
#define CMIndicationMIStubExtensions(pfx) pfx##EnableIndications, pfx##DisableIndications,
#else
#define CMIndicationMIStubExtensions(pfx)
#endif

/* Note the capital I in the miName of indication providers. */
#define CMIndicationMIStub(pfx, pn, broker, hook)                                        \
  static CMPIIndicationMIFT indMIFT__ = {                                                \
      CMPICurrentVersion,     CMPICurrentVersion,    "Indication" #pn,                   \
      pfx##IndicationCleanup, pfx##AuthorizeFilter,  pfx##MustPoll,                      \
      pfx##ActivateFilter,    pfx##DeActivateFilter, CMIndicationMIStubExtensions(pfx)}; \
  CMPI_EXTERN_C CMPIIndicationMI* pn##_Create_IndicationMI(                              \
      const CMPIBroker* brkr, const CMPIContext* ctx, CMPIStatus* rc) {                  \
    static CMPIIndicationMI mi = {NULL, &indMIFT__};                                     \
    (void)ctx;                                                                           \
    (void)rc;                                                                            \
    broker = brkr;                                                                       \
    hook;                                                                                \
    return &mi;                                                                          \
  }

/* ------------------------------------------------------------------------------------------- */
/* MI factories for C++ providers                                                              */
/* ------------------------------------------------------------------------------------------- */

/*
 * The C++ counterpart of the stubs: the provider is a class cn derived from the MI classes of the
 * C++ provider library, and the tables are filled with that library's static drive functions,
 * which reach the provider object through the record's hdl. Each factory keeps its table and MI
 * record as static locals, so factories of every kind and for several provider names can share
 * one translation unit. miName is "<kind>" #pn with the kind in lower case, also "indication".
 *
 * One provider object serves all MI kinds registered under the same provider name pn: it is kept
 * in the CmpiProviderBase object base<pn> that CMProviderBase(pn) defines (once, before the
 * factories that use it). The first factory call creates it with the broker and the calling
 * context and initialises it; every call, the first included, counts one more user of it. Like
 * the stubs, the factories never write *rc.
 */

#define CMProviderBase(pn) CmpiProviderBase base##pn;

/*
 * Creates the provider object on the first call and registers one more user of it. cn is only
 * named here, so provider classes need the (CmpiBroker, CmpiContext) constructor, initialize()
 * and setProviderBase() of the library's CmpiBaseMI.
 */
#define CMProviderFactoryBody_(cn, pn, mi)                   \
  CmpiContext ctx((CMPIContext*)ctxp);                       \
  CmpiBaseMI* provider = base##pn.getBaseMI();               \
  (void)rc;                                                  \
  if (provider == 0) {                                       \
    provider = new cn(CmpiBroker((CMPIBroker*)broker), ctx); \
    provider->setProviderBase(&base##pn);                    \
    provider->initialize(ctx);                               \
    base##pn.setBaseMI(provider);                            \
  }                                                          \
  (mi).hdl = provider;                                       \
  base##pn.incUseCount();                                    \
  return &(mi);

/*
 * The cleanup drive function is shared by every MI kind, so it takes the record as a plain
 * pointer and is cast to each table's cleanup type. The modifyInstance slot is served by the
 * library's driveSetInstance, the name the older levels gave that slot.
 */
#define CMInstanceMIFactory(cn, pn)                                                               \
  CMPI_EXTERN_C CMPIInstanceMI* pn##_Create_InstanceMI(const CMPIBroker* broker,                  \
                                                       const CMPIContext* ctxp, CMPIStatus* rc) { \
    static CMPIInstanceMIFT instMIFT = {CMPICurrentVersion,                                       \
                                        CMPICurrentVersion,                                       \
                                        "instance" #pn,                                           \
                                        (CMPIStatus(*)(CMPIInstanceMI*, const CMPIContext*,       \
                                                       CMPIBoolean))CmpiBaseMI::driveBaseCleanup, \
                                        CmpiInstanceMI::driveEnumInstanceNames,                   \
                                        CmpiInstanceMI::driveEnumInstances,                       \
                                        CmpiInstanceMI::driveGetInstance,                         \
                                        CmpiInstanceMI::driveCreateInstance,                      \
                                        CmpiInstanceMI::driveSetInstance,                         \
                                        CmpiInstanceMI::driveDeleteInstance,                      \
                                        CmpiInstanceMI::driveExecQuery};                          \
    static CMPIInstanceMI mi = {NULL, &instMIFT};                                                 \
    CMProviderFactoryBody_(cn, pn, mi)                                                            \
  }

#define CMAssociationMIFactory(cn, pn)                                     \
  CMPI_EXTERN_C CMPIAssociationMI* pn##_Create_AssociationMI(              \
      const CMPIBroker* broker, const CMPIContext* ctxp, CMPIStatus* rc) { \
    static CMPIAssociationMIFT assocMIFT = {                               \
        CMPICurrentVersion,                                                \
        CMPICurrentVersion,                                                \
        "association" #pn,                                                 \
        (CMPIStatus(*)(CMPIAssociationMI*, const CMPIContext*,             \
                       CMPIBoolean))CmpiBaseMI::driveBaseCleanup,          \
        CmpiAssociationMI::driveAssociators,                               \
        CmpiAssociationMI::driveAssociatorNames,                           \
        CmpiAssociationMI::driveReferences,                                \
        CmpiAssociationMI::driveReferenceNames};                           \
    static CMPIAssociationMI mi = {NULL, &assocMIFT};                      \
    CMProviderFactoryBody_(cn, pn, mi)                                     \
  }

#define CMMethodMIFactory(cn, pn)                                                               \
  CMPI_EXTERN_C CMPIMethodMI* pn##_Create_MethodMI(const CMPIBroker* broker,                    \
                                                   const CMPIContext* ctxp, CMPIStatus* rc) {   \
    static CMPIMethodMIFT methMIFT = {CMPICurrentVersion, CMPICurrentVersion, "method" #pn,     \
                                      (CMPIStatus(*)(CMPIMethodMI*, const CMPIContext*,         \
                                                     CMPIBoolean))CmpiBaseMI::driveBaseCleanup, \
                                      CmpiMethodMI::driveInvokeMethod};                         \
    static CMPIMethodMI mi = {NULL, &methMIFT};                                                 \
    CMProviderFactoryBody_(cn, pn, mi)                                                          \
  }

/* As with the stub, the 2.0 slot setPropertyWithOrigin is left NULL. */
#define CMPropertyMIFactory(cn, pn)                                                               \
  CMPI_EXTERN_C CMPIPropertyMI* pn##_Create_PropertyMI(const CMPIBroker* broker,                  \
                                                       const CMPIContext* ctxp, CMPIStatus* rc) { \
    static CMPIPropertyMIFT propMIFT = {                                                          \
        CMPICurrentVersion,                                                                       \
        CMPICurrentVersion,                                                                       \
        "property" #pn,                                                                           \
        (CMPIStatus(*)(CMPIPropertyMI*, const CMPIContext*,                                       \
                       CMPIBoolean))CmpiBaseMI::driveBaseCleanup,                                 \
        CmpiPropertyMI::driveSetProperty,                                                         \
        CmpiPropertyMI::driveGetProperty CMPropertyMIStubExtensions_};                            \
    static CMPIPropertyMI mi = {NULL, &propMIFT};                                                 \
    CMProviderFactoryBody_(cn, pn, mi)                                                            \
  }

#ifdef CMPI_VER_86
#define CMIndicationMIFactoryExtensions \
  CmpiIndicationMI::driveEnableIndications, CmpiIndicationMI::driveDisableIndications,
#else
#define CMIndicationMIFactoryExtensions
#endif

/* Unlike the stub, the factory writes "indication" in lower case into miName. */
#define CMIndicationMIFactory(cn, pn)                                                              \
  CMPI_EXTERN_C CMPIIndicationMI* pn##_Create_IndicationMI(                                        \
      const CMPIBroker* broker, const CMPIContext* ctxp, CMPIStatus* rc) {                         \
    static CMPIIndicationMIFT indMIFT = {CMPICurrentVersion,                                       \
                                         CMPICurrentVersion,                                       \
                                         "indication" #pn,                                         \
                                         (CMPIStatus(*)(CMPIIndicationMI*, const CMPIContext*,     \
                                                        CMPIBoolean))CmpiBaseMI::driveBaseCleanup, \
                                         CmpiIndicationMI::driveAuthorizeFilter,                   \
                                         CmpiIndicationMI::driveMustPoll,                          \
                                         CmpiIndicationMI::driveActivateFilter,                    \
                                         CmpiIndicationMI::driveDeActivateFilter,                  \
                                         CMIndicationMIFactoryExtensions};                         \
    static CMPIIndicationMI mi = {NULL, &indMIFT};                                                 \
    CMProviderFactoryBody_(cn, pn, mi)                                                             \
  }

#endif /* _CMPIMACS_H_ */
