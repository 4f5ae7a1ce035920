/*
 * ABI check of the CMPI headers, compiled as C.
 *
 * Brokers and providers built by other people exchange our CMPI types in memory, so every size,
 * alignment, member offset, member type and constant must match the measured values collected in
 * abi_expected.inc. Every fact is checked twice: with _Static_assert, so that a wrong header does
 * not even compile, and again at run time, so that the test reports how much it checked.
 */
#include <stddef.h>
#include <stdio.h>
#include <string.h>

/* Any include order must work; cmpimacs.h first pulls in the other two through the chain. */
/* clang-format off */
#include "cmpimacs.h"
#include "cmpift.h"
#include "cmpidt.h"
/* clang-format on */

#include "abi_macro_checks.inc"

#if !defined(__STDC_VERSION__) || __STDC_VERSION__ < 201112L
#error "This check needs C11 (_Static_assert, _Alignof, _Generic)"
#endif

/* ------------------------------------------------------------------------------------------- */
/* Compile-time checks                                                                         */
/* ------------------------------------------------------------------------------------------- */

/* (T)-1 wraps to the maximum for unsigned types and stays negative for signed ones. */
#define ABI_SIGN_1(T) (!((T)-1 > (T)0))
#define ABI_SIGN_0(T) ((T)-1 > (T)0)
#define ABI_SIGN_na(T) 1
/* Floating casts are not allowed in integer constant expressions: checked at run time only. */
#define ABI_SIGN_real(T) 1
#define ABI_RUNTIME_SIGN_1(T) ABI_SIGN_1(T)
#define ABI_RUNTIME_SIGN_0(T) ABI_SIGN_0(T)
#define ABI_RUNTIME_SIGN_na(T) 1
#define ABI_RUNTIME_SIGN_real(T) ((T)-1 < (T)0)

#define ABI_SCALAR(T, decl, size, align, sgn)                             \
  _Static_assert(sizeof(T) == (size), "sizeof " #T);                      \
  _Static_assert(_Alignof(T) == (align), "alignment of " #T);             \
  _Static_assert(_Generic((T)0, decl : 1, default : 0), #T " is " #decl); \
  _Static_assert(ABI_SIGN_##sgn(T), "signedness of " #T);
#define ABI_OS_MACRO(name, size) _Static_assert(sizeof(name) == (size), "sizeof " #name);
#define ABI_STRUCT(T, size, align)                   \
  _Static_assert(sizeof(T) == (size), "sizeof " #T); \
  _Static_assert(_Alignof(T) == (align), "alignment of " #T);
#define ABI_MEMBER(T, m, off, size)                                \
  _Static_assert(offsetof(T, m) == (off), "offset of " #T "." #m); \
  _Static_assert(sizeof(((T*)0)->m) == (size), "size of " #T "." #m);
#define ABI_DATA_TYPE(T, m, declared, unqualified) \
  _Static_assert(_Generic(((T*)0)->m, unqualified : 1, default : 0), "type of " #T "." #m);
#define ABI_FN_TYPE(T, m, fn) \
  _Static_assert(_Generic(((T*)0)->m, fn : 1, default : 0), "type of " #T "." #m);
#define ABI_CONSTANT(name, value) _Static_assert((name) == (value), "value of " #name);
#define ABI_ENUMERATOR(E, name, value)                  \
  _Static_assert((name) == (value), "value of " #name); \
  _Static_assert(sizeof(E) == 4, "size of " #E);
#define ABI_STRING(name, value) _Static_assert(sizeof(name) == sizeof(value), "length of " #name);
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

/* Version switches of a default build: every level up to 2.0, current version 200. */
#if !defined(CMPI_VER_200) || !defined(CMPI_VER_100) || !defined(CMPI_VER_90) || \
    !defined(CMPI_VER_87) || !defined(CMPI_VER_86) || !defined(CMPI_VER_85) ||   \
    !defined(CMPI_VER_80)
#error "a default build must define every CMPI_VER_x switch"
#endif
_Static_assert(CMPIVersion100 == 100, "CMPIVersion100");
_Static_assert(CMPIVersion200 == 200, "CMPIVersion200");
_Static_assert(CMPICurrentVersion == 200, "CMPICurrentVersion");

#ifdef ABI_OWN_HEADERS
/* The thread start routine has no calling-convention keyword on Linux. */
#define ABI_STR2(x) #x
#define ABI_STR(x) ABI_STR2(x)
_Static_assert(sizeof(ABI_STR(CMPI_THREAD_CDECL)) == 1, "CMPI_THREAD_CDECL must be empty");
#endif

/* CMPIAccessor is a function type, not a pointer. */
static CMPIData abi_accessor(const char* name, void* parm) {
  CMPIData d = {CMPI_null, CMPI_nullValue, {0}};
  (void)name;
  (void)parm;
  return d;
}
static CMPIAccessor* const abi_accessor_ptr = abi_accessor;

/* ------------------------------------------------------------------------------------------- */
/* Run-time report                                                                             */
/* ------------------------------------------------------------------------------------------- */

struct abi_fact {
  const char* kind;
  const char* what;
  long long actual;
  long long expected;
};

#define ABI_SCALAR(T, decl, size, align, sgn)                                \
  {"scalar", "sizeof " #T, (long long)sizeof(T), size},                      \
      {"scalar", "alignment of " #T, (long long)_Alignof(T), align},         \
      {"scalar", #T " is " #decl, _Generic((T)0, decl : 1, default : 0), 1}, \
      {"scalar", "signedness of " #T, ABI_RUNTIME_SIGN_##sgn(T), 1},
#define ABI_OS_MACRO(name, size) {"os", "sizeof " #name, (long long)sizeof(name), size},
#define ABI_STRUCT(T, size, align)                      \
  {"struct", "sizeof " #T, (long long)sizeof(T), size}, \
      {"struct", "alignment of " #T, (long long)_Alignof(T), align},
#define ABI_MEMBER(T, m, off, size)                                   \
  {"offset", "offset of " #T "." #m, (long long)offsetof(T, m), off}, \
      {"msize", "size of " #T "." #m, (long long)sizeof(((T*)0)->m), size},
#define ABI_DATA_TYPE(T, m, declared, unqualified) \
  {"mtype", "type of " #T "." #m, _Generic(((T*)0)->m, unqualified : 1, default : 0), 1},
#define ABI_FN_TYPE(T, m, fn) \
  {"mtype", "type of " #T "." #m, _Generic(((T*)0)->m, fn : 1, default : 0), 1},
#define ABI_CONSTANT(name, value) {"constant", #name, (long long)(name), value},
#define ABI_ENUMERATOR(E, name, value) {"enumerator", #name, (long long)(name), value},

static const struct abi_fact facts[] = {
#include "abi_expected.inc"
};

#undef ABI_SCALAR
#undef ABI_OS_MACRO
#undef ABI_STRUCT
#undef ABI_MEMBER
#undef ABI_DATA_TYPE
#undef ABI_FN_TYPE
#undef ABI_CONSTANT
#undef ABI_ENUMERATOR

struct abi_string {
  const char* name;
  const char* actual;
  const char* expected;
};

#define ABI_STRING(name, value) {#name, name, value},
static const struct abi_string strings[] = {
#include "abi_expected.inc"
};
#undef ABI_STRING

static int failures;

static void expect(int ok, const char* what) {
  if (!ok) {
    printf("FAIL: %s\n", what);
    ++failures;
  }
}

/* Brace initialisation as providers write it. */
static void check_aggregates(void) {
  CMPIStatus st = {CMPI_RC_OK, NULL};
  CMPIValue v = {0};
  CMPIData d = {CMPI_uint32, CMPI_goodValue, {0}};
  CMPIValuePtr vp = {NULL, 0};
  expect(st.rc == CMPI_RC_OK && st.msg == NULL, "CMPIStatus st = {CMPI_RC_OK, NULL}");
  expect(v.uint64 == 0, "CMPIValue v = {0} sets uint64");
  expect(d.type == CMPI_uint32 && d.state == CMPI_goodValue && d.value.uint64 == 0,
         "CMPIData brace initialisation");
  expect(vp.ptr == NULL && vp.length == 0, "CMPIValuePtr brace initialisation");

  /* The value tests yield the masked bit, not 1. */
  d.state = CMPI_nullValue | CMPI_keyValue;
  d.type = CMPI_uint32A;
  expect(CMIsNullValue(d) == 256, "CMIsNullValue yields 256");
  expect(CMIsKeyValue(d) == 512, "CMIsKeyValue yields 512");
  expect(CMIsArray(d) == 8192, "CMIsArray yields 8192");
  d.state = CMPI_goodValue;
  d.type = CMPI_uint32;
  expect(!CMIsNullValue(d) && !CMIsKeyValue(d) && !CMIsArray(d), "value tests on a plain value");

  /* CMIsNullObject looks at the pointer and at the handle inside the object. */
  {
    CMPIString s = {NULL, NULL};
    const CMPIString* none = NULL;
    expect(CMIsNullObject(none), "CMIsNullObject(NULL)");
    expect(CMIsNullObject(&s), "CMIsNullObject on a NULL handle");
    s.hdl = &s;
    expect(!CMIsNullObject(&s), "CMIsNullObject on a live object");
    s.hdl = (void*)"chars";
    expect(strcmp(CMGetCharPtr(&s), "chars") == 0, "CMGetCharPtr reads the handle");
  }

  {
    CMPIData r = abi_accessor_ptr("x", NULL);
    expect(r.type == CMPI_null, "CMPIAccessor call");
  }
}

int main(void) {
  size_t n = sizeof facts / sizeof facts[0];
  size_t i;
  const char* kinds[] = {"scalar", "os",    "struct",   "offset",
                         "msize",  "mtype", "constant", "enumerator"};
  size_t k;

  for (i = 0; i < n; ++i) {
    if (facts[i].actual != facts[i].expected) {
      printf("FAIL: %s is %lld, expected %lld\n", facts[i].what, facts[i].actual,
             facts[i].expected);
      ++failures;
    }
  }
  for (i = 0; i < sizeof strings / sizeof strings[0]; ++i) {
    expect(strcmp(strings[i].actual, strings[i].expected) == 0, strings[i].name);
  }
  check_aggregates();

  printf("CMPI ABI check (C, __STDC_VERSION__ %ld): %lu facts", (long)__STDC_VERSION__,
         (unsigned long)(n + sizeof strings / sizeof strings[0]));
  for (k = 0; k < sizeof kinds / sizeof kinds[0]; ++k) {
    size_t count = 0;
    for (i = 0; i < n; ++i) count += strcmp(facts[i].kind, kinds[k]) == 0;
    printf(", %s %lu", kinds[k], (unsigned long)count);
  }
  printf(", strings %lu\n", (unsigned long)(sizeof strings / sizeof strings[0]));
  if (failures) {
    printf("%d check(s) FAILED\n", failures);
    return 1;
  }
  printf("all passed\n");
  return 0;
}
