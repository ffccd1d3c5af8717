"""A map on one and on two workers, what a tile costs beside its work, and what travels and stays in memory.

Usage: workers.py
"""

import pickle
import resource
import tempfile
import time

from distributed import Client, LocalCluster
from quo_base import geocode
from scene import make_product, make_terrain, seconds

LINES, SAMPLES, PIXELS, TILE = 4000, 4000, 768, 128


def peak_mib():
    return resource.getrusage(resource.RUSAGE_SELF).ru_maxrss / 1024


def on_workers(count, first, doing):
    """Seconds of a run, after one that loads the modules; the processor's seconds of the busiest worker; and the
    workers' memory before and after, MiB."""
    alone = {"threads_per_worker": 1, "dashboard_address": ":0"}
    with LocalCluster(n_workers=count, **alone) as cluster, Client(cluster) as client:
        client.run(first)
        before, busy = max(client.run(peak_mib).values()), client.run(time.process_time)
        took = seconds(doing)
        spent = [now - busy[worker] for worker, now in client.run(time.process_time).items()]
        print("processor's seconds of each worker:", *(f"{each:.2f}" for each in spent))
        most = max(spent)
        return took, most, before, max(client.run(peak_mib).values())


def main():
    with tempfile.TemporaryDirectory() as folder:
        header = make_product(folder, LINES, SAMPLES)
        dem = make_terrain(folder, header, PIXELS)

        def tiles(size, resampling="sinc"):
            return geocode(header, dem, heights="ellipsoid", chunks=size, resampling=resampling).image

        whole, small = tiles(TILE), tiles(16, "bilinear")[:256, :256]
        count = whole.data.npartitions

        def first():
            small[:16, :16].compute(scheduler="synchronous")

        one = None
        for workers in (1, 2):
            took, most, before, after = on_workers(workers, first, lambda: whole.mean().compute())
            one = one or (took, most)
            print(f"{workers} worker(s): {count} tiles of {TILE} x {TILE} in {took:.2f} s,"
                  f" {one[0] / took:.2f} times as fast as one; processor's time of the busiest {most:.2f} s, one: {one[1] / most:.2f} times;"
                  f" {before:.0f} MiB before, {after:.0f} MiB after", flush=True)
        start = time.process_time()
        small.compute(scheduler="synchronous")
        inside = time.process_time() - start
        _, on_one, _, _ = on_workers(1, first, lambda: small.compute())
        print(f"a tile of 16 x 16, bilinear, processor's time: {1e3 * inside / 256:.2f} ms;"
              f" on a worker {1e3 * on_one / 256:.2f} ms")
        for plan in (whole.data, tiles(16).data):
            print(f"a plan of {plan.npartitions} tiles: {len(pickle.dumps(plan.dask))} bytes")


if __name__ == "__main__":
    main()
