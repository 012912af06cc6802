// The engine's per-instance render state.
#pragma once

#include "tarsel/export.h"

// Render state of one effect instance: created, owned and interpreted by the
// engine; hosts hold it only as an opaque handle.
class TARSEL_API RenderContext {
public:
  // Releases the render state; defined in the engine.
  virtual ~RenderContext();

  // Render states are not copied.
  RenderContext(const RenderContext &) = delete;

  // Render states are not assigned.
  RenderContext &operator=(const RenderContext &) = delete;

protected:
  // Only the engine creates render states; defined in the engine.
  RenderContext();
};
