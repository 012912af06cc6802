// Equality of two wrapped pointer objects, put in place of SWIG's own
// SwigPyObject_richcompare in the generated wrapper (see
// replace_runtime_function.cmake). SWIG's reads the other operand as a
// pointer object whatever it is, so `obj.this == 5` reads past the end of
// the int; this one answers NotImplemented for anything but a pointer object,
// and Python then compares by identity.
SWIGRUNTIMEINLINE int SwigPyObject_Check(PyObject *op);

SWIGRUNTIME PyObject *SwigPyObject_richcompare(SwigPyObject *v, SwigPyObject *w, int op)
{
  if ((op != Py_EQ && op != Py_NE) || !SwigPyObject_Check((PyObject *)w)) {
    Py_INCREF(Py_NotImplemented);
    return Py_NotImplemented;
  }
  return PyBool_FromLong((SwigPyObject_compare(v, w) == 0) == (op == Py_EQ) ? 1 : 0);
}
