#include <cstdlib>
#include <mutex>
#include <optional>
#include <string>

#include "build_id.h"
#include "core/identity.h"
#include "reference_engine.h"

namespace tarsel_ref {
namespace {

std::mutex version_mutex;
std::optional<std::string> version_override;

}  // namespace

void set_version_text(std::optional<std::string> text) {
  std::lock_guard<std::mutex> lock(version_mutex);
  version_override = std::move(text);
}

std::string version_text() {
  std::lock_guard<std::mutex> lock(version_mutex);
  return version_override.value_or("tarsel_ps reference engine " TARSEL_REFERENCE_VERSION " (build " RENDERLIB_BUILD_ID
                                   ")");
}

const char *build_id() { return RENDERLIB_BUILD_ID; }

std::string ocio_config_path() {
  const char *path = std::getenv("OCIO");
  return path ? path : "";
}

}  // namespace tarsel_ref
