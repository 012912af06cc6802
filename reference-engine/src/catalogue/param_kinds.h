// The engine's parameter kinds, one per type. Each fixes its type when built
// and copies as its own kind; kinds with more than a number for a value keep
// what they need after the common 240 bytes.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "tarsel/param.h"

namespace tarsel_ref {

class FloatParam : public Param {
public:
  explicit FloatParam(int channels = 1);
protected:
  Param *clone_impl() override;
};

class IntParam : public Param {
public:
  IntParam();
protected:
  Param *clone_impl() override;
};

// Three channels (red, green, blue) or four (with alpha).
class ColorParam : public Param {
public:
  explicit ColorParam(int channels);
protected:
  Param *clone_impl() override;
};

class BooleanParam : public Param {
public:
  BooleanParam();
protected:
  Param *clone_impl() override;
};

// A popup: the chosen state's index is the value; the state names are owned
// (C heap) and the bounds span the states.
class ChoiceParam : public PopupParam {
public:
  explicit ChoiceParam(const std::vector<std::string> &states = {});
  ~ChoiceParam() override;
  ChoiceParam(const ChoiceParam &) = delete;
  ChoiceParam &operator=(const ChoiceParam &) = delete;
  void set_states(const std::vector<std::string> &states);
protected:
  Param *clone_impl() override;
};

// A button: pressing it (setting its one channel to non-zero) runs its action.
class PushButtonParam : public Param {
public:
  PushButtonParam();
  std::function<void()> on_press;
  int set_values(RenderContext *ctx, int first_channel, int n, float *values, unsigned int flags) override;
protected:
  Param *clone_impl() override;  // the copy has no action: it belongs to no effect
};

class StringParam : public Param {
public:
  explicit StringParam(std::string default_text = "");
  bool set_to_default(RenderContext *ctx, unsigned int flags) override;
  std::string default_text;
protected:
  Param *clone_impl() override;
};

class LabelParam : public Param {
public:
  LabelParam();
protected:
  Param *clone_impl() override;
};

// A lens flare or, with the glare flag, a glare: its value is a description
// of elements (flare.h), its default one such description.
class FlareParam : public Param {
public:
  explicit FlareParam(std::string default_text = "");
  bool set_to_default(RenderContext *ctx, unsigned int flags) override;
  std::string default_text;
protected:
  Param *clone_impl() override;
};

}  // namespace tarsel_ref
