// Parameter values as a render reads them: the instance's values as they are,
// brought to the render's frame for parameters the engine animates itself,
// and the defaults of parameters whose input is not connected.
#pragma once

#include <map>
#include <string>
#include <vector>

#include "tarsel/genotype.h"

namespace tarsel_ref {

class ParamReader {
public:
  // `connected`: per input of the descriptor, whether it is connected.
  ParamReader(const Genotype &genotype, std::vector<bool> connected, int frame, double seconds);

  // Channel `channel` of the named parameter. Counters the engine animates
  // (auto_anim_floor0, auto_anim_floor1) add the frame number; ramps
  // (auto_anim_ramp_up) are the value per second times the render's time.
  // A name the descriptor has no parameter for reads the definition's fixed
  // argument of that name. Throws std::logic_error when there is neither.
  float number(const char *name, int channel = 0) const;
  int whole(const char *name, int channel = 0) const;
  bool flag(const char *name) const { return number(name) != 0.0f; }

  // Text of a string or flare parameter ("" when empty).
  std::string text(const char *name) const;

  // Whether the descriptor has a parameter or fixed argument of that name.
  bool has(const char *name) const;

  // A fixed argument of the definition; null when it has none of that name.
  const std::vector<float> *fixed(const char *name) const;

private:
  const Genotype &genotype_;
  std::vector<bool> connected_;
  int frame_;
  double seconds_;
};

}  // namespace tarsel_ref
