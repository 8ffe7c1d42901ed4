/* What CMPI needs of the platform: C linkage and symbols that the server's loader can see. Linux only. */
#ifndef NORVANE_CMPIPL_H
#define NORVANE_CMPIPL_H

#ifdef __cplusplus
#define CMPI_EXTERN_C extern "C"
#else
#define CMPI_EXTERN_C extern
#endif

#define CMPI_EXPORT __attribute__((visibility("default")))
#define CMPI_IMPORT

#endif
