// The wrapped pointer object behind a Python object, put in place of SWIG's
// own SWIG_Python_GetSwigThis in the generated wrapper (see
// replace_runtime_function.cmake). SWIG's follows the chain of `this`
// attributes without end and lets go of each attribute's value before it
// looks at it, so an object whose `this` is made on the spot (a catch-all
// __getattr__, a property) has it freed under the lookup, and an object that
// names itself as its `this` never comes back. This one holds each value
// while it looks, takes at most eight steps, and answers only with a pointer
// object that something else keeps alive. An exception pending before the
// lookup stays pending.
SWIGRUNTIME SwigPyObject *SWIG_Python_GetSwigThis(PyObject *pyobj)
{
  if (SwigPyObject_Check(pyobj))
    return (SwigPyObject *)pyobj;
  PyObject *pending_type, *pending_value, *pending_traceback;
  PyErr_Fetch(&pending_type, &pending_value, &pending_traceback);
  SwigPyObject *found = 0;
  PyObject *obj = pyobj;
  Py_INCREF(obj);
  for (int step = 0; step < 8 && obj; ++step) {
    PyObject *next = PyObject_GetAttr(obj, SWIG_This());
    Py_DECREF(obj);
    obj = next;
    if (obj && SwigPyObject_Check(obj)) {
      if (Py_REFCNT(obj) > 1)
        found = (SwigPyObject *)obj;
      break;
    }
  }
  Py_XDECREF(obj);
  PyErr_Clear();
  PyErr_Restore(pending_type, pending_value, pending_traceback);
  return found;
}
