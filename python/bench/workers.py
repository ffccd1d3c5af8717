# SPDX-License-Identifier: Apache-2.0
"""A map on one and on two workers, what a tile costs beside its work, and what travels and stays in memory.

Usage: workers.py
"""

import pickle
import resource
import tempfile
import time
from contextlib import ExitStack
from statistics import median

from distributed import Client, LocalCluster
from quo_base import geocode
from scene import make_product, make_terrain, seconds

LINES, SAMPLES, PIXELS, TILE, TURNS = 4000, 4000, 768, 128, 7


def peak_mib():
    return resource.getrusage(resource.RUSAGE_SELF).ru_maxrss / 1024


def start(stack, count, first):
    """A client of so many workers, each of which has made a tile, so that the modules are loaded."""
    alone = {"threads_per_worker": 1, "dashboard_address": ":0"}
    cluster = stack.enter_context(LocalCluster(n_workers=count, **alone))
    client = stack.enter_context(Client(cluster, set_as_default=False))
    client.run(first)
    return client


def measured(client, wanted):
    """Seconds of a run by the clock, and the processor's seconds of the busiest worker."""
    busy = client.run(time.process_time)
    took = seconds(lambda: client.compute(wanted).result())
    return took, max(now - busy[worker] for worker, now in client.run(time.process_time).items())


def compare(one, two, whole):
    """One and two workers in turns, so that both see the same load; how many times as fast two are."""
    ratios = []
    for turn in range(TURNS):
        clients = (one, two) if turn % 2 == 0 else (two, one)
        found = {client: measured(client, whole) for client in clients}
        ratios.append([alone / shared for alone, shared in zip(found[one], found[two])])
        print("one worker: {:.2f} s, busy {:.2f} s;".format(*found[one]), end=" ")
        print("two: {:.2f} s, the busier {:.2f} s".format(*found[two]), flush=True)
    clock, busy = zip(*ratios)
    print(f"two workers beside one, median of {TURNS} turns: {median(clock):.2f} times as fast by the clock,"
          f" {median(busy):.2f} times by the processor's time of the busier")


def main():
    with tempfile.TemporaryDirectory() as folder, ExitStack() as stack:
        header = make_product(folder, LINES, SAMPLES)
        dem = make_terrain(folder, header, PIXELS)

        def tiles(size, resampling="sinc"):
            return geocode(header, dem, heights="ellipsoid", chunks=size, resampling=resampling).image

        whole, small = tiles(TILE), tiles(16, "bilinear")[:256, :256]

        def first():
            small[:16, :16].compute(scheduler="synchronous")

        one, two = (start(stack, count, first) for count in (1, 2))
        before = max(one.run(peak_mib).values())
        print(f"{whole.data.npartitions} tiles of {TILE} x {TILE}")
        compare(one, two, whole.mean())
        print(f"memory of a worker: {before:.0f} MiB before, {max(one.run(peak_mib).values()):.0f} MiB after")
        begun = time.process_time()
        small.compute(scheduler="synchronous")
        inside = time.process_time() - begun
        _, on_one = measured(one, small)
        print(f"a tile of 16 x 16, bilinear, processor's time: {1e3 * inside / 256:.2f} ms;"
              f" on a worker {1e3 * on_one / 256:.2f} ms")
        for plan in (whole.data, tiles(16).data):
            print(f"a plan of {plan.npartitions} tiles: {len(pickle.dumps(plan.dask))} bytes")


if __name__ == "__main__":
    main()
