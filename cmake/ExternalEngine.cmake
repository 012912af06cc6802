# Builds the module against an engine other than the reference engine: its
# headers (laid out as engine-api/) and its tarsel_ps and QRVExternalMonitor
# libraries. The libraries are not bundled; the module finds them through its
# run path.
find_library(RENDERLIB_TARSEL_PS tarsel_ps PATHS "${RENDERLIB_ENGINE_LIBRARY_DIR}" NO_DEFAULT_PATH REQUIRED)
find_library(RENDERLIB_QRV_MONITOR QRVExternalMonitor PATHS "${RENDERLIB_ENGINE_LIBRARY_DIR}" NO_DEFAULT_PATH REQUIRED)

add_library(tarsel_ps SHARED IMPORTED GLOBAL)
set_target_properties(tarsel_ps PROPERTIES
  IMPORTED_LOCATION "${RENDERLIB_TARSEL_PS}"
  INTERFACE_INCLUDE_DIRECTORIES "${RENDERLIB_ENGINE_INCLUDE_DIR}")
add_library(QRVExternalMonitor SHARED IMPORTED GLOBAL)
set_target_properties(QRVExternalMonitor PROPERTIES
  IMPORTED_LOCATION "${RENDERLIB_QRV_MONITOR}"
  INTERFACE_INCLUDE_DIRECTORIES "${RENDERLIB_ENGINE_INCLUDE_DIR}")
set(RENDERLIB_ENGINE_RPATH "${RENDERLIB_ENGINE_LIBRARY_DIR}")
