"""A method called on None (or on a null proxy) raises instead of crashing."""

from isolated import run_cleanly


# Calls every member function of every bound class with None for the
# object and for each further argument, for every argument count up to
# 13; a call either fails in conversion (TypeError), refuses the null
# object (ValueError) or, for an operator, answers NotImplemented. Run
# apart: a crash must not take the test session with it.
SWEEP = """
import inspect, _renderlib, renderlib

refused, refusals = 0, ("invalid null reference", "no display", "no image")
for cls in [c for c in vars(renderlib).values() if inspect.isclass(c) and hasattr(c, "thisown")]:
    prefix = cls.__name__ + "_"
    for member in [name[len(prefix):] for name in dir(_renderlib) if name.startswith(prefix)]:
        static = isinstance(inspect.getattr_static(cls, member, None), staticmethod)
        if static or member in ("swigregister", "swiginit"):
            continue
        for count in range(1, 14):
            try:
                result = getattr(_renderlib, prefix + member)(*[None] * count)
            except ValueError as error:
                assert any(text in str(error) for text in refusals), (member, error)
                refused += 1
                break
            except TypeError:
                continue
            # binary operators answer an operand they cannot take with NotImplemented
            assert result is NotImplemented, "%s(None, ...) returned %r" % (member, result)
            break
print(refused)
"""


def test_every_method_refuses_a_null_object():
    out = run_cleanly(SWEEP, timeout=120)
    assert int(out) > 300  # most members reach the check; the rest refuse None earlier
