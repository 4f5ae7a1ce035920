// Expands the C++ MI factory macros of cmpimacs.h (CMProviderBase and CM<Type>MIFactory) against
// small stand-ins for the classes of the C++ provider library, and checks what they generate:
// exported C-linkage factories <pn>_Create_<Type>MI, the tables (versions, miName, every slot
// filled with the right drive function), and the provider object's life: made and initialised
// once per provider name, one more user counted on every call, carried in the record's hdl.
//
// The real library is not part of our headers, exactly as with other CMPI header sets, so the
// stand-ins only have what the macros and this test use. Each drive function records its own name
// and the provider it reached through hdl, so calling a slot shows which function it holds.
//
// No test framework, so that check_compilers.cmake can build and run it with every C++ compiler.

#include <dlfcn.h>

#include <cstdio>
#include <cstring>

#include "cmpift.h"

// ------------------------------------------------------------------------------------------- //
// Stand-ins for the C++ provider library                                                      //
// ------------------------------------------------------------------------------------------- //

class CmpiContext {
 public:
  explicit CmpiContext(CMPIContext* enc) : enc_(enc) {}
  CMPIContext* enc() const { return enc_; }

 private:
  CMPIContext* enc_;
};

class CmpiBroker {
 public:
  explicit CmpiBroker(CMPIBroker* enc) : enc_(enc) {}
  CMPIBroker* enc() const { return enc_; }

 private:
  CMPIBroker* enc_;
};

class CmpiProviderBase;

// What the drive functions saw last.
const char* g_driven = nullptr;
const void* g_driven_provider = nullptr;

class CmpiBaseMI {
 public:
  CmpiBaseMI(const CmpiBroker& broker, const CmpiContext& ctx)
      : broker_(broker.enc()), ctx_(ctx.enc()) {}
  virtual ~CmpiBaseMI() {}

  virtual CMPIStatus initialize(const CmpiContext& ctx) {
    initialized_with_ = ctx.enc();
    ++initialize_calls_;
    CMPIStatus st = {CMPI_RC_OK, NULL};
    return st;
  }
  void setProviderBase(CmpiProviderBase* base) { base_ = base; }

  // Shared by every MI kind, so it takes the record untyped; the factories cast it.
  static CMPIStatus driveBaseCleanup(void* mi, const CMPIContext* ctx, CMPIBoolean terminating) {
    (void)mi;
    (void)ctx;
    (void)terminating;
    g_driven = "driveBaseCleanup";
    CMPIStatus st = {CMPI_RC_OK, NULL};
    return st;
  }

  CMPIBroker* broker_;
  CMPIContext* ctx_;
  CMPIContext* initialized_with_ = nullptr;
  CmpiProviderBase* base_ = nullptr;
  int initialize_calls_ = 0;
};

class CmpiProviderBase {
 public:
  CmpiBaseMI* getBaseMI() const { return mi_; }
  void setBaseMI(CmpiBaseMI* mi) { mi_ = mi; }
  void incUseCount() { ++use_count_; }
  int useCount() const { return use_count_; }

 private:
  CmpiBaseMI* mi_ = nullptr;
  int use_count_ = 0;
};

namespace {

// Every drive function ends here: it records its own name and the provider found in hdl.
template <typename MI>
CMPIStatus Drive(const char* name, MI* mi) {
  g_driven = name;
  g_driven_provider = mi != nullptr ? static_cast<const CmpiBaseMI*>(mi->hdl) : nullptr;
  CMPIStatus st = {CMPI_RC_OK, NULL};
  return st;
}

}  // namespace

class CmpiInstanceMI : virtual public CmpiBaseMI {
 public:
  CmpiInstanceMI(const CmpiBroker& broker, const CmpiContext& ctx) : CmpiBaseMI(broker, ctx) {}

  static CMPIStatus driveEnumInstanceNames(CMPIInstanceMI* mi, const CMPIContext*,
                                           const CMPIResult*, const CMPIObjectPath*) {
    return Drive("driveEnumInstanceNames", mi);
  }
  static CMPIStatus driveEnumInstances(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                       const CMPIObjectPath*, const char**) {
    return Drive("driveEnumInstances", mi);
  }
  static CMPIStatus driveGetInstance(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                     const CMPIObjectPath*, const char**) {
    return Drive("driveGetInstance", mi);
  }
  static CMPIStatus driveCreateInstance(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                        const CMPIObjectPath*, const CMPIInstance*) {
    return Drive("driveCreateInstance", mi);
  }
  static CMPIStatus driveSetInstance(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                     const CMPIObjectPath*, const CMPIInstance*, const char**) {
    return Drive("driveSetInstance", mi);
  }
  static CMPIStatus driveDeleteInstance(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                        const CMPIObjectPath*) {
    return Drive("driveDeleteInstance", mi);
  }
  static CMPIStatus driveExecQuery(CMPIInstanceMI* mi, const CMPIContext*, const CMPIResult*,
                                   const CMPIObjectPath*, const char*, const char*) {
    return Drive("driveExecQuery", mi);
  }
};

class CmpiAssociationMI : virtual public CmpiBaseMI {
 public:
  CmpiAssociationMI(const CmpiBroker& broker, const CmpiContext& ctx) : CmpiBaseMI(broker, ctx) {}

  static CMPIStatus driveAssociators(CMPIAssociationMI* mi, const CMPIContext*, const CMPIResult*,
                                     const CMPIObjectPath*, const char*, const char*, const char*,
                                     const char*, const char**) {
    return Drive("driveAssociators", mi);
  }
  static CMPIStatus driveAssociatorNames(CMPIAssociationMI* mi, const CMPIContext*,
                                         const CMPIResult*, const CMPIObjectPath*, const char*,
                                         const char*, const char*, const char*) {
    return Drive("driveAssociatorNames", mi);
  }
  static CMPIStatus driveReferences(CMPIAssociationMI* mi, const CMPIContext*, const CMPIResult*,
                                    const CMPIObjectPath*, const char*, const char*, const char**) {
    return Drive("driveReferences", mi);
  }
  static CMPIStatus driveReferenceNames(CMPIAssociationMI* mi, const CMPIContext*,
                                        const CMPIResult*, const CMPIObjectPath*, const char*,
                                        const char*) {
    return Drive("driveReferenceNames", mi);
  }
};

class CmpiMethodMI : virtual public CmpiBaseMI {
 public:
  CmpiMethodMI(const CmpiBroker& broker, const CmpiContext& ctx) : CmpiBaseMI(broker, ctx) {}

  static CMPIStatus driveInvokeMethod(CMPIMethodMI* mi, const CMPIContext*, const CMPIResult*,
                                      const CMPIObjectPath*, const char*, const CMPIArgs*,
                                      CMPIArgs*) {
    return Drive("driveInvokeMethod", mi);
  }
};

class CmpiPropertyMI : virtual public CmpiBaseMI {
 public:
  CmpiPropertyMI(const CmpiBroker& broker, const CmpiContext& ctx) : CmpiBaseMI(broker, ctx) {}

  static CMPIStatus driveSetProperty(CMPIPropertyMI* mi, const CMPIContext*, const CMPIResult*,
                                     const CMPIObjectPath*, const char*, const CMPIData) {
    return Drive("driveSetProperty", mi);
  }
  static CMPIStatus driveGetProperty(CMPIPropertyMI* mi, const CMPIContext*, const CMPIResult*,
                                     const CMPIObjectPath*, const char*) {
    return Drive("driveGetProperty", mi);
  }
};

class CmpiIndicationMI : virtual public CmpiBaseMI {
 public:
  CmpiIndicationMI(const CmpiBroker& broker, const CmpiContext& ctx) : CmpiBaseMI(broker, ctx) {}

  static CMPIStatus driveAuthorizeFilter(CMPIIndicationMI* mi, const CMPIContext*,
                                         const CMPISelectExp*, const char*, const CMPIObjectPath*,
                                         const char*) {
    return Drive("driveAuthorizeFilter", mi);
  }
  static CMPIStatus driveMustPoll(CMPIIndicationMI* mi, const CMPIContext*, const CMPISelectExp*,
                                  const char*, const CMPIObjectPath*) {
    return Drive("driveMustPoll", mi);
  }
  static CMPIStatus driveActivateFilter(CMPIIndicationMI* mi, const CMPIContext*,
                                        const CMPISelectExp*, const char*, const CMPIObjectPath*,
                                        CMPIBoolean) {
    return Drive("driveActivateFilter", mi);
  }
  static CMPIStatus driveDeActivateFilter(CMPIIndicationMI* mi, const CMPIContext*,
                                          const CMPISelectExp*, const char*, const CMPIObjectPath*,
                                          CMPIBoolean) {
    return Drive("driveDeActivateFilter", mi);
  }
  static CMPIStatus driveEnableIndications(CMPIIndicationMI* mi, const CMPIContext*) {
    return Drive("driveEnableIndications", mi);
  }
  static CMPIStatus driveDisableIndications(CMPIIndicationMI* mi, const CMPIContext*) {
    return Drive("driveDisableIndications", mi);
  }
};

// ------------------------------------------------------------------------------------------- //
// Providers built with the factory macros, as a provider library writes them                  //
// ------------------------------------------------------------------------------------------- //

int g_constructed = 0;

// One class for every MI kind, registered under one provider name.
class AbiFactoryProvider : public CmpiInstanceMI,
                           public CmpiAssociationMI,
                           public CmpiMethodMI,
                           public CmpiPropertyMI,
                           public CmpiIndicationMI {
 public:
  AbiFactoryProvider(const CmpiBroker& broker, const CmpiContext& ctx)
      : CmpiBaseMI(broker, ctx),
        CmpiInstanceMI(broker, ctx),
        CmpiAssociationMI(broker, ctx),
        CmpiMethodMI(broker, ctx),
        CmpiPropertyMI(broker, ctx),
        CmpiIndicationMI(broker, ctx) {
    ++g_constructed;
  }
};

// A second provider name in the same library, with a second factory of the same kind.
class AbiOtherProvider : public CmpiMethodMI {
 public:
  AbiOtherProvider(const CmpiBroker& broker, const CmpiContext& ctx)
      : CmpiBaseMI(broker, ctx), CmpiMethodMI(broker, ctx) {
    ++g_constructed;
  }
};

CMProviderBase(AbiFactory);
CMInstanceMIFactory(AbiFactoryProvider, AbiFactory);
CMAssociationMIFactory(AbiFactoryProvider, AbiFactory);
CMMethodMIFactory(AbiFactoryProvider, AbiFactory);
CMPropertyMIFactory(AbiFactoryProvider, AbiFactory);
CMIndicationMIFactory(AbiFactoryProvider, AbiFactory);

CMProviderBase(AbiOther);
CMMethodMIFactory(AbiOtherProvider, AbiOther);

// Redeclaring with C linkage only compiles if the macros gave the factories C linkage already.
extern "C" {
CMPIInstanceMI* AbiFactory_Create_InstanceMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPIAssociationMI* AbiFactory_Create_AssociationMI(const CMPIBroker*, const CMPIContext*,
                                                   CMPIStatus*);
CMPIMethodMI* AbiFactory_Create_MethodMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPIPropertyMI* AbiFactory_Create_PropertyMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
CMPIIndicationMI* AbiFactory_Create_IndicationMI(const CMPIBroker*, const CMPIContext*,
                                                 CMPIStatus*);
CMPIMethodMI* AbiOther_Create_MethodMI(const CMPIBroker*, const CMPIContext*, CMPIStatus*);
}

// ------------------------------------------------------------------------------------------- //
// Checks                                                                                      //
// ------------------------------------------------------------------------------------------- //

namespace {

int g_checks = 0;
int g_failures = 0;

void Check(bool ok, const char* what, int line) {
  ++g_checks;
  if (!ok) {
    ++g_failures;
    std::fprintf(stderr, "abi_factory_test.cpp:%d: failed: %s\n", line, what);
  }
}
#define CHECK(cond) Check((cond), #cond, __LINE__)

// Function pointers of different types compare through one common type.
using AnyFn = void (*)();
template <typename F>
AnyFn Fn(F f) {
  return reinterpret_cast<AnyFn>(f);
}

bool SameName(const char* a, const char* b) {
  return a != nullptr && b != nullptr && std::strcmp(a, b) == 0;
}

// Calls a slot and reports whether it reached the named drive function with the provider in hdl.
template <typename Call>
bool Drives(Call call, const char* name, const void* provider) {
  g_driven = nullptr;
  g_driven_provider = nullptr;
  CMPIStatus st = call();
  return st.rc == CMPI_RC_OK && SameName(g_driven, name) && g_driven_provider == provider;
}

// What the broker passes; the factories must keep these as they are.
CMPIBroker g_broker = {};
CMPIContext g_context = {};
CMPIString g_message = {};

bool Untouched(const CMPIStatus& rc) {
  return rc.rc == CMPI_RC_ERR_NOT_SUPPORTED && rc.msg == &g_message;
}

// The provider object lives in baseAbiFactory and was made with the broker's pointers.
void CheckProvider(const CmpiBaseMI* provider, const void* hdl) {
  CHECK(provider != nullptr);
  CHECK(hdl == provider);
  CHECK(g_constructed == 1);
  CHECK(provider->initialize_calls_ == 1);
  CHECK(provider->broker_ == &g_broker);
  CHECK(provider->ctx_ == &g_context);
  CHECK(provider->initialized_with_ == &g_context);
  CHECK(provider->base_ == &baseAbiFactory);
}

}  // namespace

int main() {
  CMPIStatus rc = {CMPI_RC_ERR_NOT_SUPPORTED, &g_message};
  CMPIContext* ctx = &g_context;
  CHECK(baseAbiFactory.getBaseMI() == nullptr && baseAbiFactory.useCount() == 0);

  // Instance MI: the first call makes the provider, the second reuses it.
  CMPIInstanceMI* inst = AbiFactory_Create_InstanceMI(&g_broker, &g_context, &rc);
  CHECK(inst != nullptr && inst->ft != nullptr);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 1);
  const CmpiBaseMI* provider = baseAbiFactory.getBaseMI();
  CheckProvider(provider, inst->hdl);
  CHECK(AbiFactory_Create_InstanceMI(&g_broker, &g_context, &rc) == inst);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 2);
  CheckProvider(provider, inst->hdl);

  const CMPIInstanceMIFT* ift = inst->ft;
  CHECK(ift->ftVersion == 200 && ift->miVersion == 200);
  CHECK(SameName(ift->miName, "instanceAbiFactory"));
  CHECK(Fn(ift->cleanup) == Fn(&CmpiBaseMI::driveBaseCleanup));
  CHECK(ift->enumerateInstanceNames == &CmpiInstanceMI::driveEnumInstanceNames);
  CHECK(ift->enumerateInstances == &CmpiInstanceMI::driveEnumInstances);
  CHECK(ift->getInstance == &CmpiInstanceMI::driveGetInstance);
  CHECK(ift->createInstance == &CmpiInstanceMI::driveCreateInstance);
  CHECK(ift->modifyInstance == &CmpiInstanceMI::driveSetInstance);
  CHECK(ift->deleteInstance == &CmpiInstanceMI::driveDeleteInstance);
  CHECK(ift->execQuery == &CmpiInstanceMI::driveExecQuery);
  CHECK(Drives([&] { return ift->enumerateInstanceNames(inst, ctx, NULL, NULL); },
               "driveEnumInstanceNames", provider));
  CHECK(Drives([&] { return ift->enumerateInstances(inst, ctx, NULL, NULL, NULL); },
               "driveEnumInstances", provider));
  CHECK(Drives([&] { return ift->getInstance(inst, ctx, NULL, NULL, NULL); }, "driveGetInstance",
               provider));
  CHECK(Drives([&] { return ift->createInstance(inst, ctx, NULL, NULL, NULL); },
               "driveCreateInstance", provider));
  CHECK(Drives([&] { return ift->modifyInstance(inst, ctx, NULL, NULL, NULL, NULL); },
               "driveSetInstance", provider));
  CHECK(Drives([&] { return ift->deleteInstance(inst, ctx, NULL, NULL); }, "driveDeleteInstance",
               provider));
  CHECK(Drives([&] { return ift->execQuery(inst, ctx, NULL, NULL, "q", "l"); }, "driveExecQuery",
               provider));

  // Association MI: same provider object, one more user per call.
  CMPIAssociationMI* assoc = AbiFactory_Create_AssociationMI(&g_broker, &g_context, &rc);
  CHECK(assoc != nullptr && assoc->ft != nullptr);
  CHECK(AbiFactory_Create_AssociationMI(&g_broker, &g_context, &rc) == assoc);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 4);
  CheckProvider(provider, assoc->hdl);
  const CMPIAssociationMIFT* aft = assoc->ft;
  CHECK(aft->ftVersion == 200 && aft->miVersion == 200);
  CHECK(SameName(aft->miName, "associationAbiFactory"));
  CHECK(Fn(aft->cleanup) == Fn(&CmpiBaseMI::driveBaseCleanup));
  CHECK(aft->associators == &CmpiAssociationMI::driveAssociators);
  CHECK(aft->associatorNames == &CmpiAssociationMI::driveAssociatorNames);
  CHECK(aft->references == &CmpiAssociationMI::driveReferences);
  CHECK(aft->referenceNames == &CmpiAssociationMI::driveReferenceNames);
  CHECK(
      Drives([&] { return aft->associators(assoc, ctx, NULL, NULL, NULL, NULL, NULL, NULL, NULL); },
             "driveAssociators", provider));
  CHECK(Drives([&] { return aft->associatorNames(assoc, ctx, NULL, NULL, NULL, NULL, NULL, NULL); },
               "driveAssociatorNames", provider));
  CHECK(Drives([&] { return aft->references(assoc, ctx, NULL, NULL, NULL, NULL, NULL); },
               "driveReferences", provider));
  CHECK(Drives([&] { return aft->referenceNames(assoc, ctx, NULL, NULL, NULL, NULL); },
               "driveReferenceNames", provider));

  // Method MI.
  CMPIMethodMI* meth = AbiFactory_Create_MethodMI(&g_broker, &g_context, &rc);
  CHECK(meth != nullptr && meth->ft != nullptr);
  CHECK(AbiFactory_Create_MethodMI(&g_broker, &g_context, &rc) == meth);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 6);
  CheckProvider(provider, meth->hdl);
  const CMPIMethodMIFT* mft = meth->ft;
  CHECK(mft->ftVersion == 200 && mft->miVersion == 200);
  CHECK(SameName(mft->miName, "methodAbiFactory"));
  CHECK(Fn(mft->cleanup) == Fn(&CmpiBaseMI::driveBaseCleanup));
  CHECK(mft->invokeMethod == &CmpiMethodMI::driveInvokeMethod);
  CHECK(Drives([&] { return mft->invokeMethod(meth, ctx, NULL, NULL, "m", NULL, NULL); },
               "driveInvokeMethod", provider));

  // Property MI: the 2.0 slot setPropertyWithOrigin stays empty.
  CMPIPropertyMI* prop = AbiFactory_Create_PropertyMI(&g_broker, &g_context, &rc);
  CHECK(prop != nullptr && prop->ft != nullptr);
  CHECK(AbiFactory_Create_PropertyMI(&g_broker, &g_context, &rc) == prop);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 8);
  CheckProvider(provider, prop->hdl);
  const CMPIPropertyMIFT* pft = prop->ft;
  CHECK(pft->ftVersion == 200 && pft->miVersion == 200);
  CHECK(SameName(pft->miName, "propertyAbiFactory"));
  CHECK(Fn(pft->cleanup) == Fn(&CmpiBaseMI::driveBaseCleanup));
  CHECK(pft->setProperty == &CmpiPropertyMI::driveSetProperty);
  CHECK(pft->getProperty == &CmpiPropertyMI::driveGetProperty);
  CHECK(pft->setPropertyWithOrigin == NULL);
  CMPIData data = {CMPI_uint32, CMPI_goodValue, {0}};
  CHECK(Drives([&] { return pft->setProperty(prop, ctx, NULL, NULL, "p", data); },
               "driveSetProperty", provider));
  CHECK(Drives([&] { return pft->getProperty(prop, ctx, NULL, NULL, "p"); }, "driveGetProperty",
               provider));

  // Indication MI: lower-case miName, unlike the C stub, and the two 0.86 entries.
  CMPIIndicationMI* ind = AbiFactory_Create_IndicationMI(&g_broker, &g_context, &rc);
  CHECK(ind != nullptr && ind->ft != nullptr);
  CHECK(AbiFactory_Create_IndicationMI(&g_broker, &g_context, &rc) == ind);
  CHECK(Untouched(rc));
  CHECK(baseAbiFactory.useCount() == 10);
  CheckProvider(provider, ind->hdl);
  const CMPIIndicationMIFT* nft = ind->ft;
  CHECK(nft->ftVersion == 200 && nft->miVersion == 200);
  CHECK(SameName(nft->miName, "indicationAbiFactory"));
  CHECK(Fn(nft->cleanup) == Fn(&CmpiBaseMI::driveBaseCleanup));
  CHECK(nft->authorizeFilter == &CmpiIndicationMI::driveAuthorizeFilter);
  CHECK(nft->mustPoll == &CmpiIndicationMI::driveMustPoll);
  CHECK(nft->activateFilter == &CmpiIndicationMI::driveActivateFilter);
  CHECK(nft->deActivateFilter == &CmpiIndicationMI::driveDeActivateFilter);
  CHECK(nft->enableIndications == &CmpiIndicationMI::driveEnableIndications);
  CHECK(nft->disableIndications == &CmpiIndicationMI::driveDisableIndications);
  CHECK(Drives([&] { return nft->authorizeFilter(ind, ctx, NULL, "c", NULL, "o"); },
               "driveAuthorizeFilter", provider));
  CHECK(
      Drives([&] { return nft->mustPoll(ind, ctx, NULL, "c", NULL); }, "driveMustPoll", provider));
  CHECK(Drives([&] { return nft->activateFilter(ind, ctx, NULL, "c", NULL, 1); },
               "driveActivateFilter", provider));
  CHECK(Drives([&] { return nft->deActivateFilter(ind, ctx, NULL, "c", NULL, 1); },
               "driveDeActivateFilter", provider));
  CHECK(
      Drives([&] { return nft->enableIndications(ind, ctx); }, "driveEnableIndications", provider));
  CHECK(Drives([&] { return nft->disableIndications(ind, ctx); }, "driveDisableIndications",
               provider));

  // Each factory has its own table and record; all share the one provider object.
  CHECK(static_cast<const void*>(inst) != static_cast<const void*>(assoc));
  CHECK(static_cast<const void*>(meth) != static_cast<const void*>(prop));
  CHECK(g_constructed == 1 && provider->initialize_calls_ == 1);

  // A second provider name gets its own object, table and miName, untouched by the first.
  CMPIMethodMI* other = AbiOther_Create_MethodMI(&g_broker, &g_context, &rc);
  CHECK(other != nullptr && other != meth && other->ft != meth->ft);
  CHECK(Untouched(rc));
  CHECK(SameName(other->ft->miName, "methodAbiOther"));
  CHECK(other->ft->invokeMethod == &CmpiMethodMI::driveInvokeMethod);
  CHECK(g_constructed == 2);
  CHECK(baseAbiOther.getBaseMI() != nullptr && baseAbiOther.getBaseMI() != provider);
  CHECK(other->hdl == baseAbiOther.getBaseMI());
  CHECK(baseAbiOther.getBaseMI()->base_ == &baseAbiOther);
  CHECK(baseAbiOther.useCount() == 1 && baseAbiFactory.useCount() == 10);

  // The factories are exported under their plain names (this program is linked with
  // -rdynamic and hidden default visibility, like a provider library).
  CHECK(dlsym(RTLD_DEFAULT, "AbiFactory_Create_InstanceMI") ==
        reinterpret_cast<void*>(&AbiFactory_Create_InstanceMI));
  CHECK(dlsym(RTLD_DEFAULT, "AbiFactory_Create_AssociationMI") ==
        reinterpret_cast<void*>(&AbiFactory_Create_AssociationMI));
  CHECK(dlsym(RTLD_DEFAULT, "AbiFactory_Create_MethodMI") ==
        reinterpret_cast<void*>(&AbiFactory_Create_MethodMI));
  CHECK(dlsym(RTLD_DEFAULT, "AbiFactory_Create_PropertyMI") ==
        reinterpret_cast<void*>(&AbiFactory_Create_PropertyMI));
  CHECK(dlsym(RTLD_DEFAULT, "AbiFactory_Create_IndicationMI") ==
        reinterpret_cast<void*>(&AbiFactory_Create_IndicationMI));
  CHECK(dlsym(RTLD_DEFAULT, "AbiOther_Create_MethodMI") ==
        reinterpret_cast<void*>(&AbiOther_Create_MethodMI));

  delete baseAbiFactory.getBaseMI();
  delete baseAbiOther.getBaseMI();

  if (g_failures != 0) {
    std::fprintf(stderr, "C++ factory macros: %d of %d checks failed\n", g_failures, g_checks);
    return 1;
  }
  std::printf("C++ factory macros: %d checks passed\n", g_checks);
  return 0;
}
