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
// same and free it, for the vectors and the map below. A vector takes any
// sequence as a candidate when overloads are weighed, so that an element
// that does not convert is reported as itself ("... in sequence element N ")
// instead of as a call no overload takes.
%fragment("ContainerConversionFreesOnFailure", "header", fragment="StdSequenceTraits") %{
#include <cstdio>
#include <memory>
namespace swig {
template <class Seq, class T, bool ElementsCheckedAsTheyConvert>
struct container_from_sequence {
  static int asptr(PyObject *obj, Seq **seq)
  {
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
          return ElementsCheckedAsTheyConvert || items.check() ? SWIG_OK : SWIG_ERROR;
        std::unique_ptr<Seq> made(new Seq());
        for (Py_ssize_t i = 0, size = items.size(); i < size; ++i) {
          SwigVar_PyObject item = PySequence_GetItem(obj, i);
          try {
            made->insert(made->end(), swig::as<T>(item));
          } catch (const std::invalid_argument &) {
            // The element's own message, then where it stands.
            if (!PyErr_Occurred())
              SWIG_Error(SWIG_TypeError, swig::type_name<T>());
            char where[48];
            std::snprintf(where, sizeof where, "in sequence element %d ", (int)i);
            SWIG_Python_AddErrorMsg(where);
            return SWIG_ERROR;
          }
        }
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
struct traits_asptr_stdseq<std::vector<T, A>, T> : container_from_sequence<std::vector<T, A>, T, true> {};

template <class K, class T, class C, class A>
struct traits_asptr_stdseq<std::map<K, T, C, A>, std::pair<K, T> >
    : container_from_sequence<std::map<K, T, C, A>, std::pair<K, T>, false> {};

// SWIG deletes nothing from a slice that starts at or past the end of a
// vector; here the delete starts at 0 there, as a read of that slice does.
// (A more specialised overload of SWIG's delslice, which its slice methods
// call.)
template <class T, class A, class Difference>
inline void delslice(std::vector<T, A> *self, Difference i, Difference j, Py_ssize_t step)
{
  if (step > 0 && i >= (Difference)self->size())
    i = 0;
  swig::delslice<std::vector<T, A>, Difference>(self, i, j, step);
}
}  // namespace swig
%}
%fragment("ContainerConversionFreesOnFailure");

// const std::vector<...> &other, &v, &x (%vector_sequence_input(VECTOR))
// A vector argument of the containers' own methods (a copy's source, a slice's
// new elements, a map's value), given as a proxy or any sequence: SWIG's
// typemap, but an element's own conversion error stands instead of the
// argument message.
%define %vector_sequence_input(VECTOR...)
%typemap(in, noblock=1) const VECTOR &other (int res = SWIG_OLDOBJ), const VECTOR &v (int res = SWIG_OLDOBJ),
                        const VECTOR &x (int res = SWIG_OLDOBJ) {
  {
    VECTOR *ptr = 0;
    res = swig::asptr($input, &ptr);
    if (!SWIG_IsOK(res)) {
      if (!PyErr_Occurred()) {
        %argument_fail(res, "$type", $symname, $argnum);
      }
      SWIG_fail;
    }
    if (!ptr) {
      %argument_nullref("$type", $symname, $argnum);
    }
    $1 = ptr;
  }
}
%typemap(freearg, noblock=1) const VECTOR &other, const VECTOR &v, const VECTOR &x {
  if (SWIG_IsNewObj(res$argnum)) delete $1;
}
%enddef
%vector_sequence_input(std::vector<bool>)
%vector_sequence_input(std::vector<std::string>)
%vector_sequence_input(std::vector<float>)
%vector_sequence_input(std::vector<Genotype *>)
%vector_sequence_input(std::vector<Param *>)

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
