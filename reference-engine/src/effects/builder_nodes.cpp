#include "effects/builder_nodes.h"

namespace tarsel_ref {

DescriptorDefinition assemble_nodes(const std::string &name, std::vector<InputDefinition> inputs,
                                    const std::vector<BuilderNode> &nodes) {
  DescriptorDefinition d;
  d.name = name;
  d.popup_name = name;
  d.inputs = std::move(inputs);
  for (const BuilderNode &node : nodes) {
    d.node_flags |= node.flags;
    for (std::size_t i = 0; i < node.params.size(); ++i) {
      ParamDefinition param = node.params[i];
      param.canonical = node.prefix + "_" + param.canonical;
      if (i == 0) param.in_group(node.title, "group_start,open");
      if (i + 1 == node.params.size()) param.with_flags("group_end");
      d.params.push_back(std::move(param));
    }
  }
  return d;
}

}  // namespace tarsel_ref
