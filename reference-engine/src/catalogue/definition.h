// Effect definitions: what the files in src/effects/ write, and what every new
// instance builds its own descriptors and parameters from.
#pragma once

#include <initializer_list>
#include <map>
#include <string>
#include <vector>

#include "catalogue/data_files.h"
#include "catalogue/param_store.h"
#include "tarsel/param.h"

namespace tarsel_ref {

// How an effect is computed (rendering/kernels/kernel.h). A kernel fills the
// working image it is given and returns kWrote, or returns the number of the
// input that is the result unchanged.
struct KernelContext;
class WorkImage;
using Kernel = int (*)(const KernelContext &ctx, WorkImage &out);
// For an effect that reads its previous output: how many earlier frames that
// output is rebuilt from when a render is given none (0: it is not rebuilt).
using History = int (*)(const KernelContext &ctx);

// Genotype::input_default_to: what an unconnected input falls back to.
enum InputFallback : short {
  kFallbackTransparent = 0,  // transparent black
  kFallbackConstant = 1,     // every channel at the input's input_default_value
  kFallbackFirstInput = 2,   // the effect's first input
};

// Genotype::rgba_mode: how the effect treats colour and alpha.
enum RgbaMode : int {
  kRgbaColourOnly = 0,  // works on colour; alpha is taken from alpha_z_source_input
  kRgbaAll = 1,         // works on all four channels
  kRgbaOpaque = 2,      // makes an opaque result
};

// Genotype::gpu_disable_reason.
enum GpuDisableReason : int {
  kGpuNotBuilt = 1,  // the engine has no graphics-processor path
};

// Node flags, asked with tarsel_any_nodes_get_flag: what any of the nodes an
// effect is made of does.
enum NodeFlag : int {
  kNodeReadsOtherFrames = 0x1,
  kNodeReadsPreviousOutput = 0x2,
  kNodeDrawsFlare = 0x4,
  kNodeMixesInputs = 0x8,
  kNodeUsesHostData = 0x20000,
};

// One parameter as a definition writes it. Flags are written as words
// separated by commas, and become the parameter's flags_string:
//   hidden                 not shown
//   group_start            opens the group named by `group` at this parameter
//   open                   that group is shown expanded
//   group_end              one group closes after this parameter (repeatable)
//   doc_group              documents the group named by `group`, opens none
//   no_publish             not published to the host
//   builder_disable        the effect builder disables it
//   builder_disable_one    the effect builder disables it for one instance
//   fromfile               popup whose states come from a data file
//   glare                  a flare parameter that describes a glare
//   disabled               not enabled (wenable_p clear)
struct ParamDefinition {
  std::string name;
  std::string canonical;
  param_type type = ptype_float;
  int channels = 1;
  float def[MAX_CHANNELS] = {};
  float old_def[MAX_CHANNELS] = {};
  short old_limit = 0;  // 0: no old default
  float min = kNoLowerBound, max = kNoUpperBound;
  float step = 0.01f, norm = 1.0f;
  float slider_lo = 0.0f, slider_hi = 1.0f, big_lo = 0.0f, big_hi = 100.0f;
  int mode = screen_mode_normal;
  int anim = auto_anim_none;
  int trans = autotrans_none;
  short needs_input = 0;  // 1-based number of the input needed, 0 for none
  int format = -1;        // a const_format_tag, -1 for the type's own
  std::string flags;
  std::string group;
  std::vector<std::string> states;
  FromFileListId list = kNoList;
  std::string text;                 // default of string and flare parameters
  std::vector<std::string> resets;  // canonical names a push button restores

  ParamDefinition &bounds(float lo, float hi);  // the sliders span the bounds too
  ParamDefinition &sliders(float lo, float hi);
  ParamDefinition &big_sliders(float lo, float hi);
  ParamDefinition &with_flags(const std::string &words);
  ParamDefinition &in_group(const std::string &group_name, const std::string &words);
  ParamDefinition &old_default(std::initializer_list<float> values, short version_limit);
  ParamDefinition &shown_as(const_format_tag tag, float normalize = 1.0f);
  ParamDefinition &animated(auto_anim_type type);
  ParamDefinition &transition(autotrans_type type);
  ParamDefinition &needs(short input_number);
  ParamDefinition &stepping(float by);
};

ParamDefinition float_param(const std::string &name, const std::string &canonical, float def);
ParamDefinition int_param(const std::string &name, const std::string &canonical, int def, int lo, int hi);
ParamDefinition color_param(const std::string &name, const std::string &canonical, std::initializer_list<float> def);
// Two channels placed in image space by `mode`.
ParamDefinition pair_param(const std::string &name, const std::string &canonical, screen_mode mode, float x, float y);
ParamDefinition popup_param(const std::string &name, const std::string &canonical, std::vector<std::string> states,
                            int def = 0);
ParamDefinition fromfile_popup(const std::string &name, const std::string &canonical, FromFileListId list);
ParamDefinition bool_param(const std::string &name, const std::string &canonical, bool def);
ParamDefinition button_param(const std::string &name, const std::string &canonical, std::vector<std::string> resets);
ParamDefinition string_param(const std::string &name, const std::string &canonical, const std::string &def);
ParamDefinition label_param(const std::string &name, const std::string &canonical);
ParamDefinition flare_param(const std::string &name, const std::string &canonical, const std::string &def, bool glare);

struct InputDefinition {
  std::string name;       // at most 11 bytes
  std::string canonical;  // at most 11 bytes
  bool optional = false;
  short fallback = kFallbackTransparent;
  float fallback_value = 0.0f;
};

// One effect descriptor.
struct DescriptorDefinition {
  std::string name;        // at most 31 bytes
  std::string popup_name;  // the name menus list it under
  std::vector<InputDefinition> inputs;
  std::vector<ParamDefinition> params;
  std::map<std::string, std::vector<float>> hardcoded;  // arguments the definition fixes
  int rgba_mode = kRgbaAll;
  signed char rgba_ok_for_inputs = 1;
  int transform_with_warp = 0;
  signed char alpha_z_source_input = 0;  // -1: the effect has no input to take alpha from
  bool need_other_frames = false;
  bool use_prev_dest = false;
  bool mask_color = false;
  bool transition = false;
  bool use_reduce = false;
  short old_default_effect = -1;  // -1: none
  short old_default_limit = 0;
  int node_flags = 0;
  bool host_data = false;           // the effect takes engine data from the host (HostTextData)
  std::string flare_param;          // canonical name of the flare or glare parameter
  std::vector<std::string> stamps;  // flare element kinds the effect draws besides its flare's
  Kernel kernel = nullptr;          // null: the engine cannot render it
  History history = nullptr;        // null: the previous output is not rebuilt
};

// One catalogue entry. Builder entries with a run-time descriptor assemble it
// anew for every instance.
struct PluginDefinition {
  std::string name;
  std::string category;
  bool use_prev_dest = false;
  bool dynamic = false;
  std::vector<DescriptorDefinition> descriptors;
  std::vector<DescriptorDefinition> (*assemble)() = nullptr;

  std::vector<DescriptorDefinition> descriptors_now() const { return assemble ? assemble() : descriptors; }
};

// Data a caption takes from the host: the face and size its text is set in.
struct HostTextData {
  char font_family[64] = "Sans";
  float font_size = 48.0f;
  int right_to_left = 0;
};

}  // namespace tarsel_ref
