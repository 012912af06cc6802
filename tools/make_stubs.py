#!/usr/bin/env python3
"""Writes the type stubs of the SWIG layer from its interface as built.

    python tools/make_stubs.py --out DIR [--swig PATH] [-I DIR ...] [--work DIR]

The build runs it (python/render-lib/CMakeLists.txt) and installs what it
writes with the package. SWIG is run on python/render-lib/renderlib.i the way
the build runs it, with the engine's headers from -I (engine-api/ if none is
given), and the stubs are read off what it generates:

- the C++ wrapper gives every function of the extension module, its number of
  arguments, the conversion each argument goes through (with the C type named
  in its error message: "in method 'X', argument 2 of type 'char const *'"),
  whether a pointer argument refuses None, and how the result is converted;
- the companion layer (renderlib.py) gives the proxy classes: their methods,
  properties and constructors, and the module's functions and constants;
- a second run with the autodoc feature gives the parameters' names.

Written under --out:

- _renderlib-stubs/__init__.pyi: the extension module, a PEP 561 stub-only
  package. Its flat functions take positional arguments only.
- renderlib/__init__.pyi: the companion layer. Proxy methods pass their
  arguments on positionally, so their parameters are positional-only too.

The hand-written modules of the package carry their own annotations.

Type rules, as the wrapper behaves:

- A pointer argument takes None as null, unless the wrapper refuses a null
  (the object of a method, a reference, a by-value record, the monitor's live
  displays and images); a char * argument takes a str or None.
- A pointer result is None when the engine returns null, so it is Optional,
  except where the wrapper cannot make a null (the address of a member, a new
  object, SWIG's container helpers and iterators, an allocator or process id
  the module keeps).
- A char * result is str or None; char arrays and std::string are str.
- bool arguments take True and False only; integer arguments take int only;
  float arguments take int or float.
- Buffer (the buffer protocol) is what a pixel or message argument takes.
- A companion function without parameters reads (*args: Never): it passes on
  whatever it is given and the wrapper refuses any argument. The director
  methods a host overrides keep (self), so that overriding them is sound.
- Results and arguments that are Python objects in the wrapper (PyObject *)
  are typed from PYOBJECT_RESULTS and PYOBJECT_ARGUMENTS below, each with the
  interface file that says what they hold.

Any wrapper code the generator does not recognise stops it (and the build)
with an error, so a changed interface cannot quietly turn into loose stubs.
"""

import argparse
import ast
import keyword
import re
import shutil
import subprocess
import sys
import tempfile
from dataclasses import dataclass, replace
from pathlib import Path

REPO = Path(__file__).resolve().parent.parent
BINDING = REPO / "python" / "render-lib"
EXTENSION_STUB = Path("_renderlib-stubs", "__init__.pyi")
PACKAGE_STUB = Path("renderlib", "__init__.pyi")
SWIG_VERSION = "4.0.2"

GENERATED_BY = "tools/make_stubs.py"


class StubError(Exception):
    """The wrapper holds something the generator does not know how to type."""


# --------------------------------------------------------------------------
# Python objects the wrapper passes through (PyObject *), by flat function.
# Each names what the interface's code puts there.

PYOBJECT_RESULTS = {
    # SWIG's container iterator: one element of its container.
    "SwigPyIterator_value": "_T",
    "SwigPyIterator_next": "_T",
    "SwigPyIterator___next__": "_T",
    "SwigPyIterator_previous": "_T",
    # callbacks/load_frame.i: a director's result is passed on as it is; the
    # adapter accepts only a bytearray.
    "LoadFrameInterface_load_frame": "bytearray",
    # std_map.i: keys(), values(), items() and asdict() of std::map<string, vector<float>>.
    "value_map_keys": "list[str]",
    "value_map_values": "list[tuple[float, ...]]",
    "value_map_items": "list[tuple[str, tuple[float, ...]]]",
    "value_map_asdict": "dict[str, tuple[float, ...]]",
    # catalogue/effect_globals.i: (Param view, Genotype view) pairs, a Param of None
    # for an index outside the table.
    "EffectGlobals_t__get_shared_params": "list[tuple[Param | None, Genotype | None]]",
    # catalogue/effect_def.i: one number as a float, any other count as a tuple.
    "effect_def_get_arg_hardcoded_values": "dict[str, float | tuple[float, ...]]",
    # catalogue/param.i: titles are std::string; state and popup names are engine
    # texts, None where the engine has a null.
    "Param_get_titles": "list[str]",
    "Param_get_limits": "tuple[float | None, float | None, float, float]",
    "Param_get_state_names": "list[str | None]",
    "Param_get_fromfile_popup_names": "list[str | None]",
    # rendering/raster_serialisation.i: the 104-byte image.
    "raster_info_to_bytearray": "bytearray",
    # error_handler.i: Py_RETURN_NONE.
    "set_error_handler": "None",
    # ipc/shmem_transport.i: a memoryview over the segment, None when there
    # is no message (reads) or no space (reservations).
    "ShmemTransport_read_pybuf": "memoryview | None",
    "ShmemTransport_try_read_pybuf": "memoryview | None",
    "ShmemTransport_timed_read_pybuf": "memoryview | None",
    "ShmemTransport_read_pybuf_and_retry": "memoryview | None",
    "ShmemTransport_reserve_pybuf": "memoryview | None",
    "ShmemTransport_try_reserve_pybuf": "memoryview | None",
    "ShmemTransport_timed_reserve_pybuf": "memoryview | None",
}

PYOBJECT_ARGUMENTS = {
    # error_handler.i: a callable taking (level, message), or None to remove it.
    ("set_error_handler", 0): "Callable[[int, str], object] | None",
    # Directors: the Python object being made, an instance of a subclass.
    ("new_LoadFrameInterface", 0): "LoadFrameInterface",
    ("new_GfxInterface", 0): "GfxInterface",
    # ipc/shmem_transport.i: the message, any object with a buffer.
    ("ShmemTransport_write_pybuf", 1): "Buffer",
    ("ShmemTransport_try_write_pybuf", 1): "Buffer",
    ("ShmemTransport_timed_write_pybuf", 1): "Buffer",
}

# Scalar conversions: SWIG_AsVal_<name> for arguments, SWIG_From_<name> for results.
SCALARS = {
    "bool": "bool",
    "int": "int",
    "short": "int",
    "long": "int",
    "long_SS_long": "int",
    "unsigned_SS_int": "int",
    "unsigned_SS_short": "int",
    "unsigned_SS_long": "int",
    "unsigned_SS_char": "int",
    "signed_SS_char": "int",
    "size_t": "int",
    "ptrdiff_t": "int",
    "float": "float",
    "double": "float",
    "std_string": "str",
}

# C element types of the std containers, as Python types.
ELEMENTS = {"float": "float", "double": "float", "bool": "bool", "int": "int", "short": "int", "std::string": "str"}


# --------------------------------------------------------------------------
# Running SWIG


def run_swig(swig, includes, out, extra=()):
    out.mkdir(parents=True, exist_ok=True)
    version = subprocess.run([swig, "-version"], capture_output=True, text=True, check=True).stdout
    if "SWIG Version %s" % SWIG_VERSION not in version:
        raise StubError("%s is not SWIG %s: %s" % (swig, SWIG_VERSION, version.strip()))
    # Quiet unless it fails: the build's own SWIG run shows the same warnings.
    run = subprocess.run(
        [
            swig,
            "-c++",
            "-python",
            "-threads",
            "-Wextra",
            *extra,
            "-I%s" % BINDING,
            *["-I%s" % include for include in includes],
            "-outdir",
            str(out),
            "-o",
            str(out / "wrap.cxx"),
            str(BINDING / "renderlib.i"),
        ],
        cwd=REPO,
        stdout=subprocess.PIPE,
        stderr=subprocess.STDOUT,
        text=True,
    )
    if run.returncode:
        raise StubError("SWIG failed:\n%s" % run.stdout)
    return (out / "wrap.cxx").read_text(), (out / "renderlib.py").read_text()


# --------------------------------------------------------------------------
# C types


def _drop_template_argument(text, prefix):
    """Removes every ",prefix< ... >" (brackets balanced) from a C type."""
    while True:
        start = text.find("," + prefix + "<")
        if start < 0:
            return text
        depth = 0
        for end in range(start + len(prefix) + 1, len(text)):
            if text[end] == "<":
                depth += 1
            elif text[end] == ">":
                depth -= 1
                if depth == 0:
                    break
        text = text[:start] + text[end + 1 :]


def normalise(ctype):
    """A C type without qualifiers, references, spaces or default template
    arguments: "std::vector< float,std::allocator< float > > const &" reads
    "std::vector<float>"."""
    text = re.sub(r"\bconst\b", "", ctype)
    text = re.sub(r"\benum\b", "", text)
    text = text.replace("&", "").replace(" ", "")
    text = _drop_template_argument(text, "std::allocator")
    text = _drop_template_argument(text, "std::less")
    return text


def template_arguments(text):
    """The top-level arguments of "name<a,b<c>>": ["a", "b<c>"]."""
    inner = text[text.index("<") + 1 : text.rindex(">")]
    parts, depth, current = [], 0, ""
    for char in inner:
        if char == "," and depth == 0:
            parts.append(current)
            current = ""
            continue
        depth += char == "<"
        depth -= char == ">"
        current += char
    parts.append(current)
    return parts


# --------------------------------------------------------------------------
# The wrapper


@dataclass
class Arg:
    name: str
    type: str
    default: bool = False


@dataclass
class Sig:
    args: list
    result: str
    abstract: bool = False  # a director's pure virtual method


FUNCTION_RE = re.compile(r"^SWIGINTERN PyObject \*(\w+)\(PyObject \*[^\n]*\{\n", re.M)
METHOD_TABLE_RE = re.compile(r'\{ "(\w+)", (\w+), (METH_\w+), NULL\}')
TYPE_RE = re.compile(r'^static swig_type_info _swigt__(p_\w+) = \{"_\1", "([^"]*)"', re.M)
REGISTER_RE = re.compile(
    r"SWIGINTERN PyObject \*(\w+)_swigregister\(.*?SWIG_TypeNewClientData\(SWIGTYPE_(p_\w+),", re.S
)
CONSTANT_RE = re.compile(r'SWIG_Python_SetConstant\(d, "(\w+)",SWIG_(From_int|FromCharPtr)\(')
MESSAGE_RE = re.compile(
    r"""argument " "(\d+)"" of type '" "([^"]*)""'|argument (\d+) of type '([^']*)'"""
    r"""|arg (\d+) of type ([^:,"]*)[:,]|arg (\d+), """
)
ARGS_RE = re.compile(
    r'SWIG_Python_UnpackTuple\(args, "\w+", (\d+), (\d+), swig_obj\)'
    r"|\(nobjs < (\d+)\) \|\| \(nobjs > (\d+)\)|SWIG_Python_UnpackTuple\(args, \"\w+\", 0, 0, 0\)"
)


class Wrapper:
    """What the C++ wrapper says about each function of the module."""

    def __init__(self, source):
        self.source = source
        self.bodies = {}
        for match in FUNCTION_RE.finditer(source):
            end = source.index("\n}\n", match.end())
            self.bodies[match.group(1)] = source[match.end() : end]
        table = source[source.index("static PyMethodDef SwigMethods[]") :]
        table = table[: table.index("{ NULL, NULL, 0, NULL }")]
        self.table = [(name, function, flags) for name, function, flags in METHOD_TABLE_RE.findall(table)]
        self.type_names = {mangled: names.split("|") for mangled, names in TYPE_RE.findall(source)}
        self.classes = {mangled: name for name, mangled in REGISTER_RE.findall(source)}
        self.class_names = set(self.classes.values())
        self.class_by_ctype = {}
        for mangled, name in self.classes.items():
            for ctype in self.type_names[mangled]:
                self.class_by_ctype[normalise(ctype.rstrip(" *").rstrip("*"))] = name
        self.constants = {name: ("int" if kind == "From_int" else "str") for name, kind in CONSTANT_RE.findall(source)}
        self.opaque = set()  # mangled names of pointer types without a proxy class
        self.signatures = {}
        for name, function, _flags in self.table:
            self.signatures[name] = self._signatures(name, function)

    # -- types

    def class_of(self, mangled):
        """The proxy class of a SWIG type, or its opaque pointer class."""
        if mangled in self.classes:
            return self.classes[mangled]
        if mangled not in self.type_names:
            raise StubError("unknown SWIG type %s" % mangled)
        self.opaque.add(mangled)
        return "_" + mangled

    def container(self, ctype):
        """(kind, proxy class, element C types) of a std container C type."""
        text = normalise(ctype).rstrip("*")
        for kind in ("std::vector", "std::map"):
            if text.startswith(kind + "<"):
                base = text[: text.rindex(">") + 1]
                return kind, self.class_by_ctype.get(base), template_arguments(base)
        return None

    def element_in(self, ctype):
        """What a container accepts for an element of C type `ctype`."""
        return self._element(ctype, self.container_in)

    def element_out(self, ctype):
        """What a container gives for an element of C type `ctype`."""
        return self._element(ctype, self.container_out)

    def _element(self, ctype, nested):
        text = normalise(ctype)
        if text in ELEMENTS:
            return ELEMENTS[text]
        if text.endswith("*") and text[:-1] in self.class_by_ctype:
            return "%s | None" % self.class_by_ctype[text[:-1]]
        if self.container(text):
            return nested(text)
        raise StubError("no Python type for the element type %r" % ctype)

    def container_in(self, ctype):
        """swig::asptr: the proxy, or any Python sequence (a dict for a map)."""
        kind, proxy, args = self.container(ctype)
        if kind == "std::vector":
            accepted = "Sequence[%s]" % self.element_in(args[0])
        else:
            accepted = "Mapping[%s, %s]" % (self.element_in(args[0]), self.element_in(args[1]))
        return "%s | %s" % (proxy, accepted) if proxy else accepted

    def container_out(self, ctype):
        """swig::from: a vector as a tuple, a map as a dict."""
        kind, _proxy, args = self.container(ctype)
        if kind == "std::vector":
            return "tuple[%s, ...]" % self.element_out(args[0])
        return "dict[%s, %s]" % (self.element_out(args[0]), self.element_out(args[1]))

    def iterated(self, ctype, function):
        """What SWIG's iterator over the container `ctype` yields."""
        kind, _proxy, args = self.container(ctype)
        if kind == "std::vector":
            return self.element_out(args[0])
        if function.endswith("_key_iterator"):
            return self.element_out(args[0])
        if function.endswith("_value_iterator"):
            return self.element_out(args[1])
        return "tuple[%s, %s]" % (self.element_out(args[0]), self.element_out(args[1]))

    def member_type(self, ctype, in_argument):
        """A container's member type (value_type, key_type, size_type...)."""
        text = normalise(ctype)
        base, _, member = text.rpartition("::")
        if member in ("size_type", "difference_type"):
            return "int"
        if not self.container(base):
            raise StubError("no Python type for %r" % ctype)
        kind, _proxy, args = self.container(base)
        convert = self.element_in if in_argument else self.element_out
        if member in ("value_type", "key_type"):
            return convert(args[0])
        if member == "mapped_type":
            return convert(args[1])
        if member in ("iterator", "reverse_iterator"):
            return "SwigPyIterator[%s]" % self.iterated(base, "")
        raise StubError("no Python type for %r" % ctype)

    # -- functions

    def _signatures(self, name, function):
        if function in ("SWIG_PyInstanceMethod_New",):
            # Wraps a function as an instance method (SWIG's -fastproxy support).
            return [Sig([Arg("function", "Callable[..., Any]")], "Any")]
        if name.endswith("_swigregister"):
            cls = name[: -len("_swigregister")]
            return [Sig([Arg("cls", "type[%s]" % cls)], "None")]
        if name.endswith("_swiginit"):
            # SWIG_Python_InitShadowInstance: attaches a new object to its proxy.
            cls = name[: -len("_swiginit")]
            return [Sig([Arg("self", cls), Arg("this", "_SwigPyObject")], "None")]
        body = self.bodies[function]
        # In declaration order (SWIG numbers them so), which is also the
        # order of the autodoc prototypes that name their parameters.
        variants = sorted(
            set(re.findall(r"return (_wrap_\w+__SWIG_(\d+))\(self, argc, argv\)", body)),
            key=lambda variant: int(variant[1]),
        )
        variants = [variant for variant, _number in variants]
        if variants:
            return [self._signature(name, self.bodies[v]) for v in variants]
        return [self._signature(name, body)]

    def _argument_count(self, body):
        counts = ARGS_RE.search(body)
        if re.search(r"if \(!args\) SWIG_fail;\n\s*swig_obj\[0\] = args;", body):
            return 1
        if not counts:
            raise StubError("no argument count in %s" % body[:200])
        if counts.group(0).endswith("0, 0, 0)"):
            return 0
        low, high = (counts.group(1), counts.group(2)) if counts.group(1) else (counts.group(3), counts.group(4))
        if low != high:
            raise StubError("a variable argument count in %s" % body[:200])
        return int(high)

    def _signature(self, name, body):
        count = self._argument_count(body)
        lines = body.split("\n")
        first_use = []
        for i in range(count):
            pattern = re.compile(r"(?<!&)swig_obj\[%d\]" % i)
            first_use.append(next(n for n, line in enumerate(lines) if pattern.search(line)))
        action = next(
            (
                n
                for n, line in enumerate(lines)
                if re.match(r"\s*(try \{|result = |resultobj = (?!0 ;)|director = |upcall = )", line)
            ),
            len(lines),
        )
        args = []
        for i in range(count):
            end = first_use[i + 1] if i + 1 < count else max(action, first_use[i] + 1)
            segment = "\n".join(lines[first_use[i] : end])
            args.append(Arg("arg%d" % (i + 1), self._argument(name, i, segment, body)))
        result = self._result(name, body)
        abstract = "Swig::DirectorPureVirtualException::raise(" in body
        if "Py_NotImplemented" in body and re.search(r"___(eq|ne)__$", name):
            # %pythonmaybecall (and SWIG's comparison operators): an operand
            # that does not convert gives NotImplemented, so Python compares
            # by identity instead.
            args = [args[0]] + [replace(arg, type="object") for arg in args[1:]]
        return Sig(args, result, abstract)

    def _argument(self, name, index, segment, body):
        obj = "swig_obj[%d]" % index
        # The C type the wrapper names in its error message for the argument.
        message = MESSAGE_RE.search(segment)
        ctype = next((g for g in message.groups()[1::2] if g), None) if message else None
        if (name, index) in PYOBJECT_ARGUMENTS:
            if not re.search(r"arg\d+ = %s;" % re.escape(obj), segment):
                raise StubError("%s argument %d is not a Python object any more" % (name, index + 1))
            return PYOBJECT_ARGUMENTS[name, index]
        if "raw_image_address(%s, " % obj in segment:
            return "Buffer"  # RawImage, RenderDestination
        if "PyObject_GetBuffer(%s, &view, PyBUF_SIMPLE)" % obj in segment:
            return "Buffer"  # (void *BufferAddress, size_t BufferSize)
        if "PyList_Check(%s)" % obj in segment:
            # The wrapper only reads the list, but a list is invariant: a type
            # variable lets a list of any accepted item type through.
            if "SWIGTYPE_p_T_RasterInfo" in segment:
                return "list[_RasterInfoOrNone]"  # RasterInfoList
            if "PyBUF_WRITABLE" in segment:
                return "list[_BufferOrNone]"  # RawImageList
        if "SWIG_AsCharPtrAndSize(%s" % obj in segment:
            if "a raster descriptor image is 104 bytes" in segment:
                return "str"  # RasterImageBytes refuses None
            return "str | None"
        if "SWIG_AsPtr_std_string(%s" % obj in segment:
            return "str"
        if "PySlice_Check(%s)" % obj in segment:
            return "slice"
        scalar = re.search(r"SWIG_AsVal_(\w+)\(%s," % re.escape(obj), segment)
        if scalar:
            if scalar.group(1) not in SCALARS:
                raise StubError("no Python type for SWIG_AsVal_%s" % scalar.group(1))
            return SCALARS[scalar.group(1)]
        if "swig::asptr(%s" % obj in segment or "swig::asval(%s" % obj in segment:
            if "::" in normalise(ctype).split(">")[-1]:
                return self.member_type(ctype, True)
            return self.container_in(ctype)
        if "swig::SwigPyIterator::descriptor()" in segment:
            return self.member_type(ctype, True)
        pointer = re.search(
            r"SWIG_ConvertPtr\(%s, ?(?:&argp|SWIG_as_voidptrptr\(&arg)(\d+)\)?, ?(SWIGTYPE_\w+)" % re.escape(obj),
            segment,
        )
        if pointer:
            number = pointer.group(1)
            cls = self.class_of(pointer.group(2)[len("SWIGTYPE_") :])
            if self._refuses_null(body, number):
                return cls
            return "%s | None" % cls
        if re.search(r"SWIG_ConvertPtr\(%s, ?SWIG_as_voidptrptr\(&arg(\d+)\), 0, 0\)" % re.escape(obj), segment):
            return "_SwigPyObject | _Wrapped | None"  # void *: any SWIG object, or None
        raise StubError("%s: no Python type for argument %d (%s)" % (name, index + 1, ctype))

    @staticmethod
    def _refuses_null(body, number):
        lines = body.split("\n")
        check = re.compile(r"if \(!argp?%s(\)| \|\|)" % number)
        for n, line in enumerate(lines):
            if check.search(line) and "SWIG_ValueError" in " ".join(lines[n : n + 3]):
                return True
        # An array member's setter copies from the pointer, refusing a null.
        return bool(
            re.search(
                r"if \(arg%s\) \{.*?\} else \{\s*SWIG_exception_fail\(SWIG_ValueError, "
                r"\"invalid null reference \" \"in variable" % number,
                body,
                re.S,
            )
        )

    def _result(self, name, body):
        returned = [
            " ".join(statement.split())
            for statement in re.findall(r"^\s*(resultobj = [^;]*;)", body, re.M)
            if not statement.startswith("resultobj = 0")
        ]
        outputs = [line for line in returned if line.startswith("resultobj = SWIG_Python_AppendOutput(")]
        main = [line for line in returned if line not in outputs]
        # The OUTPUT typemaps' pointer branch: their temporaries are always
        # SWIG_TMPOBJ, so the number is what is appended.
        outputs = [
            line
            for line in outputs
            if not re.search(r"SWIG_NewPointerObj\(\(void\*\)\(arg\d+\), \w+, new_flags\)", line)
        ]
        if not main:
            raise StubError("%s: no result" % name)
        result = self._main_result(name, body, main[0])
        if 'Py_BuildValue("(iN)"' in body:
            # WidgetResult: (status, ((name, (v0, v1, v2, v3)), ...))
            result = "tuple[int, tuple[tuple[str, tuple[float, float, float, float]], ...]]"
        if "resultobj = list.release();" in body:
            result = "list[str]"  # NameList
        if outputs:
            values = []
            for line in outputs:
                scalar = re.match(r"resultobj = SWIG_Python_AppendOutput\(resultobj, SWIG_From_(\w+)\(", line)
                if not scalar:
                    raise StubError("%s: an output that is not a number: %s" % (name, line))
                values.append(SCALARS[scalar.group(1)])
            if result != "None":
                values.insert(0, result)
            kinds = sorted(set(values))
            result = values[0] if len(values) == 1 else "list[%s]" % " | ".join(kinds)
        return result

    def _main_result(self, name, body, line):
        if line == "resultobj = SWIG_Py_Void();":
            return "None"
        if line == "resultobj = result;":
            if name not in PYOBJECT_RESULTS:
                raise StubError("%s returns a Python object that PYOBJECT_RESULTS does not type" % name)
            return PYOBJECT_RESULTS[name]
        if line == "resultobj = list.release();":
            return "list[str]"
        if line.startswith("resultobj = Py_BuildValue("):
            return "None"  # replaced by the caller
        if line.startswith("resultobj = engine_text("):
            return "str"  # HeaderText
        if line.startswith("resultobj = SWIG_FromCharPtr("):
            if name.endswith("___repr__"):
                helper = re.search(r"result = \(char \*\)(\w+)\((?:\([^)]*\))?arg1\)", body)
                helper_body = self.source[self.source.index("SWIGINTERN char const *%s(" % helper.group(1)) :]
                if "static char text[" in helper_body[: helper_body.index("\n}\n")]:
                    return "str"  # %record_repr: the class's buffer, never null
            return "str | None"
        if line.startswith("resultobj = SWIG_FromCharPtrAndSize("):
            return "str"  # a char array member
        scalar = re.match(r"resultobj = SWIG_From_(\w+)\(", line)
        if scalar:
            if scalar.group(1) not in SCALARS:
                raise StubError("%s: no Python type for SWIG_From_%s" % (name, scalar.group(1)))
            return SCALARS[scalar.group(1)]
        if line.startswith("resultobj = swig::from("):
            ctype = re.match(r"resultobj = swig::from\(static_cast< (.*) >\(\*?result\)\);", line).group(1)
            return self.container_out(ctype)
        if line.startswith("resultobj = SWIG_NewPointerObj(swig::container_position(arg1, "):
            container = re.search(r"argument \" \"1\"\" of type '\" \"([^\"]*) \*\"\"'", body).group(1)
            return "SwigPyIterator[%s]" % self.iterated(container, name)
        kept = re.match(
            r"resultobj = SWIG_NewPointerObj\((?:new pid_t\(result\)|&shared_allocator), "
            r"SWIGTYPE_(p_\w+), .*\);",
            line,
        )
        if kept:
            return self.class_of(kept.group(1))  # a new copy, or the module's own: never null
        pointer = re.match(r"resultobj = SWIG_NewPointerObj\((.*), SWIGTYPE_(p_\w+|\w+),\s*(.*)\);", line)
        if pointer is None:
            pointer = re.match(
                r"resultobj = SWIG_NewPointerObj\((.*), (swig::SwigPyIterator::descriptor\(\)),\s*(.*)\);", line
            )
        if pointer:
            value, mangled, flags = pointer.groups()
            if "SWIG_POINTER_NEW" in flags:
                return "_SwigPyObject"  # a constructor's new object, before its proxy takes it
            if mangled == "p_swig__SwigPyIterator":
                self_type = re.search(r"argument \" \"1\"\" of type '\" \"([^\"]*)\"\"'", body)
                element = (
                    self.iterated(self_type.group(1), name)
                    if self_type and self.container(self_type.group(1))
                    else "_T"
                )
                return "SwigPyIterator[%s]" % element  # SWIG's iterators are always new objects
            cls = self.class_of(mangled)
            if value.startswith("(new ") or value.startswith("new "):
                return cls
            made = re.search(r"result = \([^;]*?\)(.*);", body)
            assignment = made.group(1) if made else ""
            if (
                assignment.startswith("&")
                or assignment.startswith("new ")
                or re.match(r"\(\w+ \*\) \(\(arg1\)->", assignment)
            ):
                return cls  # a member's address, a new object, an array member
            if assignment.startswith("std_vector_Sl_") or assignment.startswith("std_map_Sl_"):
                if any(re.match(r"std::(vector|map)<.*>\*$", normalise(t)) for t in self.type_names[mangled]):
                    return cls  # SWIG's container helpers return new containers
            return "%s | None" % cls
        raise StubError("%s: no Python type for the result %s" % (name, line))


# --------------------------------------------------------------------------
# Parameter names (the autodoc run)


DOC_LINE_RE = re.compile(r"^\s*(\w+)\((.*?)\)(?: -> .*)?$")


def parameter_names(companion_with_docs):
    """{flat function: [[names of one prototype], ...]} from the autodoc
    docstrings of the companion layer."""
    names = {}
    tree = ast.parse(companion_with_docs)

    def prototypes(node):
        doc = ast.get_docstring(node, clean=False) or ""
        found = []
        for line in doc.strip().split("\n"):
            match = DOC_LINE_RE.match(line)
            if match:
                found.append([part.strip() for part in match.group(2).split(",") if part.strip()])
        return found

    def called(node):
        calls = [
            n
            for n in ast.walk(node)
            if isinstance(n, ast.Call)
            and isinstance(n.func, ast.Attribute)
            and isinstance(n.func.value, ast.Name)
            and n.func.value.id == "_renderlib"
        ]
        return [c.func.attr for c in calls]

    def record(flat, lines, drop_self=False, prefix=()):
        for line in lines:
            params = [p for p in line if not (drop_self and p == "self")]
            names.setdefault(flat, []).append(list(prefix) + params)

    for node in tree.body:
        if isinstance(node, ast.FunctionDef):
            for flat in called(node):
                record(flat, prototypes(node))
        if isinstance(node, ast.ClassDef):
            for item in node.body:
                if isinstance(item, ast.FunctionDef):
                    flats = called(item)
                    if item.name == "__init__":
                        for flat in flats:
                            if flat.startswith("new_"):
                                director = "_self" in ast.dump(item)
                                record(flat, prototypes(item), drop_self=True, prefix=("_self",) if director else ())
                    else:
                        for flat in flats:
                            record(flat, prototypes(item))
                if (
                    isinstance(item, ast.Assign)
                    and isinstance(item.value, ast.Call)
                    and getattr(item.value.func, "id", None) == "property"
                ):
                    attribute = item.targets[0].id
                    accessors = [a.attr for a in item.value.args if isinstance(a, ast.Attribute)]
                    if accessors:
                        names.setdefault(accessors[0], []).append(["self"])
                    if len(accessors) > 1:
                        names.setdefault(accessors[1], []).append(["self", attribute])
    # The destructors and disowners have no prototype: they take the object.
    for flat in re.findall(r"_renderlib\.((?:delete|disown)_\w+)", companion_with_docs):
        names.setdefault(flat, [["self"]])
    return names


def safe_name(name):
    name = name.split("=")[0].strip()
    if keyword.iskeyword(name) or name in ("None", "True", "False"):
        return name + "_"
    return name


def name_arguments(signatures, prototypes):
    """Gives each signature's arguments the names of the prototype with the
    same number of parameters (defaults expanded), first come first served."""
    expanded = []
    for prototype in prototypes or []:
        required = [p for p in prototype if "=" not in p]
        for n in range(len(prototype), len(required) - 1, -1):
            expanded.append(prototype[:n])
    used = set()
    named = []
    for sig in signatures:
        choice = next((i for i, p in enumerate(expanded) if len(p) == len(sig.args) and i not in used), None)
        if choice is None:
            choice = next((i for i, p in enumerate(expanded) if len(p) == len(sig.args)), None)
        args = []
        seen = set()
        for n, arg in enumerate(sig.args):
            name = safe_name(expanded[choice][n]) if choice is not None else arg.name
            while name in seen:
                name += "_"
            seen.add(name)
            args.append(replace(arg, name=name))
        if choice is not None:
            used.add(choice)
        named.append(replace(sig, args=args))
    return named


def merge_defaults(signatures):
    """One signature with trailing defaults when the overloads differ only by
    leaving trailing arguments out; else the overloads as they are."""
    if len(signatures) < 2:
        return signatures
    longest = max(signatures, key=lambda s: len(s.args))
    shortest = min(len(s.args) for s in signatures)
    counts = sorted(len(s.args) for s in signatures)
    if len(set(counts)) != len(counts) or counts != list(range(shortest, shortest + len(counts))):
        return signatures
    for sig in signatures:
        if sig.result != longest.result or [a.type for a in sig.args] != [
            a.type for a in longest.args[: len(sig.args)]
        ]:
            return signatures
    args = [replace(a, default=n >= shortest) for n, a in enumerate(longest.args)]
    return [replace(longest, args=args)]


# --------------------------------------------------------------------------
# Writing stubs


def render_params(args, leading=()):
    parts = list(leading)
    for arg in args:
        parts.append("%s: %s%s" % (arg.name, arg.type, " = ..." if arg.default else ""))
    if args:
        parts.append("/")
    return ", ".join(parts)


def render_function(name, signatures, indent="", leading=(), decorators=(), drop_first=False, forwards=False):
    """`forwards`: the function is a companion's def f(*args) that passes its
    arguments on to the wrapper; with none to take, the stub says that no
    extra argument is accepted (*args: Never) instead of leaving *args out."""
    lines = []
    overloaded = len(signatures) > 1
    takes_none = forwards and all(len(sig.args) == int(drop_first) and not sig.abstract for sig in signatures)
    for sig in signatures:
        args = sig.args[1:] if drop_first else sig.args
        for decorator in decorators:
            lines.append("%s@%s" % (indent, decorator))
        if sig.abstract:
            lines.append("%s@abstractmethod" % indent)
        if overloaded:
            lines.append("%s@overload" % indent)
        ignore = ""
        if name in ("__eq__", "__ne__") and args and args[0].type != "object":
            ignore = "  # type: ignore[override]"
        params = render_params(args, leading)
        if takes_none:
            params = ", ".join(list(leading) + ["*args: Never"])
        lines.append("%sdef %s(%s) -> %s: ...%s" % (indent, name, params, sig.result, ignore))
    return lines


def substitute(signatures, old, new):
    pattern = re.compile(r"\b%s\b(?!\[)" % re.escape(old))
    return [
        replace(s, result=pattern.sub(new, s.result), args=[replace(a, type=pattern.sub(new, a.type)) for a in s.args])
        for s in signatures
    ]


def unbound_element(signatures):
    """An element type that no argument binds is not known: Any."""
    element = re.compile(r"\b_T\b")
    if any(element.search(a.type) for s in signatures for a in s.args):
        return signatures
    return substitute(signatures, "_T", "Any")


def with_self_type(name, signatures, cls):
    """SwigPyIterator's own functions keep their element type."""
    if name.endswith("_swigregister"):
        return substitute(signatures, "SwigPyIterator", "SwigPyIterator[Any]")
    if cls == "SwigPyIterator" or name.startswith("SwigPyIterator_") or name == "delete_SwigPyIterator":
        return substitute(signatures, "SwigPyIterator", "SwigPyIterator[_T]")
    return substitute(signatures, "SwigPyIterator", "SwigPyIterator[Any]")


TYPE_VARIABLES = [
    '_T = TypeVar("_T")',
    '_RasterInfoOrNone = TypeVar("_RasterInfoOrNone", bound=T_RasterInfo | None)',
    '_BufferOrNone = TypeVar("_BufferOrNone", bound=Buffer | None)',
]


def tidy(text):
    """A blank line where a run of constants meets a run of functions, two
    before a class, never more than two in a row."""
    out = []
    previous = None
    for line in text.split("\n"):
        kind = None
        if line and not line[0].isspace() and not line.startswith(("#", ")")):
            kind = (
                "class"
                if line.startswith(("class ", "@type_check_only"))
                else "def"
                if re.match(r"(def |@)", line)
                else "other"
            )
        if kind and previous and kind != previous and out and out[-1] != "" and not out[-1].startswith("@"):
            out.append("")
        if kind == "class" and len(out) > 1 and out[-1] == "" and out[-2] != "":
            out.append("")
        if kind:
            previous = kind
        out.append(line)
    text = "\n".join(out)
    while "\n\n\n\n" in text:
        text = text.replace("\n\n\n\n", "\n\n\n")
    return text


def extension_stub(wrapper, names):
    lines = [
        "# Type stubs of the _renderlib extension module.",
        "# Generated by %s from the SWIG wrapper of python/render-lib/renderlib.i" % GENERATED_BY,
        "# when the package is built; change the interface, not this file.",
        "#",
        "# Results are typed as proxies of the renderlib package, which registers",
        "# its classes when it is imported (without it they are bare pointer objects).",
        "# The functions take positional arguments only. A pointer argument takes",
        "# None as null where the wrapper lets it, and a pointer result is None",
        "# where the engine can return null.",
        "from collections.abc import Callable, Mapping, Sequence",
        "from typing import Any, TypeVar, overload, type_check_only",
        "",
        "from typing_extensions import Buffer, Protocol",
        "",
    ]
    imports = sorted(wrapper.class_names)
    lines.append("from renderlib import (")
    lines.extend("    %s," % name for name in imports)
    lines.append(")")
    lines.append("")
    lines.extend(TYPE_VARIABLES)
    lines.extend(swig_object_classes(wrapper))
    lines.append("")
    for name, kind in wrapper.constants.items():
        lines.append("%s: %s" % (name, kind))
    lines.append("")
    for name, _function, _flags in wrapper.table:
        sigs = merge_defaults(name_arguments(wrapper.signatures[name], names.get(name)))
        sigs = unbound_element(with_self_type(name, sigs, None))
        lines.extend(render_function(name, [replace(s, abstract=False) for s in sigs]))
    return tidy("\n".join(lines)).rstrip("\n") + "\n"


def swig_object_classes(wrapper):
    lines = [
        "",
        "@type_check_only",
        "class _SwigPyObject:",
        "    # SWIG's pointer object (type SwigPyObject): what a proxy holds as",
        "    # `this`, and what a pointer without a proxy class comes back as.",
        "    def own(self, value: bool = ..., /) -> bool: ...",
        "    def disown(self) -> None: ...",
        "    def acquire(self) -> None: ...",
        "    def append(self, other: _SwigPyObject, /) -> None: ...",
        "    def next(self) -> _SwigPyObject | None: ...",
        "    def __int__(self) -> int: ...",
        "",
        "@type_check_only",
        "class _Wrapped(Protocol):",
        "    # Any proxy: SWIG finds the pointer through `this`.",
        "    @property",
        "    def this(self) -> _SwigPyObject: ...",
    ]
    for mangled in sorted(wrapper.opaque):
        lines.append("")
        lines.append("@type_check_only")
        lines.append("class _%s(_SwigPyObject): ...  # %s" % (mangled, wrapper.type_names[mangled][0]))
    return lines


# -- the companion layer


def companion_stub(wrapper, names, companion):
    tree = ast.parse(companion)
    lines = [
        "# Type stubs of the renderlib package's proxy layer (written by SWIG as",
        "# renderlib.py, installed as renderlib/__init__.py).",
        "# Generated by %s from the SWIG wrapper of python/render-lib/renderlib.i" % GENERATED_BY,
        "# when the package is built; change the interface, not this file.",
        "#",
        "# Methods take positional arguments only. A pointer argument takes None",
        "# as null where the wrapper lets it, and a pointer result is None where",
        "# the engine can return null.",
        "import weakref",
        "from abc import abstractmethod",
        "from collections.abc import Callable, Mapping, Sequence",
        "from typing import Any, ClassVar, Generic, TypeVar, overload",
        "",
        "from typing_extensions import Buffer, Never, Self",
        "",
    ]
    opaque = sorted("_" + m for m in wrapper.opaque)
    lines.append("from _renderlib import (")
    lines.extend("    %s," % name for name in ["_SwigPyObject", "_Wrapped"] + opaque)
    lines.append(")")
    lines.append("")
    lines.extend(TYPE_VARIABLES)
    lines.append("")

    def flat(name, cls=None):
        sigs = merge_defaults(name_arguments(wrapper.signatures[name], names.get(name)))
        return with_self_type(name, sigs, cls)

    for node in tree.body:
        if (
            isinstance(node, ast.Assign)
            and isinstance(node.value, ast.Attribute)
            and getattr(node.value.value, "id", None) == "_renderlib"
        ):
            target = node.targets[0].id
            if not target.startswith("_") or target.startswith("__") or target in wrapper.constants:
                if target in wrapper.constants:
                    lines.append("%s: %s" % (target, wrapper.constants[target]))
        elif isinstance(node, ast.FunctionDef) and not node.name.startswith("_"):
            target = forwarded(node)
            sigs = unbound_element(flat(target))
            lines.extend(render_function(node.name, [replace(s, abstract=False) for s in sigs], forwards=True))
        elif isinstance(node, ast.ClassDef) and not node.name.startswith("_"):
            lines.append("")
            lines.extend(proxy_class(wrapper, node, flat))
            lines.append("")
    return tidy("\n".join(lines)).rstrip("\n") + "\n"


def forwarded(function):
    """The flat function a companion function or method calls."""
    for node in ast.walk(function):
        if (
            isinstance(node, ast.Call)
            and isinstance(node.func, ast.Attribute)
            and getattr(node.func.value, "id", None) == "_renderlib"
            and not node.func.attr.endswith("_swiginit")
        ):
            return node.func.attr
    return None


def proxy_class(wrapper, node, flat):
    cls = node.name
    generic = cls == "SwigPyIterator"
    lines = ["class %s%s:" % (cls, "(Generic[_T])" if generic else "")]
    body = ["    this: _SwigPyObject"]
    methods = {}
    for item in node.body:
        if isinstance(item, ast.FunctionDef):
            methods[item.name] = item  # a later definition replaces an earlier one
    overloaded = set()
    for item in node.body:
        if isinstance(item, ast.FunctionDef) and methods[item.name] is item:
            target = forwarded(item)
            if target and len(flat(target, cls)) > 1:
                overloaded.add(item.name)
    for item in node.body:
        if isinstance(item, ast.FunctionDef) and methods[item.name] is not item:
            continue
        if isinstance(item, ast.Assign):
            target = item.targets[0].id
            value = item.value
            if target == "thisown":
                body += [
                    "    @property",
                    "    def thisown(self) -> bool: ...",
                    "    @thisown.setter",
                    "    def thisown(self, value: bool) -> None: ...",
                ]
            elif target == "__repr__":
                body.append("    def __repr__(self) -> str: ...")
            elif target == "__swig_destroy__":
                destroy = flat(value.attr, cls)
                body.extend(render_function("__swig_destroy__", destroy, "    ", decorators=("staticmethod",)))
            elif isinstance(value, ast.Call) and getattr(value.func, "id", None) == "property":
                body.extend(proxy_property(wrapper, target, value, methods, flat, cls))
            else:
                raise StubError("%s.%s: an assignment the generator does not know" % (cls, target))
        elif isinstance(item, ast.FunctionDef):
            lines_of_method = proxy_method(wrapper, cls, item, methods, flat)
            operator = re.match(r"__i(\w+)__$", item.name)
            if operator and "__%s__" % operator.group(1) in overloaded:
                # mypy wants an in-place operator to accept what its
                # overloaded operator accepts; SWIG's takes an int only.
                lines_of_method[-1] += "  # type: ignore[misc]"
            body.extend(lines_of_method)
        elif isinstance(item, ast.Expr) and item is node.body[0]:
            continue  # the class's docstring
        else:
            raise StubError("%s: a statement the generator does not know" % cls)
    return lines + body


def method_result(cls, methods, name, flat):
    target = forwarded(methods[name])
    return flat(target, cls)[0].result


def proxy_property(wrapper, name, call, methods, flat, cls):
    accessors = call.args
    getter = accessors[0]
    if isinstance(getter, ast.Attribute):
        result = flat(getter.attr, cls)[0].result
    else:
        result = method_result(cls, methods, getter.id, flat)
    lines = ["    @property", "    def %s(self) -> %s: ..." % (name, result)]
    if len(accessors) > 1:
        setter = flat(accessors[1].attr, cls)[0]
        lines += ["    @%s.setter" % name, "    def %s(self, value: %s, /) -> None: ..." % (name, setter.args[1].type)]
    return lines


def proxy_method(wrapper, cls, item, methods, flat):
    name = item.name
    source = ast.dump(item)  # names and texts, as the source spells them
    if name == "__init__":
        if "No constructor defined" in source:
            # The engine makes these; calling the class raises AttributeError.
            return ["    def __init__(self, no_constructor: Never, /) -> None: ..."]
        target = next(
            n.func.attr
            for n in ast.walk(item)
            if isinstance(n, ast.Call) and isinstance(n.func, ast.Attribute) and n.func.attr.startswith("new_")
        )
        sigs = [replace(s, result="None") for s in flat(target, cls)]
        director = "_self" in source
        return render_function("__init__", sigs, "    ", leading=("self",), drop_first=director, forwards=True)
    if name == "__disown__":
        return ["    def __disown__(self) -> weakref.ProxyType[Self]: ..."]
    target = forwarded(item)
    if target is None:
        returned = next(n for n in ast.walk(item) if isinstance(n, ast.Return)).value
        if isinstance(returned, ast.Name) and returned.id == "self":
            return ["    def %s(self) -> Self: ..." % name]
        if isinstance(returned, ast.Call) and isinstance(returned.func, ast.Attribute):
            result = method_result(cls, methods, returned.func.attr, flat)
            return ["    def %s(self) -> %s: ..." % (name, result)]
        raise StubError("%s.%s: a method the generator does not know" % (cls, name))
    sigs = flat(target, cls)
    static = any(isinstance(d, ast.Name) and d.id == "staticmethod" for d in item.decorator_list)
    if static:
        return render_function(name, sigs, "    ", decorators=("staticmethod",), forwards=True)
    return render_function(name, sigs, "    ", leading=("self",), drop_first=True, forwards=True)


# --------------------------------------------------------------------------


def generate(swig, includes, work):
    """{path under the output folder: text}"""
    wrap_source, companion = run_swig(swig, includes, work / "build")
    _, documented = run_swig(swig, includes, work / "autodoc", ("-features", "autodoc=0"))
    wrapper = Wrapper(wrap_source)
    names = parameter_names(documented)
    outputs = {}
    # The companion first: it collects the opaque pointer types both stubs use.
    package_stub = companion_stub(wrapper, names, companion)
    outputs[EXTENSION_STUB] = extension_stub(wrapper, names)
    outputs[PACKAGE_STUB] = package_stub
    return outputs


def default_swig():
    here = Path(sys.executable).parent / "swig"
    return str(here) if here.exists() else shutil.which("swig")


def main(argv=None):
    parser = argparse.ArgumentParser(description=__doc__.split("\n\n")[0])
    parser.add_argument("--out", required=True, type=Path, help="folder to write the stubs into")
    parser.add_argument("--swig", default=default_swig(), help="SWIG %s executable" % SWIG_VERSION)
    parser.add_argument(
        "-I",
        dest="includes",
        action="append",
        metavar="DIR",
        help="folder of the engine's headers, as the build gives SWIG (engine-api/ if none)",
    )
    parser.add_argument("--work", help="folder for SWIG's output (a temporary one if not given)")
    args = parser.parse_args(argv)
    if not args.swig:
        parser.error("no swig found: give --swig")
    with tempfile.TemporaryDirectory() as temporary:
        outputs = generate(args.swig, args.includes or [str(REPO / "engine-api")], Path(args.work or temporary))
    for path, text in outputs.items():
        (args.out / path).parent.mkdir(parents=True, exist_ok=True)
        (args.out / path).write_text(text)
    return 0


if __name__ == "__main__":
    try:
        sys.exit(main())
    except StubError as error:
        print("make_stubs: %s" % error, file=sys.stderr)
        sys.exit(2)
