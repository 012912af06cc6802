// Conventions of the module's wrappers, and those shared by the descriptor
// classes.

// Proxy methods pass their arguments on as given, so that an omitted argument
// takes the default of the engine's declaration and every overload set
// reports its own prototypes.
%feature("python:cdefaultargs");

// Wrappers keep the interpreter lock unless an interface file lets a long
// engine call run without it (%threadallow).
%nothreadallow;

// %record_identity(TYPE): engine records compare by identity, not contents.
// Two proxies are equal exactly when they hold the same native address, and
// the hash is the low 32 bits of that address as a signed int. An operand that
// does not convert (another type, None, a null proxy) gives NotImplemented,
// so Python falls back to its own comparison instead of raising.
%define %record_identity(TYPE)
%pythonmaybecall TYPE::__eq__;
%pythonmaybecall TYPE::__ne__;
%extend TYPE {
  bool __eq__(const TYPE &other) const { return $self == &other; }
  bool __ne__(const TYPE &other) const { return $self != &other; }
  int __hash__() const { return static_cast<int>(static_cast<uint32_t>(reinterpret_cast<uintptr_t>($self))); }
}
%enddef

// %record_repr(TYPE, FORMAT, ARGS...): the printable form of a descriptor,
// formatted into a buffer that belongs to the class (one per class, shared by
// all its objects: the interpreter lock serialises the callers).
%define %record_repr(TYPE, FORMAT, ARGS...)
%extend TYPE {
  const char *__repr__() {
    static char text[512];
    std::snprintf(text, sizeof text, FORMAT, ARGS);
    return text;
  }
}
%enddef

%{
#include <cstdio>
#include <cstdint>
#include <cstring>
#include <new>
#include <stdexcept>
#include <string>

// A text for "%s" that is never null: a null engine text prints as "(null)".
static inline const char *printable(const char *text)
{
  return text ? text : "(null)";
}

// A refusal deep in the module's own code (an iterator, say): leaves the
// wrapper with this Python exception, which the guard raises.
struct RefusedCall {
  PyObject *type;
  std::string message;
};

// Holds one reference to a Python object and drops it on every path out of
// the scope, an engine abort included.
class PyOwned {
public:
  explicit PyOwned(PyObject *object) : object_(object) {}
  ~PyOwned() { Py_XDECREF(object_); }
  PyOwned(const PyOwned &) = delete;
  PyOwned &operator=(const PyOwned &) = delete;
  PyObject *get() const { return object_; }
  PyObject *release()
  {
    PyObject *object = object_;
    object_ = NULL;
    return object;
  }
private:
  PyObject *object_;
};

// A Python str from engine text, decoded the way every text result is
// (UTF-8, invalid bytes as surrogate escapes); None for null.
static PyObject *engine_text(const char *text, size_t size)
{
  if (!text)
    Py_RETURN_NONE;
  return PyUnicode_DecodeUTF8(text, (Py_ssize_t)size, "surrogateescape");
}
static PyObject *engine_text(const char *text)
{
  return engine_text(text, text ? std::strlen(text) : 0);
}

// Packed records are read and written by byte and bit position, so the module
// sees the engine's layout whatever this compiler does with bit-fields. A
// field is WIDTH bits from FIRST_BIT of the little-endian 32-bit word at BYTE.
static inline unsigned int packed_field(const void *record, size_t byte, unsigned int first_bit, unsigned int width)
{
  const unsigned char *p = static_cast<const unsigned char *>(record) + byte;
  uint32_t word = uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24;
  return (word >> first_bit) & ((1u << width) - 1);
}

static inline void set_packed_field(void *record, size_t byte, unsigned int first_bit, unsigned int width,
                                    unsigned int value)
{
  unsigned char *p = static_cast<unsigned char *>(record) + byte;
  uint32_t word = uint32_t(p[0]) | uint32_t(p[1]) << 8 | uint32_t(p[2]) << 16 | uint32_t(p[3]) << 24;
  const uint32_t mask = ((1u << width) - 1) << first_bit;
  word = (word & ~mask) | ((uint32_t(value) << first_bit) & mask);
  for (int i = 0; i < 4; ++i)
    p[i] = (unsigned char)(word >> (8 * i));
}
%}

// %packed_field(TYPE, FIELD, BYTE, FIRST_BIT, WIDTH): a read-only attribute
// FIELD of TYPE held in a packed record at that byte and bit position.
%define %packed_field(TYPE, FIELD, BYTE, FIRST_BIT, WIDTH)
%{
static unsigned int TYPE##_##FIELD##_get(TYPE *self) { return packed_field(self, BYTE, FIRST_BIT, WIDTH); }
%}
%immutable TYPE::FIELD;
%extend TYPE {
  unsigned int FIELD;
}
%enddef
