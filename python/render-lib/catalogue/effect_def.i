// effect_def: an effect's definition as the engine parsed it. Every proxy is
// a view of the engine's record; reading a member copies it.

%{
#include "tarsel/effect_globals.h"
%}

%nodefaultctor effect_def;
%nodefaultdtor effect_def;
%naturalvar effect_def::input_names;
%naturalvar effect_def::input_optional_p;
%naturalvar effect_def::arg_names;
struct effect_def {
%immutable;
  std::string name;
  std::vector<std::string> input_names;
  std::vector<bool> input_optional_p;
  std::vector<std::string> arg_names;
%mutable;
};

%extend effect_def {
  // {argument name: value}: one number reads as a float, any other count as
  // a tuple of floats (no numbers as ()).
  PyObject *get_arg_hardcoded_values() {
    PyOwned values(PyDict_New());
    if (!values.get())
      return NULL;
    for (const auto &entry : $self->arg_hardcoded_values) {
      const std::vector<float> &numbers = entry.second;
      PyOwned value(numbers.size() == 1 ? PyFloat_FromDouble(numbers[0]) : PyTuple_New((Py_ssize_t)numbers.size()));
      if (!value.get())
        return NULL;
      for (size_t i = 0; numbers.size() != 1 && i < numbers.size(); ++i) {
        PyObject *number = PyFloat_FromDouble(numbers[i]);
        if (!number)
          return NULL;
        PyTuple_SET_ITEM(value.get(), (Py_ssize_t)i, number);
      }
      PyOwned key(engine_text(entry.first.data(), entry.first.size()));
      if (!key.get() || PyDict_SetItem(values.get(), key.get(), value.get()) < 0)
        return NULL;
    }
    return values.release();
  }
}
