// Loads the stub provider built as C and as C++ the way a broker does (dlopen, then dlsym of
// <name>_Create_<Type>MI) and drives every MI through a recording fake broker.
//
// This shows that the MI stub macros produce exported C-linkage factories with the expected
// tables in both languages, that the convenience macros call the intended table slots with the
// intended arguments, and that CMPIStatus and CMPIData travel correctly between code compiled as
// C and as C++.

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <cstdarg>
#include <cstring>
#include <string>
#include <vector>

#include "cmpift.h"

namespace {

// ------------------------------------------------------------------------------------------- //
// A fake broker that writes every call it receives into a log                                 //
// ------------------------------------------------------------------------------------------- //

std::vector<std::string> g_log;

void Log(const std::string& entry) { g_log.push_back(entry); }

CMPIStatus Ok() {
  CMPIStatus st = {CMPI_RC_OK, NULL};
  return st;
}

std::string Chars(const char* s) { return s ? s : "(null)"; }

std::string ValueText(const CMPIValue* v, CMPIType type);

// Strings: the handle holds the characters.
CMPIStatus StringRelease(CMPIString*) { return Ok(); }
char* StringGetCharPtr(const CMPIString* s, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  return static_cast<char*>(s->hdl);
}
CMPIStringFT g_string_ft = {200, StringRelease, nullptr, StringGetCharPtr};

// A small pool so that returned strings stay valid for the whole test.
CMPIString* NewFakeString(const char* text) {
  static std::vector<std::string> texts(32);
  static CMPIString strings[32];
  static int next = 0;
  int i = next++ % 32;
  texts[i] = Chars(text);
  strings[i].hdl = &texts[i][0];
  strings[i].ft = &g_string_ft;
  return &strings[i];
}

std::string ValueText(const CMPIValue* v, CMPIType type) {
  switch (type) {
    case CMPI_chars:
      return Chars(reinterpret_cast<const char*>(v));
    case CMPI_string:
      return Chars(static_cast<const char*>(v->string->hdl));
    case CMPI_uint32:
      return std::to_string(v->uint32);
    case CMPI_sint64:
      return std::to_string(v->sint64);
    case CMPI_ref:
      return "ref";
    default:
      return "type " + std::to_string(type);
  }
}

// Object paths: the caller's path lives in namespace root/abi and has one key Name="k1".
CMPIStatus PathRelease(CMPIObjectPath*) { return Ok(); }
CMPIString* PathGetNameSpace(const CMPIObjectPath*, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  return NewFakeString("root/abi");
}
CMPIStatus PathAddKey(CMPIObjectPath*, const char* name, const CMPIValue* value, CMPIType type) {
  Log("addKey " + Chars(name) + "=" + ValueText(value, type));
  return Ok();
}
CMPIData PathGetKey(const CMPIObjectPath* op, const char* name, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  CMPIData d = {CMPI_string, CMPI_keyValue, {0}};
  d.value.string =
      NewFakeString((std::string(static_cast<const char*>(op->hdl)) + "." + Chars(name)).c_str());
  return d;
}
CMPIObjectPathFT g_path_ft = [] {
  CMPIObjectPathFT ft{};
  ft.ftVersion = 200;
  ft.release = PathRelease;
  ft.getNameSpace = PathGetNameSpace;
  ft.addKey = PathAddKey;
  ft.getKey = PathGetKey;
  return ft;
}();
char g_caller_path_name[] = "caller";
char g_new_path_name[] = "new";
char g_enum_path_names[2][8] = {"e0", "e1"};
CMPIObjectPath g_caller_path = {g_caller_path_name, &g_path_ft};
CMPIObjectPath g_new_path = {g_new_path_name, &g_path_ft};
CMPIObjectPath g_enum_paths[2] = {{g_enum_path_names[0], &g_path_ft},
                                  {g_enum_path_names[1], &g_path_ft}};

// Instances.
CMPIStatus InstSetProperty(const CMPIInstance*, const char* name, const CMPIValue* value,
                           CMPIType type) {
  Log("setProperty " + Chars(name) + "=" + ValueText(value, type));
  return Ok();
}
CMPIStatus InstSetPropertyFilter(CMPIInstance*, const char** list, const char**) {
  Log("setPropertyFilter " + Chars(list ? list[0] : nullptr));
  return Ok();
}
CMPIInstanceFT g_inst_ft = [] {
  CMPIInstanceFT ft{};
  ft.ftVersion = 200;
  ft.setProperty = InstSetProperty;
  ft.setPropertyFilter = InstSetPropertyFilter;
  return ft;
}();
CMPIInstance g_inst = {&g_inst, &g_inst_ft};

// An enumeration of the two paths in g_enum_paths.
int g_enum_pos = 0;
CMPIStatus EnumRelease(CMPIEnumeration*) {
  Log("release enumeration");
  return Ok();
}
CMPIData EnumGetNext(const CMPIEnumeration*, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  CMPIData d = {CMPI_ref, CMPI_goodValue, {0}};
  d.value.ref = &g_enum_paths[g_enum_pos++];
  return d;
}
CMPIBoolean EnumHasNext(const CMPIEnumeration*, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  return g_enum_pos < 2;
}
CMPIEnumerationFT g_enum_ft = {200, EnumRelease, nullptr, EnumGetNext, EnumHasNext, nullptr};
CMPIEnumeration g_enum = {&g_enum, &g_enum_ft};

// Results.
CMPIStatus ResultReturnData(const CMPIResult*, const CMPIValue* value, CMPIType type) {
  Log("returnData " + ValueText(value, type));
  return Ok();
}
CMPIStatus ResultReturnInstance(const CMPIResult*, const CMPIInstance* inst) {
  Log(std::string("returnInstance ") + (inst == &g_inst ? "inst" : "?"));
  return Ok();
}
CMPIStatus ResultReturnObjectPath(const CMPIResult*, const CMPIObjectPath* op) {
  Log("returnObjectPath " + Chars(static_cast<const char*>(op->hdl)));
  return Ok();
}
CMPIStatus ResultReturnDone(const CMPIResult*) {
  Log("returnDone");
  return Ok();
}
CMPIResultFT g_result_ft = {200,
                            nullptr,
                            nullptr,
                            ResultReturnData,
                            ResultReturnInstance,
                            ResultReturnObjectPath,
                            ResultReturnDone,
                            nullptr};
CMPIResult g_result = {&g_result, &g_result_ft};

// Arguments: only the count is used.
CMPICount ArgsGetArgCount(const CMPIArgs*, CMPIStatus* rc) {
  if (rc) *rc = Ok();
  return 2;
}
CMPIArgsFT g_args_ft = [] {
  CMPIArgsFT ft{};
  ft.ftVersion = 200;
  ft.getArgCount = ArgsGetArgCount;
  return ft;
}();
CMPIArgs g_args = {&g_args, &g_args_ft};

CMPIContext g_context = {&g_context, nullptr};

// Broker up-calls.
CMPIEnumeration* BrokerEnumInstanceNames(const CMPIBroker*, const CMPIContext* ctx,
                                         const CMPIObjectPath* op, CMPIStatus* rc) {
  Log(std::string("enumerateInstanceNames ") + (ctx == &g_context ? "ctx " : "? ") +
      Chars(static_cast<const char*>(op->hdl)));
  g_enum_pos = 0;
  if (rc) *rc = Ok();
  return &g_enum;
}
CMPIBrokerFT g_broker_ft = [] {
  CMPIBrokerFT ft{};
  ft.brokerCapabilities = CMPI_MB_Class_0;
  ft.brokerVersion = 200;
  ft.brokerName = "abi-fake";
  ft.enumerateInstanceNames = BrokerEnumInstanceNames;
  return ft;
}();

// Broker factories.
CMPIObjectPath* BrokerNewObjectPath(const CMPIBroker*, const char* ns, const char* cn,
                                    CMPIStatus* rc) {
  Log("newObjectPath " + Chars(ns) + ":" + Chars(cn));
  if (rc) *rc = Ok();
  return &g_new_path;
}
CMPIInstance* BrokerNewInstance(const CMPIBroker*, const CMPIObjectPath* op, CMPIStatus* rc) {
  Log("newInstance " + Chars(static_cast<const char*>(op->hdl)));
  if (rc) *rc = Ok();
  return &g_inst;
}
CMPIString* BrokerNewString(const CMPIBroker*, const char* text, CMPIStatus* rc) {
  Log("newString " + Chars(text));
  if (rc) *rc = Ok();
  return NewFakeString(text);
}
CMPIString* BrokerGetMessage(const CMPIBroker*, const char* id, const char* def, CMPIStatus* rc,
                             CMPICount count, ...) {
  std::string entry = "getMessage " + Chars(id) + " '" + Chars(def) + "'";
  va_list ap;
  va_start(ap, count);
  for (CMPICount i = 0; i < count; ++i) {
    int type = va_arg(ap, int);
    switch (type) {
      case CMPI_sint32:
        entry += " sint32:" + std::to_string(va_arg(ap, long));
        break;
      case CMPI_uint32:
        entry += " uint32:" + std::to_string(va_arg(ap, unsigned long));
        break;
      case CMPI_sint64:
        entry += " sint64:" + std::to_string(va_arg(ap, long long));
        break;
      case CMPI_uint64:
        entry += " uint64:" + std::to_string(va_arg(ap, unsigned long long));
        break;
      case CMPI_real64:
        entry += " real64:" + std::to_string(va_arg(ap, double));
        break;
      case CMPI_boolean:
        entry += " boolean:" + std::to_string(va_arg(ap, int));
        break;
      case CMPI_chars:
        entry += " chars:" + Chars(va_arg(ap, char*));
        break;
      case CMPI_string:
        entry += " string:" + Chars(static_cast<const char*>(va_arg(ap, CMPIString*)->hdl));
        break;
      default:
        entry += " unknown type " + std::to_string(type);
        i = count;
        break;
    }
  }
  va_end(ap);
  Log(entry);
  if (rc) *rc = Ok();
  return NewFakeString("formatted");
}
CMPIStatus BrokerTrace(const CMPIBroker*, int level, const char* component, const char* text,
                       const CMPIString*) {
  Log("trace " + std::to_string(level) + " " + Chars(component) + " " + Chars(text));
  return Ok();
}
CMPIBrokerEncFT g_broker_eft = [] {
  CMPIBrokerEncFT ft{};
  ft.ftVersion = 200;
  ft.newInstance = BrokerNewInstance;
  ft.newObjectPath = BrokerNewObjectPath;
  ft.newString = BrokerNewString;
  ft.getMessage = BrokerGetMessage;
  ft.trace = BrokerTrace;
  return ft;
}();

CMPIBroker g_broker = {&g_broker, &g_broker_ft, &g_broker_eft, nullptr, nullptr};

// ------------------------------------------------------------------------------------------- //
// Loading the providers                                                                       //
// ------------------------------------------------------------------------------------------- //

struct Provider {
  const char* path;
  const char* name;  // provider name used in the factory symbols and the miName strings
};

// One loaded provider library; unloaded again at the end of each test.
class Loaded {
 public:
  explicit Loaded(const Provider& provider) : provider_(provider) {
    handle_ = dlopen(provider.path, RTLD_NOW | RTLD_LOCAL);
    EXPECT_NE(handle_, nullptr) << dlerror();
    g_log.clear();
  }
  ~Loaded() {
    if (handle_) dlclose(handle_);
  }
  Loaded(const Loaded&) = delete;
  Loaded& operator=(const Loaded&) = delete;

  bool ok() const { return handle_ != nullptr; }
  void* Symbol(const std::string& name) const { return dlsym(handle_, name.c_str()); }
  std::string FactoryName(const char* type) const {
    return std::string(provider_.name) + "_Create_" + type + "MI";
  }
  std::string MiName(const char* prefix) const { return prefix + std::string(provider_.name); }

  template <typename MI>
  MI* Create(const char* type) const {
    using Factory = MI* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
    void* sym = Symbol(FactoryName(type));
    EXPECT_NE(sym, nullptr) << FactoryName(type) << " is not exported with a plain C name";
    if (!sym) return nullptr;
    // The factory leaves *rc alone; a sentinel shows it.
    CMPIStatus rc = {CMPI_RC_ERR_FAILED, nullptr};
    MI* mi = reinterpret_cast<Factory>(sym)(&g_broker, &g_context, &rc);
    EXPECT_EQ(rc.rc, CMPI_RC_ERR_FAILED) << "factory wrote *rc";
    return mi;
  }

 private:
  Provider provider_;
  void* handle_ = nullptr;
};

std::vector<std::string> Lines(std::initializer_list<const char*> lines) {
  return std::vector<std::string>(lines.begin(), lines.end());
}

void CheckExports(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  for (const char* type : {"Instance", "Association", "Method", "Property", "Indication"}) {
    EXPECT_NE(p.Symbol(p.FactoryName(type)), nullptr) << p.FactoryName(type);
  }
  // The generated tables are static and the provider functions internal.
  EXPECT_EQ(p.Symbol("instMIFT__"), nullptr);
  EXPECT_EQ(p.Symbol("assocMIFT__"), nullptr);
  EXPECT_EQ(p.Symbol("AbiStubEnumInstanceNames"), nullptr);
}

void CheckInstanceMI(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  CMPIInstanceMI* mi = p.Create<CMPIInstanceMI>("Instance");
  ASSERT_NE(mi, nullptr);
  EXPECT_EQ(g_log, Lines({"trace 3 abi instance"})) << "hook runs after the broker is stored";
  EXPECT_EQ(mi->hdl, nullptr);
  const CMPIInstanceMIFT* ft = mi->ft;
  ASSERT_NE(ft, nullptr);
  EXPECT_EQ(ft->ftVersion, 200);
  EXPECT_EQ(ft->miVersion, 200);
  EXPECT_EQ(std::string(ft->miName), p.MiName("instance"));
  EXPECT_EQ(p.Create<CMPIInstanceMI>("Instance"), mi) << "the MI record is static";

  g_log.clear();
  CMPIStatus st = ft->enumerateInstanceNames(mi, &g_context, &g_result, &g_caller_path);
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(st.msg, nullptr);
  EXPECT_EQ(g_log, Lines({"newObjectPath root/abi:Abi_Widget", "addKey Name=abc", "addKey Index=7",
                          "returnObjectPath new", "returnDone"}));

  g_log.clear();
  const char* props[] = {"Name", nullptr};
  st = ft->enumerateInstances(mi, &g_context, &g_result, &g_caller_path, props);
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(g_log,
            Lines({"enumerateInstanceNames ctx caller", "newInstance e0", "setPropertyFilter Name",
                   "setProperty Name=e0.Name", "setProperty Caption=widget", "returnInstance inst",
                   "newInstance e1", "setPropertyFilter Name", "setProperty Name=e1.Name",
                   "setProperty Caption=widget", "returnInstance inst", "release enumeration",
                   "returnDone"}));

  g_log.clear();
  st = ft->getInstance(mi, &g_context, &g_result, &g_caller_path, nullptr);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_NOT_FOUND);
  ASSERT_NE(st.msg, nullptr);
  EXPECT_STREQ(static_cast<const char*>(st.msg->hdl), "formatted");
  EXPECT_EQ(g_log, Lines({"getMessage Abi.NotFound '$0 of $1' sint32:-7 chars:seven "
                          "uint64:1234567890123 boolean:1"}));

  g_log.clear();
  st = ft->createInstance(mi, &g_context, &g_result, &g_caller_path, &g_inst);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  ASSERT_NE(st.msg, nullptr);
  EXPECT_STREQ(static_cast<const char*>(st.msg->hdl), "no create");
  EXPECT_EQ(g_log, Lines({"newString no create"}));

  g_log.clear();
  st = ft->modifyInstance(mi, &g_context, &g_result, &g_caller_path, &g_inst, nullptr);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  EXPECT_EQ(g_log, Lines({"trace 1 abi modify"}));

  g_log.clear();
  st = ft->deleteInstance(mi, &g_context, &g_result, &g_caller_path);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_ACCESS_DENIED);
  ASSERT_NE(st.msg, nullptr);
  EXPECT_STREQ(static_cast<const char*>(st.msg->hdl), "denied");

  st = ft->execQuery(mi, &g_context, &g_result, &g_caller_path, "SELECT", "WQL");
  EXPECT_EQ(st.rc, CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED);

  EXPECT_EQ(ft->cleanup(mi, &g_context, 0).rc, CMPI_RC_DO_NOT_UNLOAD);
  EXPECT_EQ(ft->cleanup(mi, &g_context, 1).rc, CMPI_RC_OK);
}

void CheckAssociationMI(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  CMPIAssociationMI* mi = p.Create<CMPIAssociationMI>("Association");
  ASSERT_NE(mi, nullptr);
  EXPECT_EQ(g_log, Lines({"trace 3 abi association"}));
  EXPECT_EQ(mi->hdl, nullptr);
  const CMPIAssociationMIFT* ft = mi->ft;
  EXPECT_EQ(ft->ftVersion, 200);
  EXPECT_EQ(ft->miVersion, 200);
  EXPECT_EQ(std::string(ft->miName), p.MiName("association"));
  ASSERT_NE(ft->associators, nullptr);
  ASSERT_NE(ft->references, nullptr);
  ASSERT_NE(ft->referenceNames, nullptr);

  g_log.clear();
  CMPIStatus st = ft->associatorNames(mi, &g_context, &g_result, &g_caller_path, nullptr, nullptr,
                                      nullptr, nullptr);
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(g_log, Lines({"returnObjectPath caller", "returnDone"}));
  st = ft->references(mi, &g_context, &g_result, &g_caller_path, nullptr, nullptr, nullptr);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_NOT_SUPPORTED);
  EXPECT_EQ(ft->cleanup(mi, &g_context, 1).rc, CMPI_RC_OK);
}

void CheckMethodMI(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  CMPIMethodMI* mi = p.Create<CMPIMethodMI>("Method");
  ASSERT_NE(mi, nullptr);
  EXPECT_EQ(g_log, Lines({"trace 3 abi method"}));
  const CMPIMethodMIFT* ft = mi->ft;
  EXPECT_EQ(ft->ftVersion, 200);
  EXPECT_EQ(ft->miVersion, 200);
  EXPECT_EQ(std::string(ft->miName), p.MiName("method"));

  g_log.clear();
  CMPIStatus st =
      ft->invokeMethod(mi, &g_context, &g_result, &g_caller_path, "Run", &g_args, nullptr);
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(g_log, Lines({"returnData 42", "returnDone"}));
}

void CheckPropertyMI(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  CMPIPropertyMI* mi = p.Create<CMPIPropertyMI>("Property");
  ASSERT_NE(mi, nullptr);
  EXPECT_TRUE(g_log.empty()) << "CMNoHook does nothing";
  const CMPIPropertyMIFT* ft = mi->ft;
  EXPECT_EQ(ft->ftVersion, 200);
  EXPECT_EQ(ft->miVersion, 200);
  EXPECT_EQ(std::string(ft->miName), p.MiName("property"));
  EXPECT_NE(ft->getProperty, nullptr);
  EXPECT_EQ(ft->setPropertyWithOrigin, nullptr) << "the stub leaves the 2.0 slot empty";

  // A CMPIData passed by value from C++ into the provider and echoed back.
  CMPIData data = {CMPI_sint64, CMPI_goodValue, {0}};
  data.value.sint64 = -1234567890123LL;
  g_log.clear();
  CMPIStatus st = ft->setProperty(mi, &g_context, &g_result, &g_caller_path, "P", data);
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(g_log, Lines({"returnData -1234567890123"}));

  data.state = CMPI_nullValue;
  st = ft->setProperty(mi, &g_context, &g_result, &g_caller_path, "P", data);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

void CheckIndicationMI(const Provider& provider) {
  Loaded p(provider);
  ASSERT_TRUE(p.ok());
  CMPIIndicationMI* mi = p.Create<CMPIIndicationMI>("Indication");
  ASSERT_NE(mi, nullptr);
  const CMPIIndicationMIFT* ft = mi->ft;
  EXPECT_EQ(ft->ftVersion, 200);
  EXPECT_EQ(ft->miVersion, 200);
  EXPECT_EQ(std::string(ft->miName), p.MiName("Indication")) << "capital I";
  ASSERT_NE(ft->enableIndications, nullptr);
  ASSERT_NE(ft->disableIndications, nullptr);
  EXPECT_EQ(ft->mustPoll(mi, &g_context, nullptr, "C", &g_caller_path).rc,
            CMPI_RC_ERR_NOT_SUPPORTED);
  EXPECT_EQ(ft->activateFilter(mi, &g_context, nullptr, "C", &g_caller_path, 1).rc, CMPI_RC_OK);
  EXPECT_EQ(ft->deActivateFilter(mi, &g_context, nullptr, "C", &g_caller_path, 1).rc, CMPI_RC_OK);
  EXPECT_EQ(ft->authorizeFilter(mi, &g_context, nullptr, "C", &g_caller_path, "me").rc, CMPI_RC_OK);
  EXPECT_EQ(ft->enableIndications(mi, &g_context).rc, CMPI_RC_OK);
  EXPECT_EQ(ft->disableIndications(mi, &g_context).rc, CMPI_RC_OK);
}

const Provider kProviderC = {ABI_STUB_PROVIDER_C, "AbiStubC"};
const Provider kProviderCxx = {ABI_STUB_PROVIDER_CXX, "AbiStubCxx"};

}  // namespace

TEST(StubProviderC, ExportsOnlyTheFactories) { CheckExports(kProviderC); }
TEST(StubProviderC, InstanceMI) { CheckInstanceMI(kProviderC); }
TEST(StubProviderC, AssociationMI) { CheckAssociationMI(kProviderC); }
TEST(StubProviderC, MethodMI) { CheckMethodMI(kProviderC); }
TEST(StubProviderC, PropertyMI) { CheckPropertyMI(kProviderC); }
TEST(StubProviderC, IndicationMI) { CheckIndicationMI(kProviderC); }

TEST(StubProviderCxx, ExportsOnlyTheFactories) { CheckExports(kProviderCxx); }
TEST(StubProviderCxx, InstanceMI) { CheckInstanceMI(kProviderCxx); }
TEST(StubProviderCxx, AssociationMI) { CheckAssociationMI(kProviderCxx); }
TEST(StubProviderCxx, MethodMI) { CheckMethodMI(kProviderCxx); }
TEST(StubProviderCxx, PropertyMI) { CheckPropertyMI(kProviderCxx); }
TEST(StubProviderCxx, IndicationMI) { CheckIndicationMI(kProviderCxx); }
