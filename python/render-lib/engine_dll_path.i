// Where Windows finds the engine's DLLs. Python 3.8 and later load an
// extension module's dependencies only from the module's own folder, the
// system folders and folders added with os.add_dll_directory, never from
// PATH. The companion package therefore adds, before it imports _renderlib,
// the folder of the engine installed with it (renderlib/lib) and, when the
// module was built against an engine installed elsewhere, the folder that
// RENDERLIB_ENGINE_DIR names. Elsewhere the module finds the engine by its
// run path and this does nothing.
%pythonbegin %{
import os as _os
import sys as _sys

if _sys.platform == "win32" and hasattr(_os, "add_dll_directory"):
    # The handles are kept for the life of the process: closing one removes its folder.
    _engine_dll_directories = []
    for _folder in (_os.path.join(_os.path.dirname(_os.path.abspath(__file__)), "lib"),
                    _os.environ.get("RENDERLIB_ENGINE_DIR", "")):
        if _folder and _os.path.isdir(_folder):
            _engine_dll_directories.append(_os.add_dll_directory(_folder))
%}
