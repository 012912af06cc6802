"""The container rules that differ from Python's own lists and dicts. The rest
of the containers' behaviour is SWIG's stock code and is not re-tested here."""
import pytest

import renderlib
from isolated import run_cleanly


def test_vector_rules_that_differ_from_lists():
    three = renderlib.float_vector([1, 2, 3])
    # A read slice that starts at or past the end starts at 0.
    assert tuple(three[5:10]) == (1.0, 2.0, 3.0)
    assert tuple(three[3:]) == (1.0, 2.0, 3.0)
    four = renderlib.float_vector([0, 1, 2, 3])
    with pytest.raises(ValueError, match="^attempt to assign sequence of size 1 to extended slice of size 2$"):
        four[::2] = [9]
    with pytest.raises(ValueError, match="^slice step cannot be zero$"):
        four[::0]
    four[1:3] = [7, 8, 9]
    assert list(four) == [0, 7, 8, 9, 3]
    assert three[-1] == 3.0
    with pytest.raises(IndexError, match="^index out of range$"):
        three[-4]
    with pytest.raises(IndexError, match="^pop from empty container$"):
        renderlib.float_vector().pop()


def test_element_conversions_are_strict():
    with pytest.raises(TypeError, match="^Wrong number or type of arguments for overloaded function 'new_bool_vector'"):
        renderlib.bool_vector([1, 0])
    assert list(renderlib.bool_vector([True, False])) == [True, False]
    with pytest.raises(TypeError, match="^Wrong number or type of arguments for overloaded function 'new_string_vector'"):
        renderlib.string_vector(["a", 5])


def test_value_map_rules():
    values = renderlib.value_map()
    with pytest.raises(IndexError, match="^key not found$"):
        values["radius"]
    values["radius"] = [2.5]
    values["center"] = (0.5, 0.25, 0)
    assert values.keys() == ["center", "radius"]  # key order, as lists
    assert values["center"] == (0.5, 0.25, 0.0)
    assert values.items() == [("center", (0.5, 0.25, 0.0)), ("radius", (2.5,))]
    del values["radius"]
    with pytest.raises(IndexError, match="^key not found$"):
        del values["radius"]


@pytest.mark.parametrize("vector", [renderlib.bool_vector, renderlib.string_vector, renderlib.float_vector,
                                    renderlib.genotype_vector, renderlib.param_vector])
def test_an_empty_vector_has_no_front_back_or_last_element_to_pop(vector):
    empty = vector()
    for method in ("front", "back", "pop_back"):
        with pytest.raises(IndexError, match="in method '%s_%s': the vector is empty" % (vector.__name__, method)):
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
