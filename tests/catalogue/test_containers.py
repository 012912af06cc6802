"""The container rules that differ from Python's own lists and dicts. The rest
of the containers' behaviour is SWIG's stock code and is not re-tested here."""

import random

import pytest

import renderlib
from isolated import run_cleanly


def test_vector_rules_that_differ_from_lists():
    # Which elements a slice selects: test_slices_follow_the_two_stage_rule.
    three, four = renderlib.float_vector([1, 2, 3]), renderlib.float_vector([0, 1, 2, 3])
    with pytest.raises(ValueError, match="^slice step cannot be zero$"):
        four[::0]
    assert three[-1] == 3.0
    with pytest.raises(IndexError, match="^index out of range$"):
        three[-4]


def test_an_element_that_does_not_convert_is_named_by_its_position():
    # For the overloaded constructors too: the element's own message, then where it stands.
    for make, values, message in (
        (renderlib.bool_vector, [1, 0], "bool in sequence element 0 "),
        (renderlib.string_vector, ["a", 5], "std::string in sequence element 1 "),
        (renderlib.float_vector, [1.0, "x"], "float in sequence element 1 "),
        (renderlib.param_vector, [None, 3], "Param in sequence element 1 "),
    ):
        with pytest.raises(TypeError) as raised:
            make(values)
        assert str(raised.value) == message
    assert list(renderlib.bool_vector([True, False])) == [True, False]
    v, values = renderlib.float_vector([1, 2]), renderlib.value_map()
    for assign in (lambda: v.__setitem__(slice(0, 1), [3, None]), lambda: values.__setitem__("radius", [2, None])):
        with pytest.raises(TypeError, match="^float in sequence element 1 $"):
            assign()
    assert list(v) == [1.0, 2.0] and len(values) == 0  # nothing changed


def test_value_map_rules():
    values = renderlib.value_map()
    values["radius"] = [2.5]
    values["center"] = (0.5, 0.25, 0)
    assert values.keys() == ["center", "radius"]  # key order, as lists
    assert values["center"] == (0.5, 0.25, 0.0)
    assert values.items() == [("center", (0.5, 0.25, 0.0)), ("radius", (2.5,))]
    del values["radius"]
    assert values.keys() == ["center"]


@pytest.mark.parametrize("vector", "bool_vector string_vector float_vector genotype_vector param_vector".split())
def test_an_empty_vector_has_no_front_back_or_last_element_to_pop(vector):
    empty = getattr(renderlib, vector)()
    for method in ("front", "back", "pop_back"):
        with pytest.raises(IndexError, match="in method '%s_%s': the vector is empty" % (vector, method)):
            getattr(empty, method)()
    assert len(empty) == 0


def test_a_vector_asked_for_more_than_it_can_hold_raises_memory_error():
    # In a process of its own: an escaping length error ends the process.
    out = run_cleanly("""
        import renderlib
        TOO_MANY = 2 ** 64 - 1
        for kind, element in ((renderlib.bool_vector, True), (renderlib.string_vector, "a"),
                              (renderlib.float_vector, 1.0), (renderlib.param_vector, None)):
            v = kind([element])
            for ask in (lambda: v.reserve(TOO_MANY), lambda: v.resize(TOO_MANY), lambda: kind(TOO_MANY),
                        lambda: v.assign(TOO_MANY, element), lambda: v.insert(v.begin(), TOO_MANY, element)):
                try:
                    ask()
                except MemoryError:
                    print("refused", list(v) == [element])
    """)
    assert out.split() == ["refused", "True"] * 20


def resolved(start, stop, step, n, inserting):
    """The indices a slice selects in a vector of n, by the module's two-stage
    rule: the interpreter's slice arithmetic (its error result ignored), then
    the module's bounds, where a start at or past the end is the end for an
    assignment and 0 for a read or a delete."""
    step = 1 if step is None else step
    i = (n - 1 if step < 0 else 0) if start is None else start + (n if start < 0 else 0)
    j = (-1 if step < 0 else n) if stop is None else stop + (n if stop < 0 else 0)
    if step > 0:
        i = 0 if i < 0 else i if i < n else n if inserting else 0
        j = max(0 if j < 0 else min(j, n), i)
    else:
        i = -1 if i < -1 else n - 1 if i >= n else i
        j = -1 if j < -1 else min(j, n - 1)
        i = max(i, j)
    return i, j, list(range(i, j, step))


def test_slices_follow_the_two_stage_rule():
    rng = random.Random(2026)
    bound = lambda: rng.choice([None, rng.randint(-12, 12)])  # noqa: E731
    for _ in range(3000):
        n = rng.randint(0, 8)
        start, stop, step = bound(), bound(), rng.choice([None, 1, 1, 2, 3, -1, -2, -3])
        items = [float(k) for k in range(n)]
        v = renderlib.float_vector(items)
        _, _, read = resolved(start, stop, step, n, False)
        assert list(v[start:stop:step]) == [items[k] for k in read], (n, start, stop, step)
        del v[start:stop:step]
        assert list(v) == [x for k, x in enumerate(items) if k not in read], ("del", n, start, stop, step)
        v = renderlib.float_vector(items)
        i, j, written = resolved(start, stop, step, n, True)
        new = [100.0 + k for k in range(rng.randint(0, 4) if step in (None, 1) else len(written))]
        v[start:stop:step] = new
        expected = list(items)
        if step in (None, 1):
            expected[i:j] = new
        else:
            for k, value in zip(written, new):
                expected[k] = value
        assert list(v) == expected, ("set", n, start, stop, step, new)
        # The two-bound forms: no counting from the end, step 1.
        i, j = rng.randint(-3, 10), rng.randint(-3, 10)
        v = renderlib.float_vector(items)
        assert list(v.__getslice__(i, j)) == [items[k] for k in resolved(max(i, 0), max(j, 0), 1, n, False)[2]]
        v.__delslice__(i, j)
        assert list(v) == [x for k, x in enumerate(items) if k not in resolved(max(i, 0), max(j, 0), 1, n, False)[2]]


def test_a_slice_set_without_a_value_deletes_and_from_past_the_end_from_the_start():
    # A slice deleted or assigned from past the end: test_slices_follow_the_two_stage_rule.
    v = renderlib.float_vector(range(8))
    v.__setitem__(slice(9, 2))
    assert list(v) == [2.0, 3.0, 4.0, 5.0, 6.0, 7.0]
