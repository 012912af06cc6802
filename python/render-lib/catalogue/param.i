// Param: the engine's descriptor of one effect parameter, read and written in
// place. A Param made from Python is owned by its proxy; one obtained from an
// effect descriptor belongs to the engine and lives as long as that descriptor.

%{
#include <map>
#include <string>
#include <vector>
#ifdef _WIN32
#include <windows.h>
#else
#include <dlfcn.h>
#endif
#include "tarsel/effect.h"
#include "tarsel/param.h"
#include "tarsel/param_queries.h"

// The engine's own cJSON_Delete, so that a tree goes back to the allocator it
// came from: an export of the engine library or, on POSIX, of a library it
// depends on. Null when there is none.
typedef void (*DeleteJson)(cJSON *);
static DeleteJson engine_delete_json()
{
#ifdef _WIN32
  HMODULE engine = GetModuleHandleA("tarsel_ps.dll");
  return engine ? reinterpret_cast<DeleteJson>(GetProcAddress(engine, "cJSON_Delete")) : NULL;
#else
  Dl_info where;
  if (!dladdr(reinterpret_cast<void *>(&init_tarsel_effect), &where) || !where.dli_fname)
    return NULL;
  void *engine = dlopen(where.dli_fname, RTLD_LAZY | RTLD_NOLOAD);
  if (!engine)
    return NULL;
  DeleteJson found = reinterpret_cast<DeleteJson>(dlsym(engine, "cJSON_Delete"));
  dlclose(engine);
  return found;
#endif
}

// A to_json tree belongs to its Param until that Param's next to_json, as a
// to_string text does: the module keeps each Param's latest tree and frees
// the one before. Without an engine cJSON_Delete the trees are left alone.
static cJSON *keep_latest_json(Param *param, cJSON *tree)
{
  static const DeleteJson delete_json = engine_delete_json();
  static auto *latest = new std::map<Param *, cJSON *>;  // never destroyed: its trees live to the end
  cJSON *&kept = (*latest)[param];
  if (kept && kept != tree && delete_json)
    delete_json(kept);
  kept = tree;
  return tree;
}

// A parameter is a point when it shows two channels in one of the screen
// modes that place it in the image; screen_mode_screen_center0 deliberately
// does not.
static bool param_is_point(const Param *param)
{
  switch (packed_field(param, 158, 1, 4)) {
    case screen_mode_screen:
    case screen_mode_screen_center:
    case screen_mode_normalize:
    case screen_mode_screen_to_norm:
    case screen_mode_screen_center_to_norm: return param->n_channels_c1 == 2;
    default: return false;
  }
}

// A Python list of str from engine texts (a null text becomes None).
static PyObject *text_list(const std::vector<const char *> &texts)
{
  PyOwned list(PyList_New((Py_ssize_t)texts.size()));
  if (!list.get())
    return NULL;
  for (size_t i = 0; i < texts.size(); ++i) {
    PyObject *item = engine_text(texts[i]);
    if (!item)
      return NULL;
    PyList_SET_ITEM(list.get(), (Py_ssize_t)i, item);
  }
  return list.release();
}

static PyObject *text_list(const std::vector<std::string> &texts)
{
  std::vector<const char *> pointers;
  for (const std::string &text : texts)
    pointers.push_back(text.c_str());
  return text_list(pointers);
}

// The engine's "no limit" bound becomes None.
static PyObject *bound_or_none(float bound, float no_limit)
{
  if (bound == no_limit)
    Py_RETURN_NONE;
  return PyFloat_FromDouble(bound);
}
%}

// The engine's display-format codes; only their values cross to Python.
enum const_format_tag {};

%apply char *EngineHeapText { char *name };

// The tree handed out is the one the Param now keeps (arg1 is the Param).
%typemap(out) cJSON *to_json "$result = SWIG_NewPointerObj(keep_latest_json(arg1, $1), $1_descriptor, 0);"

class Param {
public:
  enum param_type ptype;
  char *name;
%immutable;
  char *canonical_name;
%mutable;
  unsigned char n_channels;
%immutable;
  unsigned char n_channels_c1;
  ValueArray default_value;
  ValueArray old_default_value;
  short use_old_default_p;
  short old_default_version_limit;
  float min_bound;
  float max_bound;
  float step;
  float normalize_scale;
  ParamFlags flags;
  float slider_min;
  float slider_max;
  float big_slider_min;
  float big_slider_max;
  signed char param_group;
  char *flags_string;
%mutable;

  bool numeric_p();
  const_format_tag format();
  bool needs_old_default(float version);
  bool maybe_set_to_old_default(RenderContext *ctx, float version, unsigned int flags = 0);
  char *to_string(RenderContext *ctx, bool flag = false);
  const char *to_string_const(RenderContext *ctx, bool flag = false);
  cJSON *to_json(RenderContext *ctx, bool flag = false);
  const char *ptype_name() const;
  const char *get_canonical_name() const;
};
%clear char *name;

%extend Param {
  // The engine's default constructor runs first; the name is copied with the
  // engine's own string function so that the engine can free it.
  Param(char const *name, enum param_type ptype, int n_channels = 1, screen_mode mode = screen_mode_normal) {
    Param *param = new Param();
    param->ptype = ptype;
    param->n_channels = (unsigned char)n_channels;
    param->name = tarsel_malloc_copy_string_func(name);
    set_packed_field(&param->flags, 2, 1, 4, (unsigned int)mode);
    return param;
  }

  // One title per channel the parameter shows: one for a point.
  PyObject *get_titles() {
    const int count = param_is_point($self) ? 1 : $self->n_channels_c1;
    std::vector<std::string> titles;
    for (int i = 0; i < count; ++i) {
      char buffer[256] = "";
      const char *title = tarsel_get_param_title($self, i, buffer, sizeof buffer);
      titles.push_back(title ? title : "");
    }
    return text_list(titles);
  }

  // (lower, upper, slider start, slider end); a bound of the engine's "no
  // limit" value (-1000000 or 1000000) is None.
  PyObject *get_limits() {
    float lower = 0, upper = 0, third = 0, fourth = 0;
    tarsel_get_param_bounds2($self, 1.0f, 0, &lower, &upper, &third, &fourth, 0);
    return Py_BuildValue("(NNdd)", bound_or_none(lower, -1000000.0f), bound_or_none(upper, 1000000.0f),
                         (double)third, (double)fourth);
  }

  // The states of a popup parameter, in order; empty for other types.
  PyObject *get_state_names() {
    std::vector<const char *> names;
    if ($self->ptype == ptype_popup) {
      const PopupParam *popup = static_cast<const PopupParam *>($self);
      for (int i = 0; i < popup->n_states; ++i)
        names.push_back(popup->state_names[i]);
    }
    return text_list(names);
  }

  // The entries of a popup whose names come from a file; the engine keeps them.
  PyObject *get_fromfile_popup_names() {
    char **names = NULL;
    const int count = tarsel_get_fromfile_popup_names($self, &names);
    std::vector<const char *> texts;
    for (int i = 0; i < count && names; ++i)
      texts.push_back(names[i]);
    return text_list(texts);
  }

  bool is_point() { return param_is_point($self); }
}

%record_identity(Param)
%record_repr(Param, "Param(\"%s\" (%d ch) @%p)", printable($self->name), (int)$self->n_channels, (void *)$self)
