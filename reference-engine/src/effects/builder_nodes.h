// Effect-builder entries are chains of nodes. Their descriptors are put
// together when an instance is made: each node's parameters form a group
// named after the node, with canonical names prefixed by the node's, and the
// descriptor's node flags are those of all its nodes.
#pragma once

#include <string>
#include <vector>

#include "catalogue/definition.h"

namespace tarsel_ref {

struct BuilderNode {
  std::string title;   // the group's name
  std::string prefix;  // added with "_" before each canonical name
  int flags = 0;       // NodeFlag bits
  std::vector<ParamDefinition> params;
};

DescriptorDefinition assemble_nodes(const std::string &name, std::vector<InputDefinition> inputs,
                                    const std::vector<BuilderNode> &nodes);

}  // namespace tarsel_ref
