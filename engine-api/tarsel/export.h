/* Symbol export and import markers of the tarsel_ps engine and of the
 * QRVExternalMonitor library, and the platform requirement their record
 * layouts rest on. Usable from C and C++. */
#ifndef TARSEL_EXPORT_H
#define TARSEL_EXPORT_H

/* TARSEL_API: marks a declaration that the tarsel_ps library exports (empty
 * for the interface generator, and overridable by defining it first). */
#ifndef TARSEL_API
#  if defined(SWIG)
#    define TARSEL_API
#  elif defined(_WIN32)
#    if defined(TARSEL_BUILDING_ENGINE)
#      define TARSEL_API __declspec(dllexport)
#    else
#      define TARSEL_API __declspec(dllimport)
#    endif
#  else
#    define TARSEL_API __attribute__((visibility("default")))
#  endif
#endif

/* QRV_API: marks a declaration that the QRVExternalMonitor library exports. */
#ifndef QRV_API
#  if defined(SWIG)
#    define QRV_API
#  elif defined(_WIN32)
#    if defined(QRV_BUILDING_MONITOR)
#      define QRV_API __declspec(dllexport)
#    else
#      define QRV_API __declspec(dllimport)
#    endif
#  else
#    define QRV_API __attribute__((visibility("default")))
#  endif
#endif

/* The byte layouts of the engine's records are those of a 64-bit target. */
#if !defined(SWIG)
#  ifdef __cplusplus
static_assert(sizeof(void *) == 8, "tarsel_ps records are laid out for 64-bit targets");
#  else
_Static_assert(sizeof(void *) == 8, "tarsel_ps records are laid out for 64-bit targets");
#  endif
#endif

#endif /* TARSEL_EXPORT_H */
