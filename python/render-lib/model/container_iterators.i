// Iterators of the std containers, as SWIG's library makes them, except that
// `iterator + n` and `iterator - n` free the copy they make when the step
// runs past either end (StopIteration) instead of dropping it.

%feature("action") swig::SwigPyIterator::operator+(ptrdiff_t n) const {
  std::unique_ptr<swig::SwigPyIterator> copy(arg1->copy());
  copy->advance(arg2);
  result = copy.release();
}
%feature("action") swig::SwigPyIterator::operator-(ptrdiff_t n) const {
  std::unique_ptr<swig::SwigPyIterator> copy(arg1->copy());
  copy->advance(-arg2);
  result = copy.release();
}

%{
#include <memory>
%}
