// Effect instances: creation, queries, freeing, and the engine-wide controls
// that go with them. Creation, freeing and the instance queries can take long
// and run without the interpreter lock.

%{
#include "tarsel/effect.h"
%}

%threadallow init_tarsel_effect;
%threadallow init_tarsel_effect_from_string;
%threadallow tarsel_effect_is_time_varying;
%threadallow tarsel_get_gpu_status;

%newobject init_tarsel_effect;
%newobject init_tarsel_effect_from_string;
EffectGlobals_t *init_tarsel_effect(char const *name, bool builder);
EffectGlobals_t *init_tarsel_effect_from_string(char const *saved);

void set_tarsel_luts(char const *input_lut, char const *display_lut, float exposure);
int tarsel_effect_is_time_varying(EffectGlobals_t *effect, char const *name, int flags);
const char *tarsel_get_gpu_status(EffectGlobals_t *effect);

// The proxy stops owning the instance before the engine frees it, so dropping
// the proxy later frees nothing twice. An instance another call is using is
// freed when that call returns (instance_uses.i); the engine call runs
// without the interpreter lock.
%typemap(in, noblock=1) EffectGlobals_t *instance (void *argp = 0, int res = 0, SwigPyObject *proxy = 0) {
  res = SWIG_ConvertPtr($input, &argp, $descriptor, SWIG_POINTER_DISOWN | %convertptr_flags);
  if (!SWIG_IsOK(res)) {
    %argument_fail(res, "$type", $symname, $argnum);
  }
  $1 = %reinterpret_cast(argp, $ltype);
  proxy = $input == Py_None ? NULL : SWIG_Python_GetSwigThis($input);
}
%feature("action") free_tarsel_effect "use1.free_instance();"
void free_tarsel_effect(EffectGlobals_t *instance);
%clear EffectGlobals_t *instance;

// An abort request ends the render in progress (and any render started before
// the request is cleared) with RuntimeError "Tarsel Abort". Both keep the
// interpreter lock, which is free while another thread renders.
void tarsel_abort_render();
void tarsel_clear_abort();

void tarsel_free_all_stamp_collections();
void tarsel_shutdown_apps();
