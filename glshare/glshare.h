/* What glshare offers beyond the two extensions: counters that show what sharing costs.
 *
 * The function is found by its name through clGetExtensionFunctionAddressForPlatform (or the older
 * clGetExtensionFunctionAddress). A null answer means that glshare is not active. */
#ifndef GLSHARE_H
#define GLSHARE_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Totals since the process started, over all contexts. */
/* NOLINTNEXTLINE(modernize-use-using): C programs include this */
typedef struct glshare_counters {
    uint64_t acquired_in_place; /* acquires of a buffer whose GL storage OpenCL uses directly */
    uint64_t acquired_by_copy;  /* acquires that copied from the GL buffer */
    uint64_t released_by_copy;  /* releases that copied to the GL buffer */
    uint64_t bytes_copied;      /* in either direction */
    uint64_t failed_copies;     /* copies that found the GL buffer gone or too small */
} glshare_counters;

/* Fills `counters`. Safe from any thread. */
/* NOLINTNEXTLINE(modernize-use-using): C programs include this */
typedef void (*glshare_get_counters_fn)(glshare_counters* counters);
#define GLSHARE_GET_COUNTERS_NAME "glshareGetCounters"

#ifdef __cplusplus
}
#endif

#endif
