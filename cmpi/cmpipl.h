/**
 * What the headers of the Common Manageability Programming Interface need to know about the platform, which is Linux on
 * x86 and x86-64: the C calling convention is the default.
 */
#ifndef CMPIPL_H
#define CMPIPL_H

#ifdef __cplusplus
#define CMPI_EXTERN_C extern "C"
#else
#define CMPI_EXTERN_C extern
#endif

#endif
