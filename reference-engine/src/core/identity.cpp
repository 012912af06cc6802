#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <optional>
#include <string>

#include "build_id.h"
#include "core/entry.h"
#include "core/identity.h"
#include "reference_engine.h"
#include "tarsel/identity.h"

namespace tarsel_ref {
namespace {

std::mutex version_mutex;
std::optional<std::string> version_override;

}  // namespace

void set_version_text(std::optional<std::string> text) {
  std::lock_guard<std::mutex> lock(version_mutex);
  version_override = std::move(text);
}

}  // namespace tarsel_ref

void get_tarsel_version_info(char *buffer, int max_chars) {
  tarsel_ref::enter("get_tarsel_version_info", static_cast<const void *>(buffer), max_chars);
  if (!buffer || max_chars < 0) return;
  std::optional<std::string> override_text;
  {
    std::lock_guard<std::mutex> lock(tarsel_ref::version_mutex);
    override_text = tarsel_ref::version_override;
  }
  const std::string text =
      override_text.value_or("tarsel_ps reference engine " TARSEL_REFERENCE_VERSION " (build " RENDERLIB_BUILD_ID ")");
  const std::size_t n = std::min(text.size(), static_cast<std::size_t>(max_chars));
  std::memcpy(buffer, text.data(), n);
  buffer[n] = '\0';
}

const char *get_tarsel_build_id() {
  tarsel_ref::enter("get_tarsel_build_id");
  return RENDERLIB_BUILD_ID;
}

std::string Tarsel::get_ocio_path() {
  tarsel_ref::enter("Tarsel::get_ocio_path");
  const char *path = std::getenv("OCIO");
  return path ? path : "";
}
