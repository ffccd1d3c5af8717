# SPDX-License-Identifier: Apache-2.0
"""Exceptions of the package: each carries the library's status and what it wrote into its report."""

from __future__ import annotations

import os
from typing import NamedTuple, Optional

__all__ = ["Error", "FileError", "NumericError", "OutOfMemory", "Refused", "ReportEntry"]


class ReportEntry(NamedTuple):
    """An ERROR entry of the library's report."""

    message: str
    function: str
    file: str
    line: int


class Error(Exception):
    """A call of the library failed."""

    status: int = 1
    """1 refused, 4 short read, 5 short write, 7 no memory, 9 not opened, 10 no numeric solution, 12 not seen."""
    entry: Optional[ReportEntry] = None
    """What the call reported last; None where it reported nothing."""
    system_error: int = 0
    """The system's error number behind it; 0 where the system refused nothing."""


class Refused(Error, ValueError):
    """A bad argument, a wrong state, or something missing."""


class FileError(Error, OSError):
    """A file that cannot be opened, read or written whole."""


class OutOfMemory(Error, MemoryError):
    """Memory was short."""


class NumericError(Error, ArithmeticError):
    """Numbers without a solution."""


_TYPES = {4: FileError, 5: FileError, 7: OutOfMemory, 9: FileError, 10: NumericError, 12: NumericError}


def from_failure(
    status: int, doing: str, message: str, function: str, file: str, line: int, system_error: int
) -> Error:
    """The exception for a failed call; the bindings raise it."""
    kind = _TYPES.get(status, FileError if system_error else Refused)
    text = ": ".join(dict.fromkeys(reason for reason in (doing, message) if reason))
    cause = os.strerror(system_error) if system_error else ""
    text += f": {cause}" if cause not in text else ""
    error = kind(f"{text} (status {status})")
    error.status = status
    error.entry = ReportEntry(message, function, file, line) if message else None
    error.system_error = system_error
    if isinstance(error, OSError) and system_error:
        error.errno = system_error
    return error
