// The engine's two catalogues of effect plug-ins: the ordinary effects and the
// effect builder's, made from the effect definitions (effects/registry.h).
#pragma once

#include <vector>

#include "tarsel/catalogue.h"

namespace tarsel_ref {

struct Catalogues {
  std::vector<plugin_info> effects;
  std::vector<plugin_info> builder_effects;
};

// The catalogues, filled on first use; they live as long as the engine.
const Catalogues &catalogues();

}  // namespace tarsel_ref
