# Puts get_swig_this.cxx in place of SWIG's SWIG_Python_GetSwigThis in the
# wrapper SWIG generated (WRAPPER), and stops the build if SWIG's function is
# not found there as this release of SWIG writes it.
file(READ "${WRAPPER}" wrapper)
file(READ "${REPLACEMENT}" replacement)
set(first "SWIGRUNTIME SwigPyObject *\nSWIG_Python_GetSwigThis(PyObject *pyobj) \n{")
set(after "/* Acquire a pointer value */")
string(FIND "${wrapper}" "${first}" begin)
string(FIND "${wrapper}" "${after}" end)
if(begin EQUAL -1 OR end LESS begin)
  message(FATAL_ERROR "SWIG_Python_GetSwigThis is not where SWIG 4.0.2 writes it in ${WRAPPER}")
endif()
string(SUBSTRING "${wrapper}" 0 ${begin} head)
string(SUBSTRING "${wrapper}" ${end} -1 tail)
file(WRITE "${WRAPPER}" "${head}${replacement}${tail}")
