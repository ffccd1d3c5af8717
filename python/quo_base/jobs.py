# SPDX-License-Identifier: Apache-2.0
"""Many products at a time: outputs that appear whole or not at all, on one machine or a cluster."""

from __future__ import annotations

import hashlib
import os
import re
import shutil
import socket
import sys
import time
import uuid
from contextlib import closing
from concurrent.futures import Executor, Future, ThreadPoolExecutor, as_completed
from typing import Any, Callable, Generator, Iterable, NamedTuple, Optional

__all__ = ["Job", "Outcome", "run"]


class Job(NamedTuple):
    """`function(path, *arguments)` makes an output, a file or a folder, at the path that it is given, which lies
    beside `output`; it then takes that name. Function and arguments travel to other processes: paths, not arrays.
    """

    output: str
    function: Callable[..., Any]
    arguments: tuple = ()


class Outcome(NamedTuple):
    """What became of a job."""

    output: str
    """Its output."""
    state: str
    """"made"; "skipped" where the output was there; "failed"."""
    reason: str
    """Why it failed, else empty."""


# --- Names of what is begun: OUTPUT.part- and 32 digits, for host (8), process (8) and run (8) of the caller and
# for the attempt (8), so that a run knows its own and those whose caller is gone.

_PART = re.compile(r"(.+)\.part-([0-9a-f]{24})[0-9a-f]{8}", re.DOTALL)


def _host() -> str:
    return hashlib.sha256(socket.gethostname().encode()).hexdigest()[:8]


def _new_run() -> str:
    return f"{_host()}{os.getpid():08x}{uuid.uuid4().hex[:8]}"


def _is_gone(run: str) -> bool:
    """Whether the caller of a run is known to be no more; of another host nothing is known."""
    if run[:8] != _host():
        return False
    try:
        os.kill(int(run[8:16], 16), 0)
    except (ProcessLookupError, OverflowError):
        return True
    except PermissionError:
        pass
    return False


def _sweep(outputs: set[str], run: str) -> None:
    """Removes what this run and those of callers that are gone have begun for these outputs."""
    for folder in {os.path.dirname(output) for output in outputs}:
        for name in os.listdir(folder) if os.path.isdir(folder) else ():
            path, found = os.path.join(folder, name), _PART.fullmatch(name)
            if found is None or path in outputs or os.path.join(folder, found[1]) not in outputs:
                continue
            if found[2] == run or _is_gone(found[2]):
                _remove(path)


def _remove(path: str) -> None:
    if os.path.isdir(path) and not os.path.islink(path):
        shutil.rmtree(path, ignore_errors=True)
    elif os.path.lexists(path):
        os.unlink(path)


def _make(job: Job, run: str) -> Outcome:
    """Makes an output under a name of its own, and renames it when it is whole."""
    if os.path.lexists(job.output):
        return Outcome(job.output, "skipped", "")
    path = f"{job.output}.part-{run}{uuid.uuid4().hex[:8]}"
    try:
        job.function(path, *job.arguments)
        if not os.path.lexists(path):
            raise FileNotFoundError(f"{job.function!r} has made nothing at {path}")
        os.rename(path, job.output)
    finally:
        _remove(path)
    return Outcome(job.output, "made", "")


def _tried(job: Job, tries: int, run: str) -> Outcome:
    for left in reversed(range(tries)):
        try:
            return _make(job, run)
        except (Exception, SystemExit) as error:  # whatever a job raises is its outcome
            reason = f"{type(error).__name__}: {error}"
            if left == 0:
                return Outcome(job.output, "failed", reason)
    raise ValueError("a job is tried once at least")


def _in_threads(jobs: list[Job], tries: int, run: str) -> Generator[Outcome, None, None]:
    pool: Executor
    with ThreadPoolExecutor() as pool:
        futures: list[Future[Outcome]] = [pool.submit(_tried, job, tries, run) for job in jobs]
        try:
            for future in as_completed(futures):
                yield future.result()
        finally:
            for future in futures:
                future.cancel()


def _on_cluster(client: Any, jobs: list[Job], tries: int, run: str) -> Generator[Outcome, None, None]:
    """Jobs of workers that are lost go to others; one that loses several workers has failed."""
    from distributed import as_completed as completed

    futures = {client.submit(_tried, job, tries, run, pure=False): job for job in jobs}
    try:
        for future in completed(list(futures)):
            error = future.exception()
            if error is None:
                yield future.result()
            else:
                yield Outcome(futures[future].output, "failed", f"{type(error).__name__}: {error}")
    finally:
        client.cancel(list(futures))


def _bar(done: int, count: int, failed: int, start: float) -> None:
    if sys.stderr.isatty():
        tail = f", {failed} failed" if failed else ""
        end = "\n" if done == count else ""
        sys.stderr.write(f"\r{done} of {count}{tail}, {time.monotonic() - start:.0f} s{end}")
        sys.stderr.flush()


def run(
    jobs: Iterable[Job],
    client: Any = None,
    tries: int = 2,
    progress: Optional[Callable[[int, int, int, float], None]] = _bar,
) -> list[Outcome]:
    """Makes outputs in parallel: on a distributed.Client, or on threads of this process.

    Outputs that are there are skipped, so that running again does what is left. Each output appears whole or not
    at all: jobs write beside it, under a name of their own, and what a killed worker has left there goes at the
    end, as does what runs left whose process on this host is gone. A job that raises is tried again, `tries` times
    in all. progress: called with the jobs done, all jobs, those that failed, and when it began (time.monotonic());
    None for none; what it raises ends the run once the jobs that were begun are done. Outcomes have the order of
    the jobs.
    """
    wanted = list(jobs)
    # Workers have folders of their own.
    absolute = [job._replace(output=os.path.abspath(job.output)) for job in wanted]
    outputs = {job.output for job in absolute}
    if len(outputs) != len(wanted):
        raise ValueError("two jobs have one output")
    start, found, failed, token = time.monotonic(), {}, 0, _new_run()
    made = _in_threads(absolute, tries, token) if client is None else _on_cluster(client, absolute, tries, token)
    try:
        with closing(made):  # what progress raises ends the rest
            for outcome in made:
                found[outcome.output] = outcome
                failed += outcome.state == "failed"
                if progress:
                    progress(len(found), len(wanted), failed, start)
    finally:
        _sweep(outputs, token)
    return [found[there.output]._replace(output=job.output) for job, there in zip(wanted, absolute)]
