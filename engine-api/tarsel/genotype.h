// The engine's fixed description of one effect.
#pragma once

#include <cstddef>

#include "tarsel/export.h"
#include "tarsel/limits.h"
#include "tarsel/param.h"
#include "tarsel/wrapped_array.h"

// An effect's definition as the engine parsed it (see effect_globals.h).
struct effect_def;

// One entry of an effect's parameter-group table, 32 bytes.
struct ParamGroupInfo {
  const char *name;              // the group's name, engine-owned
  unsigned char reserved_8[24];  // engine bytes 8-31
};

// One instance parameter slot of a plug-in's first effect descriptor, 144 bytes.
struct InstanceParamSlot {
  unsigned char reserved_0[120];   // engine bytes 0-119
  Param *param;                    // offset 120: the slot's parameter, may be null
  unsigned char reserved_128[16];  // engine bytes 128-143
};

// Behaviour bits of an effect descriptor: the 8 bytes at offset 1240 of a
// Genotype. Bit positions count from the least significant bit of each
// little-endian 32-bit word; the reserved fields are the engine's own bits.
struct GenotypeFlags {
  // Word at descriptor byte 1240.
  unsigned int reserved0_b0 : 1;         // engine bit 0
  unsigned int need_other_frames_p : 1;  // bit 1 (byte 1240 bit 1): reads frames other than the current one
  unsigned int use_prev_dest_p : 1;      // bit 2 (byte 1240 bit 2): reads its own previous output
  unsigned int reserved0_b3 : 11;        // engine bits 3-13
  unsigned int mask_color_p : 1;         // bit 14 (byte 1241 bit 6): colour masking
  unsigned int reserved0_b15 : 11;       // engine bits 15-25
  unsigned int transition_p : 1;         // bit 26 (byte 1243 bit 2): transition between two inputs
  unsigned int reserved0_b27 : 5;        // engine bits 27-31

  // Word at descriptor byte 1244.
  unsigned int use_reduce_p : 1;   // bit 0 (byte 1244 bit 0): reduce step in use
  unsigned int reserved4_b1 : 31;  // engine bits 1-31
};

// One effect: name, inputs, parameters, parameter groups, graphics-processor
// settings, alpha and colour handling, and the defaults older projects used.
// 1336 bytes laid out by the engine, which owns the record and everything it
// points to.
struct Genotype {
  char name[MAX_EFFECT_NAME_LEN];                              // offset 0: effect name, NUL-terminated when shorter
  char input_names[MAX_INPUTS][MAX_INPUT_NAME_LEN];            // offset 32: display name of each input
  char canonical_input_names[MAX_INPUTS][MAX_INPUT_NAME_LEN];  // offset 128: stable name of each input
  ShortInputArray input_optional_p;                     // offset 224: non-zero where the input may be unconnected
  ShortInputArray input_default_to;                     // offset 240: what an unconnected input falls back to
  float input_default_value[MAX_INPUT_DEFAULT_VALUES];  // offset 256: constant values used by the fallbacks
  int n_params;                                         // offset 336: entries of the parameter table
  unsigned char reserved_340[4];                        // engine bytes 340-343
  Param **params;                                       // offset 344: the parameters, in order
  unsigned char reserved_352[8];                        // engine bytes 352-359
  Param *flare_param;                                   // offset 360: parameter carrying a lens flare, may be null
  unsigned char reserved_368[8];                        // engine bytes 368-375
  void *host_data;                                      // offset 376: engine data taken from the host, may be null
  unsigned char reserved_384[8];                        // engine bytes 384-391
  int disable_gpu;                                      // offset 392: non-zero forbids graphics-processor work
  int force_gpu_enable;                                 // offset 396: non-zero forces graphics-processor work on
  int force_gpu_disable;                                // offset 400: non-zero forces graphics-processor work off
  int gpu_disable_reason;                               // offset 404: why the graphics processor is not used
  unsigned char reserved_408[16];                       // engine bytes 408-423
  ParamGroupInfo param_groups[MAX_PARAM_GROUPS];        // offset 424: groups, indexed by Param::param_group
  int rgba_mode;                                        // offset 1224: handling of colour and alpha
  signed char rgba_ok_for_inputs;                       // offset 1228: non-zero when inputs may carry alpha
  unsigned char reserved_1229[3];                       // engine bytes 1229-1231
  int transform_with_warp;                              // offset 1232: transforming together with a warp
  signed char alpha_z_source_input;                     // offset 1236: input supplying alpha (and depth)
  unsigned char reserved_1237[3];                       // engine bytes 1237-1239
  GenotypeFlags flags;                                  // offset 1240: behaviour bits
  signed char n_inputs;                                 // offset 1248: input slots in use
  unsigned char reserved_1249[31];                      // engine bytes 1249-1279
  int n_instance_param_slots;               // offset 1280: instance parameter slots (first descriptor of a plug-in)
  unsigned char reserved_1284[4];           // engine bytes 1284-1287
  InstanceParamSlot *instance_param_slots;  // offset 1288: n_instance_param_slots slot records
  unsigned char reserved_1296[8];           // engine bytes 1296-1303
  char *effect_popup_name;                  // offset 1304: name listed in menus
  short old_default_effect;                 // offset 1312: effect whose defaults older projects used
  short old_default_version_limit;          // offset 1314: version below which those defaults apply
  unsigned char reserved_1316[12];          // engine bytes 1316-1327
  effect_def *effect_info;                  // offset 1328: the effect's definition
};

static_assert(sizeof(ParamGroupInfo) == 32, "ParamGroupInfo is 32 bytes");
static_assert(sizeof(InstanceParamSlot) == 144, "InstanceParamSlot is 144 bytes");
static_assert(offsetof(InstanceParamSlot, param) == 120, "InstanceParamSlot::param at 120");
static_assert(sizeof(GenotypeFlags) == 8, "GenotypeFlags is 8 bytes");
static_assert(alignof(GenotypeFlags) == 4, "GenotypeFlags is 4-byte aligned");

static_assert(sizeof(Genotype) == 1336, "Genotype is 1336 bytes");
static_assert(alignof(Genotype) == 8, "Genotype is 8-byte aligned");
static_assert(offsetof(Genotype, name) == 0, "Genotype::name at 0");
static_assert(offsetof(Genotype, input_names) == 32, "Genotype::input_names at 32");
static_assert(offsetof(Genotype, canonical_input_names) == 128, "Genotype::canonical_input_names at 128");
static_assert(offsetof(Genotype, input_optional_p) == 224, "Genotype::input_optional_p at 224");
static_assert(offsetof(Genotype, input_default_to) == 240, "Genotype::input_default_to at 240");
static_assert(offsetof(Genotype, input_default_value) == 256, "Genotype::input_default_value at 256");
static_assert(offsetof(Genotype, n_params) == 336, "Genotype::n_params at 336");
static_assert(offsetof(Genotype, params) == 344, "Genotype::params at 344");
static_assert(offsetof(Genotype, flare_param) == 360, "Genotype::flare_param at 360");
static_assert(offsetof(Genotype, host_data) == 376, "Genotype::host_data at 376");
static_assert(offsetof(Genotype, disable_gpu) == 392, "Genotype::disable_gpu at 392");
static_assert(offsetof(Genotype, force_gpu_enable) == 396, "Genotype::force_gpu_enable at 396");
static_assert(offsetof(Genotype, force_gpu_disable) == 400, "Genotype::force_gpu_disable at 400");
static_assert(offsetof(Genotype, gpu_disable_reason) == 404, "Genotype::gpu_disable_reason at 404");
static_assert(offsetof(Genotype, param_groups) == 424, "Genotype::param_groups at 424");
static_assert(offsetof(Genotype, rgba_mode) == 1224, "Genotype::rgba_mode at 1224");
static_assert(offsetof(Genotype, rgba_ok_for_inputs) == 1228, "Genotype::rgba_ok_for_inputs at 1228");
static_assert(offsetof(Genotype, transform_with_warp) == 1232, "Genotype::transform_with_warp at 1232");
static_assert(offsetof(Genotype, alpha_z_source_input) == 1236, "Genotype::alpha_z_source_input at 1236");
static_assert(offsetof(Genotype, flags) == 1240, "Genotype::flags at 1240");
static_assert(offsetof(Genotype, n_inputs) == 1248, "Genotype::n_inputs at 1248");
static_assert(offsetof(Genotype, n_instance_param_slots) == 1280, "Genotype::n_instance_param_slots at 1280");
static_assert(offsetof(Genotype, instance_param_slots) == 1288, "Genotype::instance_param_slots at 1288");
static_assert(offsetof(Genotype, effect_popup_name) == 1304, "Genotype::effect_popup_name at 1304");
static_assert(offsetof(Genotype, old_default_effect) == 1312, "Genotype::old_default_effect at 1312");
static_assert(offsetof(Genotype, old_default_version_limit) == 1314, "Genotype::old_default_version_limit at 1314");
static_assert(offsetof(Genotype, effect_info) == 1328, "Genotype::effect_info at 1328");
