// Compile-time ABI checks of the CMPI headers, compiled as C++.
//
// The same facts as abi_check.c, but seen by a C++ compiler: C++ gives the exact declared type
// of every member (including const-ness of pointees and of the member itself) and of every
// enumerator, and it can check that the types stay plain C aggregates. A user-declared
// constructor, destructor or virtual function on any of them would change how C++ code passes
// them across the C boundary, so the type-trait checks matter as much as the offsets.
//
// This file has no test-framework dependency so that it can be compiled on its own with any
// C++ compiler (see check_compilers.cmake).

#include <cstddef>
#include <type_traits>

#include "cmpidt.h"
#include "cmpift.h"
#include "cmpimacs.h"

#include "abi_macro_checks.inc"

namespace {

template <typename T, bool = std::is_enum<T>::value>
struct AbiIsSigned : std::is_signed<T> {};
template <typename T>
struct AbiIsSigned<T, true> : std::is_signed<typename std::underlying_type<T>::type> {};

// Every CMPI struct and union: standard layout (offsets as in C), trivially copyable and
// destructible (passed and returned in registers or memory exactly like in C), an aggregate
// (brace initialisation as in the macros), and trivial unless a const member deletes the
// default constructor (the three tables with a const version field).
template <typename T>
constexpr bool AbiPlainAggregate() {
  return std::is_standard_layout<T>::value && std::is_trivially_copyable<T>::value &&
         std::is_trivially_destructible<T>::value &&
         std::is_trivially_copy_constructible<T>::value && std::is_aggregate<T>::value &&
         !std::is_polymorphic<T>::value &&
         (std::is_trivial<T>::value || !std::is_default_constructible<T>::value);
}

constexpr bool AbiSameString(const char* a, const char* b) {
  while (*a != '\0' && *a == *b) {
    ++a;
    ++b;
  }
  return *a == *b;
}

}  // namespace

#define ABI_CXX_SIGN_1(T) AbiIsSigned<T>::value
#define ABI_CXX_SIGN_0(T) !AbiIsSigned<T>::value
#define ABI_CXX_SIGN_real(T) std::is_signed<T>::value
#define ABI_CXX_SIGN_na(T) std::is_pointer<T>::value

#define ABI_SCALAR(T, decl, size, align, sgn)                   \
  static_assert(sizeof(T) == (size), "sizeof " #T);             \
  static_assert(alignof(T) == (align), "alignment of " #T);     \
  static_assert(std::is_same<T, decl>::value, #T " is " #decl); \
  static_assert(ABI_CXX_SIGN_##sgn(T), "signedness of " #T);
#define ABI_OS_MACRO(name, size) static_assert(sizeof(name) == (size), "sizeof " #name);
#define ABI_STRUCT(T, size, align)                          \
  static_assert(sizeof(T) == (size), "sizeof " #T);         \
  static_assert(alignof(T) == (align), "alignment of " #T); \
  static_assert(AbiPlainAggregate<T>(), #T " must stay a plain C aggregate");
#define ABI_MEMBER(T, m, off, size)                               \
  static_assert(offsetof(T, m) == (off), "offset of " #T "." #m); \
  static_assert(sizeof(T::m) == (size), "size of " #T "." #m);
#define ABI_DATA_TYPE(T, m, declared, unqualified) \
  static_assert(std::is_same<decltype(T::m), declared>::value, "type of " #T "." #m);
#define ABI_FN_TYPE(T, m, fn) \
  static_assert(std::is_same<decltype(T::m), fn>::value, "type of " #T "." #m);
#define ABI_CONSTANT(name, val) static_assert((name) == (val), "value of " #name);
#define ABI_ENUMERATOR(E, name, val)                 \
  static_assert((name) == (val), "value of " #name); \
  static_assert(std::is_same<decltype(name), E>::value, #name " belongs to " #E);
#define ABI_STRING(name, val)                                                               \
  static_assert(sizeof(name) == sizeof(val), "length of " #name);                           \
  static_assert(std::is_same<decltype(name), decltype(val)>::value, #name " is a literal"); \
  static_assert(AbiSameString(name, val), "value of " #name);
#include "abi_expected.inc"
#undef ABI_SCALAR
#undef ABI_OS_MACRO
#undef ABI_STRUCT
#undef ABI_MEMBER
#undef ABI_DATA_TYPE
#undef ABI_FN_TYPE
#undef ABI_CONSTANT
#undef ABI_ENUMERATOR
#undef ABI_STRING

// The main value types are fully trivial: no constructor of any kind is user-provided.
static_assert(std::is_trivial<CMPIStatus>::value, "CMPIStatus must be trivial");
static_assert(std::is_trivial<CMPIData>::value, "CMPIData must be trivial");
static_assert(std::is_trivial<CMPIValue>::value, "CMPIValue must be trivial");
static_assert(std::is_trivial<CMPIValuePtr>::value, "CMPIValuePtr must be trivial");
static_assert(std::is_trivial<CMPIBroker>::value, "CMPIBroker must be trivial");
static_assert(std::is_trivial<CMPIInstance>::value, "CMPIInstance must be trivial");
static_assert(std::is_trivial<CMPIObjectPath>::value, "CMPIObjectPath must be trivial");
static_assert(std::is_trivial<CMPIInstanceMI>::value, "CMPIInstanceMI must be trivial");
static_assert(std::is_trivial<CMPIInstanceMIFT>::value, "CMPIInstanceMIFT must be trivial");
static_assert(std::is_union<CMPIValue>::value, "CMPIValue is a union");

// The 64-bit integers are long long based: same size as (u)int64_t, different C++ types.
static_assert(std::is_same<CMPIUint64, unsigned long long>::value, "CMPIUint64");
static_assert(std::is_same<CMPISint64, long long>::value, "CMPISint64");
// CMPIBoolean is a byte, not bool.
static_assert(!std::is_same<CMPIBoolean, bool>::value, "CMPIBoolean must not be bool");

// Odd but kept function-type facts.
static_assert(std::is_function<CMPIAccessor>::value, "CMPIAccessor is a function type");
static_assert(std::is_same<CMPIAccessor, CMPIData(const char*, void*)>::value, "CMPIAccessor");
static_assert(std::is_void<CMPIGcStat>::value, "CMPIGcStat is void");

// Version switches of a default build.
#if !defined(CMPI_VER_200) || !defined(CMPI_VER_100) || !defined(CMPI_VER_90) || \
    !defined(CMPI_VER_87) || !defined(CMPI_VER_86) || !defined(CMPI_VER_85) ||   \
    !defined(CMPI_VER_80)
#error "a default build must define every CMPI_VER_x switch"
#endif
static_assert(CMPIVersion100 == 100 && CMPIVersion200 == 200, "version numbers");
static_assert(CMPICurrentVersion == 200, "CMPICurrentVersion");

#ifdef ABI_OWN_HEADERS
// In C++ too the thread start routine has no calling-convention keyword on Linux.
#define ABI_STR2(x) #x
#define ABI_STR(x) ABI_STR2(x)
static_assert(sizeof(ABI_STR(CMPI_THREAD_CDECL)) == 1, "CMPI_THREAD_CDECL must be empty");
#endif

namespace {

// Brace initialisation as provider code writes it must keep compiling in C++.
constexpr CMPIStatus kOk = {CMPI_RC_OK, NULL};
static_assert(kOk.rc == CMPI_RC_OK && kOk.msg == nullptr, "CMPIStatus brace initialisation");
constexpr CMPIValue kZero = {0};
static_assert(kZero.uint64 == 0, "CMPIValue {0} initialises uint64");
constexpr CMPIData kData = {CMPI_uint32, CMPI_goodValue, {0}};
static_assert(kData.type == CMPI_uint32 && kData.value.uint64 == 0, "CMPIData initialisation");

// The value tests yield the masked bit, as an int.
constexpr CMPIData kNullKeyArray = {CMPI_uint32A, CMPI_nullValue | CMPI_keyValue, {0}};
static_assert(CMIsNullValue(kNullKeyArray) == 256, "CMIsNullValue");
static_assert(CMIsKeyValue(kNullKeyArray) == 512, "CMIsKeyValue");
static_assert(CMIsArray(kNullKeyArray) == 8192, "CMIsArray");
static_assert(std::is_same<decltype(CMIsNullValue(kNullKeyArray)), int>::value, "int result");

// Macros must accept what C++ call sites pass: string literals and const objects as values,
// and they must yield the slot's result type.
[[maybe_unused]] CMPIStatus AbiMacroForms(const CMPIBroker* mb, const CMPIContext* ctx,
                                          const CMPIResult* rslt, const CMPIObjectPath* cop,
                                          CMPIInstance* inst, CMPIArray* arr) {
  CMPIStatus st = {CMPI_RC_OK, NULL};
  const CMPIUint32 count = 3;
  static_assert(
      std::is_same<decltype(CMSetProperty(inst, "Name", "literal", CMPI_chars)), CMPIStatus>::value,
      "CMSetProperty yields CMPIStatus");
  static_assert(std::is_same<decltype(CMGetNext((CMPIEnumeration*)NULL, &st)), CMPIData>::value,
                "CMGetNext yields CMPIData");
  static_assert(std::is_same<decltype(CMGetCharsPtr((CMPIString*)NULL, NULL)), char*>::value,
                "CMGetCharsPtr yields char *");
  static_assert(
      std::is_same<decltype(CMNewObjectPath(mb, "ns", "cn", &st)), CMPIObjectPath*>::value,
      "CMNewObjectPath yields CMPIObjectPath *");
#ifdef ABI_OWN_HEADERS
  static_assert(std::is_same<std::remove_reference<decltype(CBGetClassification(mb))>::type,
                             unsigned int>::value,
                "CBGetClassification reads brokerCapabilities");
#endif
  CMSetProperty(inst, "Name", "literal", CMPI_chars);
  CMSetProperty(inst, "Count", &count, CMPI_uint32);
  CMSetArrayElementAt(arr, 0, "x", CMPI_chars);
  CMAddKey((CMPIObjectPath*)cop, "Name", "literal", CMPI_chars);
  CMReturnData(rslt, &count, CMPI_uint32);
  CMAddContextEntry(ctx, "entry", "value", CMPI_chars);
  CBSetProperty(mb, ctx, cop, "Name", "literal", CMPI_chars);
  CMPIString* text = CDToString(mb, cop, &st);
  if (CMIsNullObject(text)) {
    CMReturnWithChars(mb, CMPI_RC_ERR_FAILED, "no string");
  }
  CMSetStatusWithString(&st, CMPI_RC_OK, text);
  CMSetStatus(&st, CMPI_RC_OK);
  (void)CMGetMessage(mb, "id", "$0 $1 $2 $3 $4 $5 $6", &st,
                     CMFmtArgs7(CMFmtSint(-1), CMFmtUint(1u), CMFmtSint64(-2), CMFmtUint64(2u),
                                CMFmtReal(0.5), CMFmtBoolean(1), CMFmtChars("c")));
#ifdef ABI_OWN_HEADERS
  (void)CMGetMessage(mb, "id", "$0", &st, CMFmtArgs1(CMFmtString(text)));
#endif
  (void)CMGetMessage(mb, "id", "none", &st, CMFmtArgs0());
  return st;
}

}  // namespace
