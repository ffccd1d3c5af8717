# SPDX-License-Identifier: Apache-2.0
"""Names of files as the library takes them."""

from __future__ import annotations

import os
from typing import Any


def absolute(name: str) -> str:
    """A file's name for other processes, whose folders are others; names of what is no file stay."""
    return os.path.abspath(name) if os.path.exists(name) else name


def file_name(path: Any) -> str:
    """A path as text; refused where the library would cut it short or could not read it."""
    name = os.fsdecode(path)
    if "\0" in name:
        raise ValueError("a file name without zeros is needed")
    if not name.isprintable():
        name.encode()  # parts that are no UTF-8 are a UnicodeEncodeError
    return name
