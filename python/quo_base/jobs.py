"""Many products at a time: outputs that appear whole or not at all, on one machine or a cluster."""

from __future__ import annotations

import glob
import os
import shutil
import sys
import time
import uuid
from concurrent.futures import Executor, Future, ThreadPoolExecutor, as_completed
from typing import Any, Callable, Iterable, Iterator, NamedTuple, Optional

__all__ = ["Job", "Outcome", "run"]


class Job(NamedTuple):
    """`function(path, *arguments)` makes an output, a file or a folder, at the path that it is given, which lies
    beside `output`; it then takes that name. Function and arguments travel to other processes: paths, not arrays."""

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


def _begun(output: str) -> list[str]:
    return glob.glob(glob.escape(output) + ".part-*")


def _remove(path: str) -> None:
    if os.path.isdir(path) and not os.path.islink(path):
        shutil.rmtree(path, ignore_errors=True)
    elif os.path.lexists(path):
        os.unlink(path)


def _make(job: Job) -> Outcome:
    """Makes an output under a name of its own, and renames it when it is whole."""
    if os.path.lexists(job.output):
        return Outcome(job.output, "skipped", "")
    path = f"{job.output}.part-{uuid.uuid4().hex}"
    try:
        job.function(path, *job.arguments)
        if not os.path.lexists(path):
            raise FileNotFoundError(f"{job.function.__name__}() has made nothing at {path}")
        os.rename(path, job.output)
    finally:
        _remove(path)
    return Outcome(job.output, "made", "")


def _tried(job: Job, tries: int) -> Outcome:
    for left in reversed(range(tries)):
        try:
            return _make(job)
        except Exception as error:  # whatever a job raises is its outcome
            reason = f"{type(error).__name__}: {error}"
            if left == 0:
                return Outcome(job.output, "failed", reason)
    raise ValueError("a job is tried once at least")


def _in_threads(jobs: list[Job], tries: int) -> Iterator[Outcome]:
    pool: Executor
    with ThreadPoolExecutor() as pool:
        futures: list[Future[Outcome]] = [pool.submit(_tried, job, tries) for job in jobs]
        try:
            for future in as_completed(futures):
                yield future.result()
        finally:
            for future in futures:
                future.cancel()


def _on_cluster(client: Any, jobs: list[Job], tries: int) -> Iterator[Outcome]:
    """Jobs of workers that are lost go to others; one that loses several workers has failed."""
    from distributed import as_completed as completed

    futures = {client.submit(_tried, job, tries, pure=False): job for job in jobs}
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

    Outputs that are there are skipped, so that running again does what is left. Each output appears whole or not at
    all: jobs write beside it, under a name of their own, and what a killed worker has left there goes at the end.
    A job that raises is tried again, `tries` times in all. progress: called with the jobs done, all jobs, those
    that failed, and when it began (time.monotonic()); None for none. Outcomes have the order of the jobs.
    """
    wanted = list(jobs)
    outputs = [job.output for job in wanted]
    if len(set(outputs)) != len(outputs):
        raise ValueError("two jobs have one output")
    start, found, failed = time.monotonic(), {}, 0
    made = _in_threads(wanted, tries) if client is None else _on_cluster(client, wanted, tries)
    try:
        for outcome in made:
            found[outcome.output] = outcome
            failed += outcome.state == "failed"
            if progress:
                progress(len(found), len(wanted), failed, start)
    finally:
        for output in outputs:
            for path in _begun(output):
                _remove(path)
    return [found[output] for output in outputs]
