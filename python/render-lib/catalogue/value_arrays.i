// Fixed arrays inside the engine's records: a parameter's values (one float
// per channel) and an effect's per-input settings (one short per input). A view
// obtained from a record writes through to it; one made from Python owns a
// zero-filled array.

%{
#include <stdexcept>
#include "tarsel/wrapped_array.h"
%}

template <typename T, size_t N>
struct wrapped_array {
  T data[N];
};

// No counting from the end: a negative index does not convert to size_t.
%catches(std::out_of_range) wrapped_array::__getitem__;
%catches(std::out_of_range) wrapped_array::__setitem__;
%extend wrapped_array {
  size_t __len__() const { return sizeof($self->data) / sizeof($self->data[0]); }

  T __getitem__(size_t i) const {
    if (i >= sizeof($self->data) / sizeof($self->data[0]))
      throw std::out_of_range("out of bounds access");
    return $self->data[i];
  }

  void __setitem__(size_t i, T value) {
    if (i >= sizeof($self->data) / sizeof($self->data[0]))
      throw std::out_of_range("out of bounds access");
    $self->data[i] = value;
  }
}

%template(ValueArray) wrapped_array<float, MAX_CHANNELS>;
%template(ShortInputArray) wrapped_array<short, MAX_INPUTS>;
typedef wrapped_array<float, MAX_CHANNELS> ValueArray;
typedef wrapped_array<short, MAX_INPUTS> ShortInputArray;
