# SPDX-License-Identifier: Apache-2.0
"""Parameter files of sections and keys."""

from __future__ import annotations

import os
from collections.abc import Sequence
from typing import Any, Union

import numpy as np

from . import _core
from ._paths import file_name

__all__ = ["ParameterFile"]

Key = tuple[str, str]


class ParameterFile:
    """A parameter file: `file["Section", "Key"]` is the text of a value, KeyError where it is not there.

    Files stay in memory for the whole process from their first use on, known by the text of their name; changes
    reach the disk by save(). A file that is missing is an empty one.
    """

    def __init__(self, path: Union[str, os.PathLike]) -> None:
        self.path = file_name(path)

    def __repr__(self) -> str:
        return f"<ParameterFile {self.path}>"

    def __getitem__(self, key: Key) -> str:
        return _core.parameter_text(self.path, *key)

    def __contains__(self, key: Key) -> bool:
        try:
            self[key]
        except KeyError:
            return False
        return True

    def numbers(self, section: str, key: str, count: int = 1) -> np.ndarray:
        """The first `count` numbers of a list, float64; KeyError where there are fewer."""
        return np.array(_core.parameter_numbers(self.path, section, key, count))

    def __setitem__(self, key: Key, value: Any) -> None:
        """Sets a text of one line as it stands, a number, or a list of numbers, with 15 digits."""
        for text in (*key, value):
            if isinstance(text, str) and set("\r\n\0") & set(text):
                raise ValueError("a parameter is one line, without zeros")
        if isinstance(value, str):
            _core.set_parameter_text(self.path, *key, value)
            return
        numbers = np.asarray(value)
        if numbers.ndim > 1 or numbers.dtype.kind not in "iuf":
            raise TypeError("a text, a number or a list of numbers is needed")
        values = numbers.ravel().tolist()
        if numbers.dtype.kind == "f":
            _core.set_parameter_numbers(self.path, *key, values)
        else:
            _core.set_parameter_integers(self.path, *key, values)
        if not isinstance(value, (Sequence, np.ndarray)):
            _core.set_parameter_text(self.path, *key, self[key].strip("{}"))

    def __delitem__(self, key: Key) -> None:
        if key not in self:
            raise KeyError(key)
        _core.delete_parameter(self.path, *key)

    def save(self) -> None:
        """Writes the file; the old one stays whole where this fails."""
        _core.save_parameters(self.path)

    def forget(self) -> None:
        """Drops what is in memory: the next use reads the file again."""
        _core.forget_parameters(self.path)
