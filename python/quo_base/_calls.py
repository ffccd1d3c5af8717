# SPDX-License-Identifier: Apache-2.0
"""Calls of the bindings that tell a wrong argument without their signatures, which are none of the package's."""

from __future__ import annotations

import functools
from typing import Any, Callable

from . import _core


def hide_signatures() -> None:
    """Wraps all calls of the bindings."""
    for name, held in list(vars(_core).items()):
        if isinstance(held, type):
            for method, call in list(vars(held).items()):
                if isinstance(call, staticmethod):
                    setattr(held, method, staticmethod(_plain(call.__func__, method)))
                elif callable(call) and (method == "__init__" or not method.startswith("_")):
                    setattr(held, method, _plain(call, name if method == "__init__" else method, 1))
        elif callable(held) and not name.startswith("_"):
            setattr(_core, name, _plain(held, name))


def _plain(call: Callable[..., Any], name: str, hidden: int = 0) -> Callable[..., Any]:
    """The call; the first `hidden` arguments are not told."""

    @functools.wraps(call, assigned=("__doc__",), updated=())
    def plain(*arguments: Any) -> Any:
        try:
            return call(*arguments)
        except TypeError as error:
            if "incompatible" not in str(error):
                raise
        kinds = ", ".join(type(each).__name__ for each in arguments[hidden:])
        raise TypeError(f"{name} cannot be done with arguments of these types or sizes: {kinds}")

    return plain
