"""Builds native code from the tests: a separately configured reference engine and small extension modules. Compilers
run without the sanitizer runtime that a sanitized test run preloads."""

import os
import pathlib
import shutil
import subprocess
import sys
import sysconfig

REPO = pathlib.Path(__file__).resolve().parents[1]


def tool(name):
    """A build tool, preferring the test environment's own (pip-installed) one."""
    found = shutil.which(name, path=os.pathsep.join([os.path.dirname(sys.executable), os.environ.get("PATH", "")]))
    if not found:
        raise RuntimeError("%s is needed to build test code" % name)
    return found


def run(command, cwd=None):
    env = {k: v for k, v in os.environ.items() if k not in ("LD_PRELOAD", "ASAN_OPTIONS", "UBSAN_OPTIONS")}
    done = subprocess.run(
        [str(part) for part in command], cwd=cwd, env=env, stdout=subprocess.PIPE, stderr=subprocess.STDOUT
    )
    assert done.returncode == 0, "%s failed:\n%s" % (command[0], done.stdout.decode(errors="replace")[-4000:])


def cmake_build(source_dir, build_dir, *options):
    configure = [tool("cmake"), "-S", source_dir, "-B", build_dir, "-G", "Ninja", "-DCMAKE_BUILD_TYPE=Release"]
    run(configure + ["-DCMAKE_MAKE_PROGRAM=" + tool("ninja"), *options])
    run([tool("cmake"), "--build", build_dir])
    return pathlib.Path(build_dir)


def build_reference_engine(build_dir):
    """Configures and builds reference-engine/ on its own, which draws a build
    identifier of its own; returns the folder holding its libraries."""
    return cmake_build(REPO / "reference-engine", build_dir)


def build_module_against(engine_dir, build_dir):
    """Builds the module alone against the engine libraries in `engine_dir`
    (headers from engine-api/); returns the folder holding _renderlib."""
    options = {"RENDERLIB_ENGINE_INCLUDE_DIR": REPO / "engine-api", "RENDERLIB_ENGINE_LIBRARY_DIR": engine_dir}
    options.update(Python_EXECUTABLE=sys.executable, SWIG_EXECUTABLE=tool("swig"))
    cmake_build(REPO, build_dir, *["-D%s=%s" % option for option in options.items()])
    return pathlib.Path(build_dir) / "python" / "render-lib"


def build_swig_module(interface, build_dir, include_dirs=()):
    """Generates and compiles a SWIG module from `interface`; returns its folder."""
    build_dir = pathlib.Path(build_dir)
    name = pathlib.Path(interface).stem
    wrap = build_dir / (name + "_wrap.cxx")
    run([tool("swig"), "-c++", "-python", "-threads", "-outdir", build_dir, "-o", wrap, interface])
    extension = build_dir / ("_" + name + sysconfig.get_config_var("EXT_SUFFIX"))
    includes = [sysconfig.get_paths()["include"], *include_dirs]
    compiler = [os.environ.get("CXX", "g++"), *"-std=c++17 -shared -fPIC -w -O1".split()]
    run(compiler + ["-I%s" % d for d in includes] + [wrap, "-o", extension])
    return build_dir
