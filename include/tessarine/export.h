/* Export and linkage macros shared by every public header. */
#ifndef TESSARINE_EXPORT_H
#define TESSARINE_EXPORT_H

#if defined(TESSARINE_BUILDING)
#define TESSARINE_API __attribute__((visibility("default")))
#else
#define TESSARINE_API
#endif

#ifdef __cplusplus
#define TESSARINE_BEGIN_C extern "C" {
#define TESSARINE_END_C }
#else
#define TESSARINE_BEGIN_C
#define TESSARINE_END_C
#endif

/* A status lives in the low 16 bits of a 32-bit result; the upper half means
   nothing. Every test of a result goes through these. */
#define TS_STATUS(s) ((int16_t)(s))
#define TS_FAILED(s) (((int16_t)(s)) < 0)
#define TS_OK 10

#endif
