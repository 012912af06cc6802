// EffectGlobals_t, an effect instance: the plug-in's name, its table of effect
// descriptors and the one in use. Made by init_tarsel_effect and freed by
// free_tarsel_effect or when its owning proxy dies; every view taken from it
// dangles after that.

%{
#include "tarsel/effect.h"
#include "tarsel/effect_globals.h"

// The collector handed to the engine by EffectGlobals_t._get_shared_params:
// appends (Param view, Genotype view) for entry `index` of the descriptor's
// parameter table to the Python list at `list`; returns 0 to go on. An index
// outside the table appends (None, descriptor).
static int add_param_to_list(Genotype *genotype, int index, void *list)
{
  Param *param = (genotype && index >= 0 && index < genotype->n_params) ? genotype->params[index] : NULL;
  PyOwned pair(Py_BuildValue("(NN)", SWIG_NewPointerObj(param, SWIGTYPE_p_Param, 0),
                             SWIG_NewPointerObj(genotype, SWIGTYPE_p_Genotype, 0)));
  if (pair.get())
    PyList_Append(static_cast<PyObject *>(list), pair.get());
  return 0;
}
%}

%nodefaultctor EffectGlobals_t;
struct EffectGlobals_t {
%immutable;
  char *plugin_name;
  short n_effects;
  Genotype *effect_genotype;
%mutable;
};

// Frees at once, or when the last call using the instance returns (see
// instance_uses.i: use1 is the call's use of its argument).
%feature("action") EffectGlobals_t::~EffectGlobals_t "use1.free_instance();"
%extend EffectGlobals_t {
  ~EffectGlobals_t();

  std::vector<Genotype *> _get_genotypes() {
    std::vector<Genotype *> genotypes;
    for (int i = 0; i < $self->n_effects && i < MAX_EFFECTS_PER_PLUGIN; ++i)
      genotypes.push_back($self->genotypes[i]);
    return genotypes;
  }

  // The parameters the engine generates for the instance, then the enabled
  // instance parameter slots of its first descriptor, as (Param, Genotype).
  PyObject *_get_shared_params() {
    PyOwned list(PyList_New(0));
    if (!list.get())
      return NULL;
    generate_all_tarsel_effect_params($self, add_param_to_list, list.get());
    if (PyErr_Occurred())
      return NULL;
    Genotype *first = $self->n_effects > 0 ? $self->genotypes[0] : NULL;
    for (int i = 0; first && i < first->n_instance_param_slots; ++i) {
      Param *param = first->instance_param_slots[i].param;
      if (!param || !packed_field(&param->flags, 0, 6, 1))
        continue;
      PyOwned pair(Py_BuildValue("(NN)", SWIG_NewPointerObj(param, SWIGTYPE_p_Param, 0),
                                 SWIG_NewPointerObj(first, SWIGTYPE_p_Genotype, 0)));
      if (!pair.get() || PyList_Append(list.get(), pair.get()) < 0)
        return NULL;
    }
    return list.release();
  }

  %pythoncode %{
    genotypes = property(_get_genotypes, doc="The plug-in's effect descriptors (views).")
    shared_params = property(_get_shared_params, doc="(Param, Genotype) pairs the instance shares.")
  %}
}

%record_identity(EffectGlobals_t)
// A freed instance has no name left to print.
%extend EffectGlobals_t {
  const char *__repr__() const {
    static char text[512];
    EffectGlobals_t *instance = const_cast<EffectGlobals_t *>($self);
    if (instance_records().live(instance, NULL))
      std::snprintf(text, sizeof text, "Globals(\"%s\" @%p)", printable(instance->plugin_name), (void *)instance);
    else
      std::snprintf(text, sizeof text, "Globals(freed @%p)", (void *)instance);
    return text;
  }
}
