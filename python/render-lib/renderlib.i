// _renderlib: the Python binding of the tarsel_ps render engine and the
// QRVExternalMonitor library. This file holds the module declaration, the
// one exception guard and the list of interface files; each subsystem lives in
// its own folder (catalogue, rendering, callbacks, ipc, monitor).
%module(moduleimport="import _renderlib", directors="1") renderlib

%{
#include "tarsel/errors.h"
%}

// The abort guard around every engine call. An engine abort becomes
// RuntimeError "Tarsel Abort" (chained to the host callback that caused it,
// if one did); when the call ran without the interpreter lock, the lock is
// taken back as the call's frame unwinds, before the error is set. A failed
// host callback that reaches a wrapper has its Python error set already; a
// call the module's own code refuses on the way carries its exception. A
// container asked for more than memory holds raises MemoryError instead of
// ending the process.
%exception {
  try {
    $action
  } catch (const TarselAbortException &) {
    raise_tarsel_abort();
    SWIG_fail;
  } catch (const Swig::DirectorException &) {
    SWIG_fail;
  } catch (const RefusedCall &refused) {
    PyErr_SetString(refused.type, refused.message.c_str());
    SWIG_fail;
  } catch (const std::length_error &too_long) {
    PyErr_SetString(PyExc_MemoryError, too_long.what());
    SWIG_fail;
  } catch (const std::bad_alloc &) {
    PyErr_NoMemory();
    SWIG_fail;
  }
}

%include "engine_dll_path.i"
%include "conventions.i"
%include "renderlib_typemaps.i"
%include "abort_translation.i"
%include "callbacks/engine_threads.i"
%include "rendering/instance_uses.i"
%include "product_constants.i"

// The order of this list is the order in which the module registers its
// constants and classes at import.
%include "std_except.i"
%include "std_string.i"
%include "catalogue/container_iterators.i"
%include "std_vector.i"
%include "std_map.i"
%include "callbacks/load_frame.i"
%include "catalogue/value_arrays.i"
%include "catalogue/containers.i"
%include "catalogue/param_enums.i"
%include "catalogue/effect_globals.i"
%include "catalogue/genotype.i"
%include "catalogue/effect_def.i"
%include "catalogue/param_flags.i"
%include "catalogue/param.i"
%include "rendering/raster_info.i"
%include "catalogue/catalogue.i"
%include "rendering/raster_serialisation.i"
%include "rendering/render_calls.i"
%include "rendering/flare_textures.i"
%include "rendering/image_utils.i"
%include "catalogue/param_queries.i"
%include "rendering/effect_instance.i"
%include "error_handler.i"
%include "ipc/shmem_error.i"
%include "ipc/message_header.i"
%include "ipc/shmem_transport.i"
%include "ipc/shmem_manager.i"
%include "monitor/external_monitor.i"
%include "callbacks/widgets.i"
%include "build_identity.i"
