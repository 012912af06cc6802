// The engine's catalogues of effect plug-ins: counts, and one entry at a time
// as a Plugin_Info view of the engine's record. The module keeps no catalogue
// and checks no index: what the engine returns is wrapped as it comes.

%{
#include "tarsel/catalogue.h"
%}

%rename(Plugin_Info) plugin_info;

%immutable;
struct plugin_info {
  char *plugin_name;
  char *_category;
  unsigned char use_prev_dest_p;
  unsigned char dynamic_genotype_p;
};
%mutable;

int get_n_tarsel_effects();
plugin_info *get_tarsel_plugin_info_i(int i);
int get_n_tarsel_builder_effects();
plugin_info *get_tarsel_builder_info_i(int i);
