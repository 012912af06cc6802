# Puts this folder's versions of two functions of SWIG's runtime in place of
# SWIG's own in the wrapper SWIG generated (WRAPPER): get_swig_this.cxx for
# SWIG_Python_GetSwigThis, pointer_object_compare.cxx for
# SwigPyObject_richcompare. Stops the build if a function is not found where
# this release of SWIG writes it.
file(READ "${WRAPPER}" wrapper)

# Replaces the text from `first` up to `after` (which stays) with `file`.
function(replace name file first after)
  file(READ "${CMAKE_CURRENT_LIST_DIR}/${file}" replacement)
  string(FIND "${wrapper}" "${first}" begin)
  string(FIND "${wrapper}" "${after}" end)
  if(begin EQUAL -1 OR end LESS begin)
    message(FATAL_ERROR "${name} is not where SWIG 4.0.2 writes it in ${WRAPPER}")
  endif()
  string(SUBSTRING "${wrapper}" 0 ${begin} head)
  string(SUBSTRING "${wrapper}" ${end} -1 tail)
  set(wrapper "${head}${replacement}${tail}" PARENT_SCOPE)
endfunction()

replace(SWIG_Python_GetSwigThis get_swig_this.cxx
        "SWIGRUNTIME SwigPyObject *\nSWIG_Python_GetSwigThis(PyObject *pyobj) \n{" "/* Acquire a pointer value */")
replace(SwigPyObject_richcompare pointer_object_compare.cxx
        "/* Added for Python 3.x, would it also be useful for Python 2.x? */\nSWIGRUNTIME PyObject*\nSwigPyObject_richcompare"
        "\n\nSWIGRUNTIME PyTypeObject* SwigPyObject_TypeOnce(void);")
file(WRITE "${WRAPPER}" "${wrapper}")
