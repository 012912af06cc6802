"""The constants the module registers at import: the engine's enumerations with the engine's values, all of them
published again by the companion package, and an import that registers without calling the engine."""

import pathlib
import re

import _renderlib
import renderlib
from isolated import run_cleanly

ENGINE_API = pathlib.Path(__file__).resolve().parents[2] / "engine-api"

# Enumerations of the engine the module does not register, and why.
NOT_REGISTERED = {"const_format_tag": "declared without members: Param.format() gives the number"}


def module_constants():
    items = vars(_renderlib).items()
    return {name: value for name, value in items if isinstance(value, (int, str)) and not name.startswith("__")}


def engine_enumerations():
    """{enumeration: {member as the module names it: value}} from the engine's
    headers; a scoped enumeration's members take its name as a prefix."""
    found = {}
    for header in ENGINE_API.rglob("*.h"):
        source = re.sub(r"//[^\n]*|/\*.*?\*/", "", header.read_text(), flags=re.S)
        for scoped, name, body in re.findall(r"\benum\s+(class\s+)?(\w+)[^{;]*\{(.*?)\}", source, re.S):
            members, value = {}, -1
            for item in filter(None, (part.strip() for part in body.split(","))):
                member, _, given = item.partition("=")
                value = int(given, 0) if given.strip() else value + 1
                members[(name + "_" if scoped else "") + member.strip()] = value
            found[name] = members
    return found


def test_every_engine_enumeration_is_registered_whole_with_the_engines_values():
    constants, enumerations = module_constants(), engine_enumerations()
    assert set(NOT_REGISTERED) <= set(enumerations) and len(enumerations) > len(NOT_REGISTERED)
    for name, members in enumerations.items():
        if name not in NOT_REGISTERED:
            assert {member: constants.get(member) for member in members} == members, name


def test_the_companion_package_publishes_every_constant():
    assert {name: getattr(renderlib, name, "missing") for name in module_constants()} == module_constants()
    # Every effect's name starts with the prefix: tests/catalogue/test_catalogue.py.
    assert len(_renderlib.PLUGIN_NAME_PREFIX) == _renderlib.PLUGIN_NAME_PREFIX_LEN > 0


def test_import_publishes_the_type_registry_and_calls_no_engine_function():
    # A fresh interpreter, so the registry and the call log start empty.
    out = run_cleanly("""
        import ctypes, sys, _renderlib
        from engine_probe import EngineProbe
        registry = sys.modules['swig_runtime_data4'].type_pointer_capsule
        ctypes.pythonapi.PyCapsule_GetName.restype = ctypes.c_char_p
        ctypes.pythonapi.PyCapsule_GetName.argtypes = [ctypes.py_object]
        print(ctypes.pythonapi.PyCapsule_GetName(registry).decode())
        print(EngineProbe().calls())
    """)
    assert out.splitlines() == ["swig_runtime_data4.type_pointer_capsule", "[]"]
