/* Test probe of the reference QRVExternalMonitor library: a C interface,
 * reached from tests through ctypes, that shows which virtual operations were
 * called, in what order, and what the devices received. It is not part of the
 * library contract and the Python module never calls it. */
#ifndef QRV_PROBE_H
#define QRV_PROBE_H

#include "tarsel/export.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Call log: one entry per virtual operation of a display or an image, oldest
 * first, "display<N>.<operation>(<arguments>) -> <result>" or
 * "image<N>.<operation>() -> <result>" (N numbers displays and images from 1
 * in the order they were made; a null text argument reads "null"). Only the
 * newest QRV_PROBE_LOG_CAPACITY entries are kept. */
#define QRV_PROBE_LOG_CAPACITY 4096
QRV_API int qrv_probe_call_count(void);
/* Entry `index` (0 = oldest kept); null when out of range. The text stays
 * valid until the next probe call. */
QRV_API const char *qrv_probe_call(int index);
QRV_API void qrv_probe_clear_calls(void);

/* Objects alive: displays made and not deleted, images not yet freed. */
QRV_API int qrv_probe_live_displays(void);
QRV_API int qrv_probe_live_images(void);
/* Reference count of a live image; -1 for anything else. */
QRV_API int qrv_probe_image_refs(const void *image);
/* Number (the N of the call log) of a live display or image; -1 otherwise. */
QRV_API int qrv_probe_object_number(const void *object);

/* The last frame the preview device of a live display received: copies its
 * B, G, R, A bytes (top row first) into `bgra` when `capacity` suffices and
 * sets the size, the number of frames shown since connect and the image's
 * name (into `name`, `name_capacity` bytes, cut and NUL-terminated). Returns
 * the frame's byte count (0 when no frame was shown since connect), -1 for a
 * pointer that is not a live display. Null outputs are skipped. */
QRV_API int qrv_probe_preview_frame(const void *display, void *bgra, int capacity, int *width, int *height,
                                    long long *frames, char *name, int name_capacity);

/* Fault switches, kept until changed: EM_DisplayInit returns null while
 * `init_fails` is set; displays made while `no_devices` is set have no devices. */
QRV_API void qrv_probe_set_init_fails(int on);
QRV_API void qrv_probe_set_no_devices(int on);

#ifdef __cplusplus
}
#endif

#endif /* QRV_PROBE_H */
