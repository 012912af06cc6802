"""Builds native code from the tests: a separately configured reference engine
and small extension modules. Compilers run without the sanitizer runtime that
a sanitized test run preloads."""
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
    subprocess.run([str(part) for part in command], cwd=cwd, env=env, check=True,
                   stdout=subprocess.PIPE, stderr=subprocess.STDOUT)


def build_reference_engine(build_dir):
    """Configures and builds reference-engine/ on its own, which draws a build
    identifier of its own; returns the path of its libtarsel_ps.so."""
    run([tool("cmake"), "-S", REPO / "reference-engine", "-B", build_dir, "-G", "Ninja",
         "-DCMAKE_MAKE_PROGRAM=" + tool("ninja"), "-DCMAKE_BUILD_TYPE=Release"])
    run([tool("cmake"), "--build", build_dir, "--target", "tarsel_ps"])
    return str(pathlib.Path(build_dir) / "libtarsel_ps.so")


def build_swig_module(interface, build_dir, include_dirs=()):
    """Generates and compiles a SWIG module from `interface`; returns its folder."""
    build_dir = pathlib.Path(build_dir)
    name = pathlib.Path(interface).stem
    wrap = build_dir / (name + "_wrap.cxx")
    run([tool("swig"), "-c++", "-python", "-threads", "-outdir", build_dir, "-o", wrap, interface])
    extension = build_dir / ("_" + name + sysconfig.get_config_var("EXT_SUFFIX"))
    run([os.environ.get("CXX", "g++"), "-std=c++17", "-shared", "-fPIC", "-w", "-O1",
         "-I" + sysconfig.get_paths()["include"]] + ["-I%s" % d for d in include_dirs]
        + [wrap, "-o", extension])
    return build_dir
