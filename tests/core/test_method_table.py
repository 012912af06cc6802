"""The module's method table against the hand-written list in method_table.txt.

method_table.txt lists every function of _renderlib with its calling
convention, as the binding's interface tables give them.  The table itself
is read from the built module: every function object of the module is a
builtin function whose PyMethodDef entry points into the module's one static
method table, so the entries are read in place through ctypes (name and
ml_flags), and the table is walked from its first entry to the terminating
null entry.
"""
import ast
import ctypes
import pathlib
import types

import pytest

import _renderlib
import renderlib

LIST_FILE = pathlib.Path(__file__).with_name("method_table.txt")

METH_VARARGS = 0x0001
METH_NOARGS = 0x0004
METH_O = 0x0008
CONVENTIONS = {METH_VARARGS: "METH_VARARGS", METH_O: "METH_O", METH_NOARGS: "METH_NOARGS"}

# The registered classes, in the order the module registers them.
REGISTERED_CLASSES = (
    "SwigPyIterator", "LoadFrameInterface", "ValueArray", "ShortInputArray",
    "bool_vector", "string_vector", "float_vector", "genotype_vector", "param_vector", "value_map",
    "EffectGlobals_t", "Genotype", "effect_def", "ParamFlags", "Param",
    "T_RasterInfo", "T_RenderInfo", "RenderContext", "Plugin_Info",
    "MessageHeader_t", "ShmemTransport", "ShmemManager", "EM_XIImage", "EM_Display", "GfxInterface",
)

TOTALS = {"METH_VARARGS": 215, "METH_O": 338, "METH_NOARGS": 23}
N_ENTRIES = 576
N_CONSTRUCTIBLE = 18  # new_<Class> and <Class>_swiginit
N_DESTROYABLE = 23    # delete_<Class>


class PyMethodDef(ctypes.Structure):
    _fields_ = [
        ("ml_name", ctypes.c_char_p),
        ("ml_meth", ctypes.c_void_p),
        ("ml_flags", ctypes.c_int),
        ("ml_doc", ctypes.c_char_p),
    ]


class PyCFunctionObjectPrefix(ctypes.Structure):
    # PyObject_HEAD (its size taken from the running interpreter), then m_ml.
    _fields_ = [
        ("ob_head", ctypes.c_byte * object.__basicsize__),
        ("m_ml", ctypes.POINTER(PyMethodDef)),
    ]


# ------------------------------------------------------------------ reading

def read_list(path=LIST_FILE):
    """The hand-written list: {name: convention}, in file order."""
    entries = {}
    problems = []
    for number, line in enumerate(path.read_text(encoding="utf-8").splitlines(), 1):
        text = line.strip()
        if not text or text.startswith("#"):
            continue
        fields = text.split()
        if len(fields) != 2 or fields[1] not in CONVENTIONS.values():
            problems.append(f"line {number}: {line!r}")
        elif fields[0] in entries:
            problems.append(f"line {number}: {fields[0]} listed twice")
        else:
            entries[fields[0]] = fields[1]
    assert not problems, f"{path.name} is malformed:\n  " + "\n  ".join(problems)
    return entries


def module_functions():
    """The module's own builtin functions in its dictionary order: {name: function}."""
    return {name: value for name, value in vars(_renderlib).items()
            if isinstance(value, types.BuiltinFunctionType) and value.__self__ is _renderlib}


def method_def(function):
    return PyCFunctionObjectPrefix.from_address(id(function)).m_ml.contents


def convention_name(flags):
    return CONVENTIONS.get(flags, f"unknown flags {flags:#x}")


def walk_table(first):
    """The entries of the static table from `first` up to the null entry:
    a list of (name, convention, address)."""
    entries = []
    address = ctypes.addressof(first)
    while True:
        entry = PyMethodDef.from_address(address)
        if entry.ml_name is None:
            return entries
        entries.append((entry.ml_name.decode("ascii"), convention_name(entry.ml_flags), address))
        address += ctypes.sizeof(PyMethodDef)
        assert len(entries) <= 10_000, "no terminating entry found"


@pytest.fixture(scope="module")
def table():
    """The module's method table in table order: a list of (name, convention)."""
    functions = module_functions()
    first = min((method_def(f) for f in functions.values()), key=ctypes.addressof)
    return [(name, convention) for name, convention, _ in walk_table(first)]


# ---------------------------------------------------------------- reporting

def differences(expected, actual):
    """Readable differences between the list {name: convention} and the
    table [(name, convention)]; empty when they are equal."""
    report = []
    seen = {}
    for name, convention in actual:
        seen.setdefault(name, []).append(convention)
    twice = sorted(name for name, conventions in seen.items() if len(conventions) > 1)
    missing = sorted(set(expected) - set(seen))
    extra = sorted(set(seen) - set(expected))
    wrong = sorted(f"{name}: listed {expected[name]}, module has {seen[name][0]}"
                   for name in set(expected) & set(seen) if expected[name] != seen[name][0])
    for title, names in (("in the list, missing from the module", missing),
                         ("in the module, not in the list", extra),
                         ("wrong calling convention", wrong),
                         ("in the module's table more than once", twice)):
        if names:
            report.append(f"{title} ({len(names)}):\n    " + "\n    ".join(names))
    return report


def family_counts(names):
    return {
        "swigregister": sum(name.endswith("_swigregister") for name in names),
        "swiginit": sum(name.endswith("_swiginit") for name in names),
        "new": sum(name.startswith("new_") for name in names),
        "delete": sum(name.startswith("delete_") for name in names),
    }


def convention_totals(conventions):
    totals = dict.fromkeys(TOTALS, 0)
    for convention in conventions:
        totals[convention] = totals.get(convention, 0) + 1
    return totals


# -------------------------------------------------------------------- tests

def test_the_table_is_one_contiguous_array_in_dictionary_order(table):
    """What the other tests rely on: the functions' entries lie next to each
    other in one array, ordered by address as the module dictionary is, and
    the walked entries are the function objects' own."""
    functions = module_functions()
    assert functions, "no builtin functions in _renderlib"
    for name, function in functions.items():
        assert function.__name__ == name
        assert method_def(function).ml_name.decode("ascii") == name
    by_address = sorted(functions, key=lambda name: ctypes.addressof(method_def(functions[name])))
    addresses = [ctypes.addressof(method_def(functions[name])) for name in by_address]
    steps = {b - a for a, b in zip(addresses, addresses[1:])}
    assert steps == {ctypes.sizeof(PyMethodDef)}, "the entries are not one contiguous array"
    assert by_address == list(functions), "address order differs from the dictionary order"
    # every entry of the table is reachable from the module as a function
    assert [name for name, _ in table] == list(functions)
    for name, convention in table:
        assert convention == convention_name(method_def(functions[name]).ml_flags)


def test_the_module_s_table_equals_the_list(table):
    report = differences(read_list(), table)
    assert not report, "_renderlib's method table differs from method_table.txt:\n  " + "\n  ".join(report)


def test_the_module_s_totals(table):
    assert table[0] == ("SWIG_PyInstanceMethod_New", "METH_O")  # SWIG 4.0.2 heads every table with its own
    assert len(table) == N_ENTRIES
    assert convention_totals(convention for _, convention in table) == TOTALS
    assert family_counts([name for name, _ in table]) == {
        "swigregister": len(REGISTERED_CLASSES), "swiginit": N_CONSTRUCTIBLE,
        "new": N_CONSTRUCTIBLE, "delete": N_DESTROYABLE}


def test_classes_are_registered_in_order(table):
    registered = [name[:-len("_swigregister")] for name, _ in table if name.endswith("_swigregister")]
    assert registered == list(REGISTERED_CLASSES)


def test_the_companion_module_defines_and_registers_classes_in_order():
    tree = ast.parse(pathlib.Path(renderlib.__file__).read_text(encoding="utf-8"))
    defined, registered = [], []
    for node in tree.body:
        if isinstance(node, ast.ClassDef) and not node.name.startswith("_"):
            defined.append(node.name)
        elif (isinstance(node, ast.Expr) and isinstance(node.value, ast.Call)
              and isinstance(node.value.func, ast.Attribute)
              and node.value.func.attr.endswith("_swigregister")):
            (argument,) = node.value.args
            assert node.value.func.attr == f"{argument.id}_swigregister"
            registered.append(argument.id)
    assert registered == list(REGISTERED_CLASSES)
    assert defined == list(REGISTERED_CLASSES)
