/*
 * cmpios.h - operating-system dependent definitions for the CMPI 2.0 headers.
 *
 * Holds the handle types used by the thread, mutex and condition services of the broker
 * (CMPIBrokerExtFT) and the two macros that make the MI factory functions visible to the broker:
 * CMPI_EXPORT and CMPI_EXTERN_C. Only macros live here.
 */
#ifndef _CMPIOS_H_
#define _CMPIOS_H_

#include "cmpipl.h"

#include <stdlib.h> /* size_t and NULL, used throughout the function tables and macros */

#if defined(CMPI_PLATFORM_WIN32_IX86_MSVC)
#error "The CMPI thread handle types are only defined for POSIX platforms in this header set"
#endif

/*
 * Always include <pthread.h> ourselves, in C and in C++: CMPI_THREAD_KEY_TYPE is pthread_key_t
 * and relying on another system header to drag it in is fragile.
 */
#include <pthread.h>

/* Every thread, mutex and condition handle travels as an opaque pointer. */
#define CMPI_THREAD_RETURN void*
#define CMPI_THREAD_TYPE void*
#define CMPI_MUTEX_TYPE void*
#define CMPI_COND_TYPE void*
#define CMPI_THREAD_KEY_TYPE pthread_key_t

/*
 * Calling convention of a thread start routine. POSIX systems have a single C calling convention,
 * so this is empty in C and in C++ alike (GCC and Clang do not know __cdecl outside Windows).
 */
#define CMPI_THREAD_CDECL

/*
 * CMPI_EXPORT keeps a symbol visible even when the library is built with -fvisibility=hidden;
 * the broker finds the MI factory functions with dlsym(), so they must stay in the dynamic symbol
 * table.
 */
#if defined(__GNUC__) && (__GNUC__ >= 4)
#define CMPI_EXPORT __attribute__((visibility("default")))
#else
#define CMPI_EXPORT
#endif

/* The factory functions must also keep their plain C names when a provider is written in C++. */
#ifdef __cplusplus
#define CMPI_EXTERN_C extern "C" CMPI_EXPORT
#else
#define CMPI_EXTERN_C CMPI_EXPORT
#endif

#endif /* _CMPIOS_H_ */
