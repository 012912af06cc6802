// Lists and maps that cross between Python and the engine. Vectors returned by
// value elsewhere arrive as tuples; these classes are the full views.

%{
#include "tarsel/genotype.h"
#include "tarsel/param.h"
%}

class Genotype;
class Param;

// SWIG converts a Python sequence (a list, a dict's items) into a new
// container element by element, and drops that container when a later
// element fails to convert. These specialisations of its conversion do the
// same and free it, for the vectors and the map below.
%fragment("ContainerConversionFreesOnFailure", "header", fragment="StdSequenceTraits") %{
#include <memory>
namespace swig {
template <class Seq, class T>
struct container_from_sequence {
  static int asptr(PyObject *obj, Seq **seq) {
    if (obj == Py_None || SWIG_Python_GetSwigThis(obj)) {
      Seq *p;
      swig_type_info *descriptor = swig::type_info<Seq>();
      if (descriptor && SWIG_IsOK(::SWIG_ConvertPtr(obj, (void **)&p, descriptor, 0))) {
        if (seq)
          *seq = p;
        return SWIG_OLDOBJ;
      }
    } else if (PySequence_Check(obj)) {
      try {
        SwigPySequence_Cont<T> items(obj);
        if (!seq)
          return items.check() ? SWIG_OK : SWIG_ERROR;
        std::unique_ptr<Seq> made(new Seq());
        assign(items, made.get());
        *seq = made.release();
        return SWIG_NEWOBJ;
      } catch (std::exception &e) {
        if (seq && !PyErr_Occurred())
          PyErr_SetString(PyExc_TypeError, e.what());
        return SWIG_ERROR;
      }
    }
    return SWIG_ERROR;
  }
};

template <class T, class A>
struct traits_asptr_stdseq<std::vector<T, A>, T> : container_from_sequence<std::vector<T, A>, T> {};

template <class K, class T, class C, class A>
struct traits_asptr_stdseq<std::map<K, T, C, A>, std::pair<K, T> >
    : container_from_sequence<std::map<K, T, C, A>, std::pair<K, T> > {};
}
%}
%fragment("ContainerConversionFreesOnFailure");

%vector_element_access(bool)
%vector_element_access(std::string)
%vector_element_access(float)
%vector_element_access(Genotype *)
%vector_element_access(Param *)

// std::vector<bool>::size_type size
// The standard library's bit vector skips its length check when made with a
// count, and a count near the largest size wraps round to a vector with no
// storage behind it; refused as the other vectors refuse it.
%typemap(check, noblock=1) std::vector<bool>::size_type size {
  if ($1 > std::vector<bool>().max_size())
    SWIG_exception_fail(SWIG_MemoryError, "cannot create std::vector larger than max_size()");
}

%template(bool_vector) std::vector<bool>;
%template(string_vector) std::vector<std::string>;
%template(float_vector) std::vector<float>;
%template(genotype_vector) std::vector<Genotype *>;
%template(param_vector) std::vector<Param *>;
%map_key_and_value_positions(value_map_type, std::map<std::string, std::vector<float> >)
%template(value_map) std::map<std::string, std::vector<float> >;
