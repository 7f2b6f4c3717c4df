/* The counters of glshare, which show whether acquires and releases copy.
 *
 * Look the function up by name with clGetExtensionFunctionAddressForPlatform (or the older
 * clGetExtensionFunctionAddress). Null means that glshare is not active. */
#ifndef GLSHARE_H
#define GLSHARE_H

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Totals since the process started, over all contexts. */
/* NOLINTNEXTLINE(modernize-use-using): C programs include this */
typedef struct glshare_counters {
    uint64_t acquired_in_place; /* acquires of buffers whose storage OpenCL uses in place */
    uint64_t acquired_by_copy;  /* acquires that copied from the OpenGL buffer */
    uint64_t released_by_copy;  /* releases that copied to the OpenGL buffer */
    uint64_t bytes_copied;      /* in either direction */
    uint64_t failed_copies; /* copies that failed: the buffer was deleted, mapped or too small */
} glshare_counters;

/* Writes the totals to `counters`. Any thread. */
/* NOLINTNEXTLINE(modernize-use-using): C programs include this */
typedef void (*glshare_get_counters_fn)(glshare_counters* counters);
#define GLSHARE_GET_COUNTERS_NAME "glshareGetCounters"

#ifdef __cplusplus
}
#endif

#endif
