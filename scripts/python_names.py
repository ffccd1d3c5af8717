# SPDX-License-Identifier: Apache-2.0
"""Prints docs/python_names.md: every name of the Python package with the first sentence of its documentation.

Usage: PYTHONPATH=build/release/python /usr/bin/python3 scripts/python_names.py > docs/python_names.md
"""

import inspect
import re

import quo_base

HEAD = """# Python, name by name

Every name of the package, as its own documentation begins; `help()` has the rest, and
[python.md](python.md) shows how they go together. `scripts/python_names.py` makes this page.

| name in `quo_base` | what |
|---|---|
"""


def sentence(thing):
    if isinstance(thing, dict):
        return "One of: " + ", ".join(thing)
    text = " ".join((inspect.getdoc(thing) or "").split("\n\n")[0].split()).replace("|", "\\|").replace("`", "")
    return re.match(r"(.*?)(?:\.(?= [A-Z])|[.:;]?$)", text)[1]


def members(kind):
    """What a class has of its own, apart from constants and the plain fields of tuples."""
    for name, member in vars(kind).items():
        told = isinstance(member, (property, classmethod, staticmethod)) or inspect.isfunction(member)
        if told and not name.startswith("_") and inspect.getdoc(member):
            yield name, member


def rows():
    for name in sorted(quo_base.__all__, key=str.lower):
        thing = getattr(quo_base, name)
        yield name, thing
        if inspect.ismodule(thing):
            inner = [(each, getattr(thing, each)) for each in sorted(thing.__all__, key=str.lower)]
            yield from ((f"{name}.{each}", one) for each, one in inner if not hasattr(quo_base, each))
        elif inspect.isclass(thing):
            yield from ((f"{name}.{each}", one) for each, one in members(thing))


def page():
    return HEAD + "".join(f"| `{name}` | {sentence(thing)} |\n" for name, thing in rows())


if __name__ == "__main__":
    print(page(), end="")
