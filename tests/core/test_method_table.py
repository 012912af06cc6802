"""The module's method table against the hand-written list in method_table.txt.

method_table.txt lists every function of _renderlib with its calling convention, as the binding's interface tables give
them. The table itself is read from the built module: every function object of the module is a builtin function whose
PyMethodDef entry points into the module's one static method table, so the entries are read in place through ctypes
(name and ml_flags), and the table is walked from its first entry to the terminating null entry."""

import ast
import ctypes
import itertools
from ctypes import c_char_p, c_int, c_void_p
import pathlib
import types

import pytest

import _renderlib
import renderlib

LIST_FILE = pathlib.Path(__file__).with_name("method_table.txt")
CONVENTIONS = {0x0001: "METH_VARARGS", 0x0004: "METH_NOARGS", 0x0008: "METH_O"}


class PyMethodDef(ctypes.Structure):
    _fields_ = [("ml_name", c_char_p), ("ml_meth", c_void_p), ("ml_flags", c_int), ("ml_doc", c_char_p)]


class PyCFunctionObjectPrefix(ctypes.Structure):
    # PyObject_HEAD (its size taken from the running interpreter), then m_ml.
    _fields_ = [("ob_head", ctypes.c_byte * object.__basicsize__), ("m_ml", ctypes.POINTER(PyMethodDef))]


def read_list(path=LIST_FILE):
    """The hand-written list: {name: convention}."""
    entries = {}
    for number, line in enumerate(path.read_text(encoding="utf-8").splitlines(), 1):
        fields = line.split()
        if fields and not fields[0].startswith("#"):
            well_formed = len(fields) == 2 and fields[1] in CONVENTIONS.values() and fields[0] not in entries
            assert well_formed, f"{path.name} line {number} is malformed or names a function twice: {line!r}"
            entries[fields[0]] = fields[1]
    return entries


def module_functions():
    """The module's own builtin functions in its dictionary order: {name: function}."""
    functions = vars(_renderlib).items()
    return {name: f for name, f in functions if isinstance(f, types.BuiltinFunctionType) and f.__self__ is _renderlib}


def method_def(function):
    return PyCFunctionObjectPrefix.from_address(id(function)).m_ml.contents


def convention_name(flags):
    return CONVENTIONS.get(flags, f"unknown flags {flags:#x}")


@pytest.fixture(scope="module")
def table():
    # The module's method table, walked from its first entry to the null
    # entry: a list of (name, convention) in table order. What the tests rely
    # on is checked on the way: the functions' entries lie next to each other
    # in one array, ordered by address as the module dictionary is, and the
    # walked entries are the function objects' own.
    functions = module_functions()
    assert functions and all(method_def(f).ml_name.decode("ascii") == f.__name__ == n for n, f in functions.items())
    first = ctypes.addressof(method_def(next(iter(functions.values()))))
    array = (PyMethodDef * (len(functions) + 1)).from_address(first)  # read entry by entry, up to the null one
    walked = itertools.takewhile(lambda entry: entry.ml_name is not None, array)
    entries = [(entry.ml_name.decode("ascii"), convention_name(entry.ml_flags)) for entry in walked]
    assert entries == [(name, convention_name(method_def(f).ml_flags)) for name, f in functions.items()], (
        "the module's functions are not one contiguous array in dictionary order"
    )
    return entries


def test_the_module_s_table_equals_the_list(table):
    listed, found, names = read_list(), dict(table), [name for name, _ in table]
    report = {
        "in the list, missing from the module": set(listed) - set(found),
        "in the module, not in the list": set(found) - set(listed),
        "wrong calling convention": {
            f"{name}: listed {listed[name]}, module has {found[name]}"
            for name in set(listed) & set(found)
            if listed[name] != found[name]
        },
        "in the module's table more than once": {name for name in names if names.count(name) > 1},
    }
    report = [
        f"{title} ({len(items)}):\n    " + "\n    ".join(sorted(items)) for title, items in report.items() if items
    ]
    assert not report, "_renderlib's method table differs from method_table.txt:\n  " + "\n  ".join(report)


def test_swig_heads_the_table_and_what_a_host_makes_it_can_delete(table):
    names = [name for name, _ in table]
    assert table[0] == ("SWIG_PyInstanceMethod_New", "METH_O")  # SWIG 4.0.2 heads every table with its own
    made = {name[len("new_") :] for name in names if name.startswith("new_")}
    assert made == {name[: -len("_swiginit")] for name in names if name.endswith("_swiginit")}
    assert made <= {name[len("delete_") :] for name in names if name.startswith("delete_")}


def test_the_companion_package_defines_and_registers_the_module_s_classes_in_order(table):
    tree = ast.parse(pathlib.Path(renderlib.__file__).read_text(encoding="utf-8"))
    defined = [node.name for node in tree.body if isinstance(node, ast.ClassDef) and not node.name.startswith("_")]
    calls = [node.value for node in tree.body if isinstance(node, ast.Expr) and isinstance(node.value, ast.Call)]
    registering = [call for call in calls if getattr(call.func, "attr", "").endswith("_swigregister")]
    assert all(len(call.args) == 1 and call.func.attr == f"{call.args[0].id}_swigregister" for call in registering)
    in_table = [name[: -len("_swigregister")] for name, _ in table if name.endswith("_swigregister")]
    assert defined == [call.args[0].id for call in registering] == in_table and in_table
