"""Iterators of the containers: used after their container changed, given to
another container, moved past either end or kept after their container went,
they raise instead of reading or writing freed memory. Each case runs in a
process of its own, as such a use crashes a module without the checks."""

import pytest

from isolated import run_cleanly

ELEMENTS = {
    "bool_vector": "[True, False, True]",
    "string_vector": "['a', 'b', 'c']",
    "float_vector": "[1.0, 2.0, 3.0]",
    "genotype_vector": "[None, None, None]",
    "param_vector": "[None, None, None]",
}

REPORT = """
import gc
import renderlib

def report(use):
    try:
        print("ok", use())
    except BaseException as error:
        print(type(error).__name__, str(error).rsplit(": ", 1)[-1] or "-")
"""


@pytest.mark.parametrize("vector", sorted(ELEMENTS))
def test_vector_iterators_refuse_every_use_that_would_leave_the_vector(vector):
    out = run_cleanly(
        REPORT
        + """
elements = %(elements)s
v, other = renderlib.%(vector)s(elements), renderlib.%(vector)s(elements)
kept = v.begin()
v.append(elements[0])
report(lambda: next(kept))                # stale: the vector grew
report(lambda: v.erase(kept))
report(lambda: v.insert(kept, elements[0]))
v.pop()
report(lambda: kept.value() == elements[0])  # the old size again: an index, still inside
report(lambda: v.erase(v.end()))
report(lambda: v.erase(other.begin()))
report(lambda: v.erase(v.end(), v.begin()))
report(lambda: v.begin() == other.begin())
report(lambda: v.begin().distance(other.begin()))
report(lambda: v.end() - v.begin())
report(lambda: v.end() - v.rbegin())      # of another kind
report(lambda: v.end().next())
report(lambda: v.begin().decr())
def growing_loop():
    for element in v:
        v.append(element)
report(growing_loop)
walk, backwards = v.rbegin(), []
while True:
    try:
        backwards.append(walk.next())
    except StopIteration:
        break
report(lambda: backwards == list(reversed(list(v))))
report(lambda: (v.erase(v.begin(), v.end()) == v.end(), len(v)))
alive = other.begin()
del other
gc.collect()
report(lambda: alive.value() == elements[0])
"""
        % {"vector": vector, "elements": ELEMENTS[vector]}
    )
    stale = "RuntimeError %s changed size since the iterator was made" % vector
    assert out.splitlines() == [stale] * 3 + [
        "ok True",
        "IndexError the iterator is past the last element",
        "ValueError an iterator of another container",
        "IndexError the first iterator is after the last",
        "ok False",
        "ValueError iterators of different containers",
        "ok 3",
        "TypeError 'SwigPyIterator' and 'SwigPyIterator'",
        "StopIteration -",
        "StopIteration -",
        stale,
        "ok True",
        "ok (True, 0)",
        "ok True",
    ]


def test_value_map_iterators_refuse_a_changed_map():
    out = run_cleanly(
        REPORT
        + """
values = renderlib.value_map()
values["a"], values["b"] = [1], [2]
keys = values.key_iterator()
report(lambda: next(keys))
values["c"] = [3]
report(lambda: next(keys))                # stale: a key was added
keys = values.key_iterator()
del values["a"]
values["z"] = [0]
report(lambda: next(keys))                # same size, but its key has gone
report(lambda: values.erase(values.end()))
report(lambda: values.erase(renderlib.value_map().begin()))
def growing_loop():
    for key in values:
        values[key + "+"] = [1]
report(growing_loop)
walk = values.rbegin()
report(lambda: (walk.next(), walk.next()))
items = values.value_iterator()
report(lambda: next(items))
values.erase(values.begin())
report(lambda: list(values))
"""
    )
    assert out.splitlines() == [
        "ok a",
        "RuntimeError value_map changed size since the iterator was made",
        "RuntimeError value_map changed since the iterator was made",
        "IndexError the iterator is past the last element",
        "ValueError an iterator of another container",
        "RuntimeError value_map changed size since the iterator was made",
        "ok (('z', (0.0,)), ('c', (3.0,)))",
        "ok (2.0,)",
        "ok ['b+', 'c', 'z']",
    ]
