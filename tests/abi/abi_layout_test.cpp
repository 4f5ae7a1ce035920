// Run-time ABI checks of the CMPI headers, compiled as C++.
//
// abi_static_checks.cpp already refuses to compile when a fact is wrong; these tests repeat the
// numeric facts at run time so that every one of them shows up in the test report with its name,
// and cover what only makes sense at run time (brace initialisation results, strings).

#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

#include "cmpift.h"

namespace {

struct Fact {
  const char* what;
  long long actual;
  long long expected;
};

template <typename T, bool = std::is_enum<T>::value>
struct IsSigned : std::is_signed<T> {};
template <typename T>
struct IsSigned<T, true> : std::is_signed<typename std::underlying_type<T>::type> {};

#define ABI_SIGNED_1 1
#define ABI_SIGNED_0 0
#define ABI_SIGNED_real 1
#define ABI_SIGNED_na -1

std::vector<Fact> ScalarFacts() {
  std::vector<Fact> facts;
#define ABI_SCALAR(T, decl, size, align, sgn)                          \
  facts.push_back({"sizeof " #T, (long long)sizeof(T), size});         \
  facts.push_back({"alignof " #T, (long long)alignof(T), align});      \
  facts.push_back({#T " is " #decl, std::is_same<T, decl>::value, 1}); \
  if (ABI_SIGNED_##sgn >= 0)                                           \
    facts.push_back({"signedness of " #T, IsSigned<T>::value, ABI_SIGNED_##sgn});
#define ABI_OS_MACRO(name, size) facts.push_back({"sizeof " #name, (long long)sizeof(name), size});
#include "abi_expected.inc"
#undef ABI_SCALAR
#undef ABI_OS_MACRO
  return facts;
}

std::vector<Fact> StructFacts() {
  std::vector<Fact> facts;
#define ABI_STRUCT(T, size, align)                             \
  facts.push_back({"sizeof " #T, (long long)sizeof(T), size}); \
  facts.push_back({"alignof " #T, (long long)alignof(T), align});
#include "abi_expected.inc"
#undef ABI_STRUCT
  return facts;
}

std::vector<Fact> MemberFacts() {
  std::vector<Fact> facts;
#define ABI_MEMBER(T, m, off, size)                                         \
  facts.push_back({"offsetof " #T "." #m, (long long)offsetof(T, m), off}); \
  facts.push_back({"sizeof " #T "." #m, (long long)sizeof(T::m), size});
#include "abi_expected.inc"
#undef ABI_MEMBER
  return facts;
}

std::vector<Fact> MemberTypeFacts() {
  std::vector<Fact> facts;
#define ABI_DATA_TYPE(T, m, declared, unqualified) \
  facts.push_back({"type of " #T "." #m, std::is_same<decltype(T::m), declared>::value, 1});
#define ABI_FN_TYPE(T, m, fn) \
  facts.push_back({"type of " #T "." #m, std::is_same<decltype(T::m), fn>::value, 1});
#include "abi_expected.inc"
#undef ABI_DATA_TYPE
#undef ABI_FN_TYPE
  return facts;
}

std::vector<Fact> ConstantFacts() {
  std::vector<Fact> facts;
#define ABI_CONSTANT(name, val) facts.push_back({#name, (long long)(name), val});
#include "abi_expected.inc"
#undef ABI_CONSTANT
  return facts;
}

std::vector<Fact> EnumeratorFacts() {
  std::vector<Fact> facts;
#define ABI_ENUMERATOR(E, name, val)                \
  facts.push_back({#name, (long long)(name), val}); \
  facts.push_back({#name " belongs to " #E, std::is_same<decltype(name), E>::value, 1});
#include "abi_expected.inc"
#undef ABI_ENUMERATOR
  return facts;
}

void ExpectAll(const std::vector<Fact>& facts, size_t expected_count) {
  EXPECT_EQ(facts.size(), expected_count) << "number of checks changed";
  for (const Fact& f : facts) {
    EXPECT_EQ(f.actual, f.expected) << f.what;
  }
}

}  // namespace

// The counts pin the size of each table, so that a regenerated data file that silently lost rows
// shows up as a failure.
TEST(AbiLayout, ScalarTypedefs) { ExpectAll(ScalarFacts(), 26 * 4 - 1 + 5); }
TEST(AbiLayout, StructSizesAndAlignments) { ExpectAll(StructFacts(), 47 * 2); }
TEST(AbiLayout, MemberOffsetsAndSizes) { ExpectAll(MemberFacts(), 324 * 2); }
TEST(AbiLayout, MemberTypes) { ExpectAll(MemberTypeFacts(), 324); }
TEST(AbiLayout, Constants) { ExpectAll(ConstantFacts(), 108); }
TEST(AbiLayout, Enumerators) { ExpectAll(EnumeratorFacts(), 197 * 2); }

TEST(AbiLayout, ContextEntryNames) {
  int count = 0;
#define ABI_STRING(name, val) \
  EXPECT_STREQ(name, val);    \
  ++count;
#include "abi_expected.inc"
#undef ABI_STRING
  EXPECT_EQ(count, 6);
}

TEST(AbiLayout, VersionSwitches) {
  EXPECT_EQ(CMPIVersion100, 100);
  EXPECT_EQ(CMPIVersion200, 200);
  EXPECT_EQ(CMPICurrentVersion, 200);
#if defined(CMPI_VER_200) && defined(CMPI_VER_100) && defined(CMPI_VER_90) && \
    defined(CMPI_VER_87) && defined(CMPI_VER_86) && defined(CMPI_VER_85) && defined(CMPI_VER_80)
  SUCCEED();
#else
  ADD_FAILURE() << "a default build must define every CMPI_VER_x switch";
#endif
}

TEST(AbiAggregates, BraceInitialisation) {
  CMPIStatus st = {CMPI_RC_OK, NULL};
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(st.msg, nullptr);

  CMPIValue v = {0};
  EXPECT_EQ(v.uint64, 0u);
  v.uint64 = 0x0102030405060708ULL;
  // Little-endian overlay: the narrower members read the low bytes of the same storage.
  EXPECT_EQ(v.uint32, 0x05060708u);
  EXPECT_EQ(v.uint8, 0x08u);
  EXPECT_EQ((const void*)&v.dataPtr, (const void*)&v);

  CMPIData d = {CMPI_uint32, CMPI_goodValue, {0}};
  EXPECT_EQ(d.type, CMPI_uint32);
  EXPECT_EQ(d.state, CMPI_goodValue);
  EXPECT_EQ(d.value.uint64, 0u);

  CMPIData zero{};
  EXPECT_EQ(zero.type, CMPI_null);
  EXPECT_EQ(zero.value.uint64, 0u);
}

TEST(AbiAggregates, TypeTraits) {
  EXPECT_TRUE(std::is_standard_layout<CMPIStatus>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPIData>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPIValue>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPIBroker>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPIInstanceMIFT>::value);
  EXPECT_TRUE(std::is_trivial<CMPIStatus>::value);
  EXPECT_TRUE(std::is_trivial<CMPIData>::value);
  EXPECT_TRUE(std::is_trivial<CMPIValue>::value);
  EXPECT_TRUE(std::is_trivial<CMPIBroker>::value);
  EXPECT_TRUE(std::is_trivial<CMPIInstance>::value);
  EXPECT_TRUE(std::is_trivial<CMPIInstanceMIFT>::value);
  EXPECT_TRUE(std::is_aggregate<CMPIStatus>::value);
  EXPECT_TRUE(std::is_aggregate<CMPIData>::value);
  EXPECT_TRUE(std::is_aggregate<CMPIInstanceMI>::value);
  // The three tables with a const version field cannot be default constructed, but they are
  // still plain aggregates.
  EXPECT_TRUE(std::is_aggregate<CMPIAssociationMIFT>::value);
  EXPECT_TRUE(std::is_trivially_copyable<CMPIAssociationMIFT>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPISelectCondFT>::value);
  EXPECT_TRUE(std::is_standard_layout<CMPIBrokerMemFT>::value);
}

TEST(AbiMacros, ValueTestsYieldTheMaskedBit) {
  CMPIData d = {CMPI_uint32A, CMPI_nullValue | CMPI_keyValue, {0}};
  EXPECT_EQ(CMIsNullValue(d), 256);
  EXPECT_EQ(CMIsKeyValue(d), 512);
  EXPECT_EQ(CMIsArray(d), 8192);
#ifdef ABI_OWN_HEADERS
  const CMPIData* p = &d;
  EXPECT_EQ(CMIsNullValue(*p), 256);  // our macros parenthesise the argument
#endif
  d.state = CMPI_goodValue;
  d.type = CMPI_uint32;
  EXPECT_EQ(CMIsNullValue(d), 0);
  EXPECT_EQ(CMIsKeyValue(d), 0);
  EXPECT_EQ(CMIsArray(d), 0);
}

TEST(AbiMacros, NullObjectAndCharPtr) {
  const CMPIString* none = nullptr;
  EXPECT_TRUE(CMIsNullObject(none));
  CMPIString s = {NULL, NULL};
  EXPECT_TRUE(CMIsNullObject(&s));
  char text[] = "chars";
  s.hdl = text;
  EXPECT_FALSE(CMIsNullObject(&s));
  EXPECT_STREQ(CMGetCharPtr(&s), "chars");
}

namespace {
CMPIStatus ReturnsOk() { CMReturn(CMPI_RC_OK); }
CMPIStatus ReturnsWithString(CMPIString* s) { CMReturnWithString(CMPI_RC_ERR_FAILED, s); }
}  // namespace

TEST(AbiMacros, ReturnAndStatus) {
  CMPIStatus st = ReturnsOk();
  EXPECT_EQ(st.rc, CMPI_RC_OK);
  EXPECT_EQ(st.msg, nullptr);
  CMPIString s = {NULL, NULL};
  st = ReturnsWithString(&s);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_FAILED);
  EXPECT_EQ(st.msg, &s);
  CMSetStatus(&st, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_NOT_FOUND);
  EXPECT_EQ(st.msg, nullptr);
  CMSetStatusWithString(&st, CMPI_RC_ERR_ACCESS_DENIED, &s);
  EXPECT_EQ(st.rc, CMPI_RC_ERR_ACCESS_DENIED);
  EXPECT_EQ(st.msg, &s);
}

TEST(AbiMacros, MessageArgumentHelpers) {
  // Each helper yields a type code and the value converted to the C type read for that code.
  long long sint[] = {CMFmtSint(-3)};
  EXPECT_EQ(sint[0], CMPI_sint32);
  EXPECT_EQ(sint[1], -3);
  static_assert(std::is_same<decltype((CMFmtSint(1))), long>::value, "CMFmtSint passes long");
  static_assert(std::is_same<decltype((CMFmtUint(1))), unsigned long>::value, "CMFmtUint");
  static_assert(std::is_same<decltype((CMFmtSint64(1))), long long>::value, "CMFmtSint64");
  static_assert(std::is_same<decltype((CMFmtUint64(1))), unsigned long long>::value, "Uint64");
  static_assert(std::is_same<decltype((CMFmtReal(1))), double>::value, "CMFmtReal");
  static_assert(std::is_same<decltype((CMFmtBoolean(1))), int>::value, "CMFmtBoolean");
  static_assert(std::is_same<decltype((CMFmtChars("x"))), char*>::value, "CMFmtChars");
#ifdef ABI_OWN_HEADERS
  static_assert(std::is_same<decltype((CMFmtString(NULL))), CMPIString*>::value, "CMFmtString");
#endif
  int codes[] = {CMFmtArgs0()};
  EXPECT_EQ(codes[0], 0);
  int ten[] = {CMFmtArgs10(1, 2, 3, 4, 5, 6, 7, 8, 9, 10)};
  EXPECT_EQ(sizeof ten / sizeof ten[0], 11u);
  EXPECT_EQ(ten[0], 10);
  EXPECT_EQ(ten[10], 10);
}
