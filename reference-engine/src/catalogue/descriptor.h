// One effect descriptor of an instance, with everything its Genotype points
// to: parameters, group names, definition, menu name, host data and, for the
// first descriptor of a plug-in, the instance parameter slots.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "catalogue/definition.h"
#include "tarsel/effect_globals.h"
#include "tarsel/genotype.h"

namespace tarsel_ref {

struct Descriptor {
  Genotype genotype{};
  std::vector<std::unique_ptr<Param>> owned;  // the parameter table's entries
  std::vector<Param *> table;
  std::vector<std::string> group_names;
  effect_def definition;
  std::string popup_name;
  std::unique_ptr<HostTextData> host_data;
  std::vector<InstanceParamSlot> slots;
  std::vector<std::unique_ptr<Param>> slot_params;
  Kernel kernel = nullptr;  // the definition's
  History history = nullptr;
};

// Builds a descriptor from its definition; throws std::logic_error when the
// definition is faulty (a programming error of the definition's author).
std::unique_ptr<Descriptor> build_descriptor(const DescriptorDefinition &source);

// Gives a plug-in's first descriptor the instance parameter slots every
// plug-in has:
//   slot 0  "Effect Mix"  how much of the effect's result replaces the first
//                         input (or, with no input, its opacity); enabled
//   slot 1  empty         kept for a mask parameter, which no effect uses yet
//   slot 2  "Motion Blur" present but not enabled: this engine renders no
//                         motion blur
void add_instance_slots(Descriptor &descriptor);

// Node flags of a descriptor (NodeFlag), kept in its engine bytes 1316-1319.
int node_flags(const Genotype &genotype);
void set_node_flags(Genotype &genotype, int flags);

// The parameter of a descriptor with this canonical name; null when none.
Param *find_param(const Genotype &genotype, const char *canonical);

}  // namespace tarsel_ref
