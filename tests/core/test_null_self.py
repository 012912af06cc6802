"""A method called on None (or on a null proxy) raises instead of crashing."""
import pytest

import _renderlib
from isolated import run_cleanly


def test_every_method_refuses_a_null_object():
    # Calls every member function of every bound class with None for the
    # object and for each further argument, for every argument count up to
    # 13; a call either fails in conversion (TypeError), refuses the null
    # object (ValueError) or, for an operator, answers NotImplemented. Run
    # apart: a crash must not take the test session with it.
    out = run_cleanly("""
        import inspect
        import _renderlib, renderlib

        refused = 0
        classes = [c for c in vars(renderlib).values() if inspect.isclass(c) and hasattr(c, "thisown")]
        for cls in classes:
            prefix = cls.__name__ + "_"
            for name in dir(_renderlib):
                member = name[len(prefix):]
                if not name.startswith(prefix) or member in ("swigregister", "swiginit") or \\
                        isinstance(inspect.getattr_static(cls, member, None), staticmethod):
                    continue
                function = getattr(_renderlib, name)
                for count in range(1, 14):
                    try:
                        result = function(*[None] * count)
                    except ValueError as error:
                        assert "invalid null reference" in str(error) or "no display" in str(error) \\
                            or "no image" in str(error), (name, error)
                        refused += 1
                        break
                    except TypeError:
                        continue
                    # binary operators answer an operand they cannot take with NotImplemented
                    assert result is NotImplemented, "%s(None, ...) returned %r" % (name, result)
                    break
        print(refused)
    """, timeout=120)
    assert int(out) > 300  # most members reach the check; the rest refuse None earlier


def test_the_refusal_names_function_and_type():
    with pytest.raises(ValueError) as raised:
        _renderlib.T_RasterInfo_ds_xsize_get(None)
    assert str(raised.value) == \
        "invalid null reference in method 'T_RasterInfo_ds_xsize_get', argument 1 of type 'T_RasterInfo *'"
