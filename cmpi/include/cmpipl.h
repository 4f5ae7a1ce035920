/*
 * cmpipl.h - platform selection for the CMPI 2.0 headers.
 *
 * The other CMPI headers need to know which platform they are built for (it decides the 64-bit
 * integer types, the thread handle types and how the MI factory functions are exported). A build
 * names its platform by defining exactly one CMPI_PLATFORM_* macro. This file declares nothing;
 * it only makes sure one platform is chosen.
 *
 * If the build names none, we pick CMPI_PLATFORM_LINUX_GENERIC_GNU, because Linux with GCC or
 * Clang is the only platform this project is built for and it saves every consumer from having to
 * repeat the definition. The choice has no effect on the binary layout of any CMPI type.
 */
#ifndef _CMPIPL_H_
#define _CMPIPL_H_

#if !defined(CMPI_PLATFORM_LINUX_GENERIC_GNU) && !defined(CMPI_PLATFORM_HPUX_ACC) &&         \
    !defined(CMPI_PLATFORM_WIN32_IX86_MSVC) && !defined(CMPI_PLATFORM_SOLARIS_SPARC_GNU) &&  \
    !defined(CMPI_PLATFORM_SOLARIS_SPARC_CC) && !defined(CMPI_PLATFORM_AIX_RS_IBMCXX) &&     \
    !defined(CMPI_PLATFORM_ZOS_ZSERIES_IBM) && !defined(CMPI_PLATFORM_TRU64_ALPHA_DECCXX) && \
    !defined(CMPI_PLATFORM_OS400_ISERIES_IBM) && !defined(CMPI_PLATFORM_DARWIN_PPC_GNU) &&   \
    !defined(CMPI_PLATFORM_VMS_ALPHA_DECCXX) && !defined(CMPI_PLATFORM_VMS_IA64_DECCXX)
#if defined(_MSC_VER)
/* A Windows build has different integer, thread and export definitions; make it say so. */
#error "No CMPI platform macro defined: define CMPI_PLATFORM_WIN32_IX86_MSVC for this compiler"
#else
#define CMPI_PLATFORM_LINUX_GENERIC_GNU 1
#endif
#endif

/* Two platform macros at once would silently mix definitions; refuse that. */
#if (defined(CMPI_PLATFORM_LINUX_GENERIC_GNU) + defined(CMPI_PLATFORM_HPUX_ACC) +         \
     defined(CMPI_PLATFORM_WIN32_IX86_MSVC) + defined(CMPI_PLATFORM_SOLARIS_SPARC_GNU) +  \
     defined(CMPI_PLATFORM_SOLARIS_SPARC_CC) + defined(CMPI_PLATFORM_AIX_RS_IBMCXX) +     \
     defined(CMPI_PLATFORM_ZOS_ZSERIES_IBM) + defined(CMPI_PLATFORM_TRU64_ALPHA_DECCXX) + \
     defined(CMPI_PLATFORM_OS400_ISERIES_IBM) + defined(CMPI_PLATFORM_DARWIN_PPC_GNU) +   \
     defined(CMPI_PLATFORM_VMS_ALPHA_DECCXX) + defined(CMPI_PLATFORM_VMS_IA64_DECCXX)) != 1
#error "More than one CMPI_PLATFORM_* macro is defined; define exactly one"
#endif

#endif /* _CMPIPL_H_ */
