#!/usr/bin/python3
"""Computes how long talcmp-mpi takes on many ranks, from costs that were measured on one machine:
mpi_simulation.py RESULTS [--quick]. Reads talcmp_mpi.json in the folder RESULTS and prints JSON.

Ranks take batches of boxes from a counter at rank 0, read them, compare them, and merge what they
found in a binomial tree. What one machine cannot show, networks and file systems, is assumed; each cost
says where it comes from.
"""

import heapq
import json
import math
import random
import sys
from dataclasses import asdict, dataclass, replace
from pathlib import Path

RANKS = (1, 2, 5, 10, 20, 50, 100, 200, 500, 1000, 4000)
BOX = 1 << 18  # bytes of each array
INFINITE = math.inf


# ---- What is simulated


@dataclass(frozen=True)
class Job:
    """What is compared, box by box."""
    boxes: int
    bytes_of_box: float  # that are read, of both arrays together
    seconds_of_box: float  # one core, in memory
    spread: float = 0.1  # the time of a batch is drawn from 1 - spread to 1 + spread times that


@dataclass(frozen=True)
class Network:
    """How ranks reach the counter and each other."""
    name: str
    fetch_seconds: float  # there and back
    service_seconds: float  # in which the counter answers nobody else
    message_seconds: float
    bandwidth: float  # bytes a second
    # The number of times that rank 0 has to look for messages, which it does between two boxes,
    # until a fetch is complete; 0 if the network answers by itself.
    looks: int = 0


@dataclass(frozen=True)
class Storage:
    """Where the files are."""
    name: str
    bandwidth_of_node: float  # bytes a second
    bandwidth: float
    seconds_of_open: float  # in which the file system opens nothing else
    ranks_of_node: int


@dataclass(frozen=True)
class Merge:
    """What a rank sends when it has no more boxes, and what merging takes."""
    bytes: float
    seconds: float = 0


@dataclass(frozen=True)
class Run:
    seconds: float  # from the opening of the files to the last merge
    boxes: int  # compared
    fetches: int


def batch_of(boxes, ranks):
    return min(max(boxes // (32 * ranks), 1), 16)


class Shared:
    """What serves one request after the other."""

    def __init__(self):
        self.free = 0.0

    def serve(self, time, seconds):
        self.free = max(self.free, time) + seconds
        return self.free


class Simulation:
    def __init__(self, job, ranks, network, storage, difference=None, seed=20261123):
        self.job, self.ranks, self.network, self.storage = job, ranks, network, storage
        self.difference = difference  # the box that has one
        self.random = random.Random(seed)
        self.batch = batch_of(job.boxes, ranks)
        self.taken = 0  # the counter
        self.counter, self.file_system = Shared(), Shared()
        self.nodes = [Shared() for _ in range(-(-ranks // storage.ranks_of_node))]
        # Rank 0 takes single boxes, as others may wait for it. Where they do not, batches take it
        # no longer, and the simulation less.
        self.batch_of_first = 1 if network.looks else self.batch
        self.next_look = 0.0  # when rank 0 has compared its box
        self.compared = self.fetches = 0
        self.events = []  # times, ranks, and what they do then
        self.done = [0.0] * ranks

    # ---- The counter

    def batch_of(self, rank):
        return self.batch if rank else self.batch_of_first

    def ask(self, rank, time, what):
        """What a rank asks the counter: for a batch, or that nobody gets another one."""
        self.fetches += 1
        network = self.network
        if rank == 0:
            # It answers the others first.
            self.answer(rank, max(time, self.counter.free) if network.looks else time, what)
        elif network.looks:
            self.later(time + network.fetch_seconds / 2, rank, what, network.looks)
        else:
            busy_until = self.counter.serve(time + network.fetch_seconds / 2,
                                            network.service_seconds)
            self.answer(rank, busy_until + network.fetch_seconds / 2, what)

    def look(self, rank, time, what, looks):
        """Rank 0 looks for messages; so many looks are needed."""
        network = self.network
        time = max(time, self.next_look)
        if looks > 1:
            self.later(time + network.message_seconds, rank, what, looks - 1)
        else:
            self.answer(rank, self.counter.serve(time, network.service_seconds)
                        + network.fetch_seconds / 2, what)

    def answer(self, rank, time, what):
        if what == "stop":
            self.taken += self.job.boxes
            self.later(time, rank, "ask")
            return
        first, self.taken = self.taken, self.taken + self.batch_of(rank)
        if first < self.job.boxes:
            self.later(time, rank, "compare", first)
        else:
            self.done[rank] = time

    # ---- The batches

    def read(self, rank, time, size):
        """The time at which a rank has the bytes: its node and the file system pass on one request
        after the other, both at once."""
        node = self.nodes[rank // self.storage.ranks_of_node]
        return max(node.serve(time, size / self.storage.bandwidth_of_node),
                   self.file_system.serve(time, size / self.storage.bandwidth))

    def compare(self, rank, time, first, count):
        """Boxes from `first` on, up to the difference."""
        job = self.job
        differs = self.difference is not None and first <= self.difference < first + count
        if differs:
            count = self.difference - first + 1
        read = self.read(rank, time, count * job.bytes_of_box)
        seconds = count * job.seconds_of_box * self.random.uniform(1 - job.spread, 1 + job.spread)
        self.compared += count
        if rank == 0:
            self.next_look = read + seconds
        self.later(read + seconds, rank, "stop" if differs else "ask")

    def later(self, time, rank, what, number=0):
        """`number` is the first box to compare, otherwise how often rank 0 has to look."""
        heapq.heappush(self.events, (time, rank, what, number))

    def all_batches(self, begin):
        """The time at which each rank knows that there are no more boxes."""
        for rank in range(self.ranks):
            self.later(begin, rank, "ask")
        while self.events:
            time, rank, what, number = heapq.heappop(self.events)
            if what == "compare":
                self.compare(rank, time, number,
                             min(self.batch_of(rank), self.job.boxes - number))
            elif number:
                self.look(rank, time, what, number)
            else:
                self.ask(rank, time, what)
        return self.done

    # ---- The whole run

    def agree(self):
        """All open both files, between two broadcasts and a reduction."""
        opened = 2 * self.ranks * self.storage.seconds_of_open
        return opened + 3 * math.ceil(math.log2(self.ranks)) * self.network.message_seconds

    def merged(self, done, merge):
        """The time at which rank 0 has the whole outcome, from a binomial tree."""
        message = self.network.message_seconds + merge.bytes / self.network.bandwidth
        distance = 1
        while distance < self.ranks:
            for rank in range(0, self.ranks - distance, 2 * distance):
                sent = done[rank + distance] + message
                done[rank] = max(done[rank], sent) + merge.seconds
            distance *= 2
        return done[0]

    def run(self, merge):
        merged = self.merged(self.all_batches(self.agree()), merge)
        # Each rank tells rank 0 that it has finished.
        finished = merged + (self.ranks - 1) * self.network.service_seconds
        return Run(finished, self.compared, self.fetches)


def simulate(job, ranks, network, storage, merge=Merge(0), **others):
    return Simulation(job, ranks, network, storage, **others).run(merge)


# ---- Closed forms: no run takes less than each of these


def limits(job, ranks, network, storage):
    """Seconds that the whole job keeps busy each of what it needs."""
    size = job.boxes * job.bytes_of_box
    nodes = -(-ranks // storage.ranks_of_node)
    others = (ranks - 1) / ranks
    return {
        "processors": job.boxes * job.seconds_of_box / ranks,
        "bandwidth of the nodes": size / storage.bandwidth_of_node / nodes,
        "file system": size / storage.bandwidth,
        "counter": job.boxes / batch_of(job.boxes, ranks) * others * network.service_seconds,
    }


# ---- The costs


@dataclass(frozen=True)
class Cost:
    name: str
    value: float
    unit: str
    source: str  # measured, or assumed and why


MEASURED = "measured"
NETWORK_FETCH = Cost("fetch-and-add by RDMA", 2e-6, "s", "assumed")
NETWORK_SERVICE = Cost("counter busy, RDMA", 1e-7, "s", "assumed")
TCP_FETCH = Cost("fetch-and-add over TCP, when rank 0 looks at once", 30e-6, "s", "assumed")
TCP_SERVICE = Cost("counter busy, TCP", 5e-6, "s", "assumed")
NETWORK_BANDWIDTH = Cost("network, a message", 1e9, "bytes/s", "assumed")
RANKS_OF_NODE = Cost("ranks of a node", 32, "", "assumed")
NODE_BANDWIDTH = Cost("files, a node", 10e9, "bytes/s", "assumed")
FILE_SYSTEM_BANDWIDTH = Cost("files, all nodes", 100e9, "bytes/s", "assumed")
OPEN = Cost("file system, to open a file", 20e-6, "s", "assumed")
START_OF_NODES = Cost("mpirun, for each doubling of the nodes", 0.2, "s", "assumed")
ASSUMED = (NETWORK_FETCH, NETWORK_SERVICE, TCP_FETCH, TCP_SERVICE, NETWORK_BANDWIDTH, RANKS_OF_NODE,
           NODE_BANDWIDTH, FILE_SYSTEM_BANDWIDTH, OPEN, START_OF_NODES)

RDMA = Network("RDMA", NETWORK_FETCH.value, NETWORK_SERVICE.value, NETWORK_FETCH.value,
               NETWORK_BANDWIDTH.value)
CLUSTER = Storage("32 ranks a node", NODE_BANDWIDTH.value, FILE_SYSTEM_BANDWIDTH.value, OPEN.value,
                  RANKS_OF_NODE.value)
SPREAD_CLUSTER = replace(CLUSTER, name="a rank a node", ranks_of_node=1)
FAST_CLUSTER = replace(CLUSTER, name="ten times the bandwidth",
                       bandwidth_of_node=10 * NODE_BANDWIDTH.value,
                       bandwidth=10 * FILE_SYSTEM_BANDWIDTH.value)
MEMORY = Storage("memory", INFINITE, INFINITE, 0, RANKS_OF_NODE.value)


class MeasuredCosts:
    """What talcmp_mpi.json says."""

    def __init__(self, results):
        self.results = results
        tiny = self.start("talcmp")
        self.near = self.box(".npy", "near", tiny)
        self.chunks = self.box("HDF5, chunks, shuffle, gzip", "identical", tiny)
        self.start_of_one = self.start("mpirun -n 1 talcmp-mpi")
        self.fetch = self.counter("shared memory", 0)
        self.idle_fetch = self.counter("TCP", 0)
        self.busy_fetch = self.counter("TCP", 250)
        # A fetch and its completion; more would be a busy machine's.
        self.looks = min(max(round(self.busy_fetch / 250e-6), 1), 2)
        self.merge = results["merge_bytes"]

    def start(self, name, seconds="seconds"):
        return next(row[seconds] for row in self.results["start"] if row["name"] == name)

    def counter(self, how, work):
        return next(row["nanoseconds"] * 1e-9 for row in self.results["counter"]
                    if (row["how"], row["work"]) == (how, work))

    def case(self, files, workload):
        return next(case for case in self.results["cases"]
                    if (case["files"], case["workload"]) == (files, workload))

    def command(self, files, workload, name):
        return next(one for one in self.case(files, workload)["commands"] if one["name"] == name)

    def box(self, files, workload, tiny):
        """Seconds of one core for each box."""
        boxes = self.case(files, workload)["bytes"] / BOX
        seconds = self.command(files, workload, "talcmp --threads 1")["seconds"] - tiny
        # A quick run may not show a difference.
        return max(seconds / boxes, 1e-9)

    def table(self):
        return (
            Cost("box of near doubles in memory, one core", self.near, "s", MEASURED),
            Cost("box of chunks with gzip and shuffle, one core", self.chunks, "s", MEASURED),
            Cost("fetch-and-add, shared memory", self.fetch, "s", MEASURED),
            Cost("fetch-and-add over TCP on one machine, rank 0 looks all the time",
                 self.idle_fetch, "s", MEASURED),
            Cost("fetch-and-add over TCP on one machine, rank 0 looks every 250 µs",
                 self.busy_fetch, "s", MEASURED),
            Cost("what a rank sends at its end, with a report", self.merge, "bytes", MEASURED),
            Cost("mpirun -n 1", self.start_of_one, "s", MEASURED),
        )


# ---- What is computed


@dataclass(frozen=True)
class Scenario:
    name: str
    job: Job
    network: Network
    storage: Storage


def scenarios_of(costs, quick):
    size = 1e10 if quick else 1e12
    near = Job(round(size / BOX), 2 * BOX, costs.near)
    share = costs.case("HDF5, chunks, shuffle, gzip", "identical")["share"]
    chunks = Job(round(size / BOX), 2 * BOX * share, costs.chunks)
    tcp = Network("TCP", TCP_FETCH.value, TCP_SERVICE.value, TCP_FETCH.value,
                  NETWORK_BANDWIDTH.value, costs.looks)
    for files, job in ((".npy, near", near), ("HDF5 chunks, gzip", chunks)):
        for network in (RDMA, tcp):
            yield Scenario(files, job, network, CLUSTER)
        for storage in (SPREAD_CLUSTER, FAST_CLUSTER):
            yield Scenario(files, job, RDMA, storage)


def start_of(ranks, costs, storage):
    nodes = -(-ranks // storage.ranks_of_node)
    return costs.start_of_one + math.ceil(math.log2(nodes)) * START_OF_NODES.value


def rows_of(scenario, costs, all_ranks):
    job, network, storage = scenario.job, scenario.network, scenario.storage
    alone = None
    for ranks in all_ranks:
        run = simulate(job, ranks, network, storage, Merge(costs.merge))
        alone = alone or run.seconds
        start = start_of(ranks, costs, storage)
        bounds = {**limits(job, ranks, network, storage), "start": start}
        yield {
            "files": scenario.name, "network": network.name, "storage": storage.name,
            "ranks": ranks, "seconds": run.seconds, "start": start,
            "efficiency": alone / run.seconds / ranks, "limits": bounds,
            "limit": max(bounds, key=bounds.get), "fetches": run.fetches,
        }


def difference_rows(scenario, costs, all_ranks):
    """A difference in the first box."""
    for ranks in all_ranks:
        run = simulate(scenario.job, ranks, scenario.network, scenario.storage, Merge(costs.merge),
                       difference=0)
        yield {"files": scenario.name, "network": scenario.network.name, "ranks": ranks,
               "seconds": run.seconds, "boxes": run.boxes}


def validation_rows(costs):
    """The time of ranks on this machine, without starting them, measured and simulated. To what is
    simulated comes what tiny files take."""
    shared = Network("shared memory", costs.fetch, costs.fetch, costs.fetch,
                     NETWORK_BANDWIDTH.value)
    tcp = Network("TCP", costs.idle_fetch, TCP_SERVICE.value, costs.idle_fetch,
                  NETWORK_BANDWIDTH.value, costs.looks)
    for files, workload, seconds in ((".npy", "near", costs.near),
                                     ("HDF5, chunks, shuffle, gzip", "identical", costs.chunks)):
        job = Job(round(costs.case(files, workload)["bytes"] / BOX), 2 * BOX, seconds)
        for name, ranks, network in (("one rank", 1, shared), ("two ranks", 2, shared),
                                     ("two ranks, TCP", 2, tcp)):
            over_tcp = ", TCP" if network is tcp else ""
            begin = costs.start(f"mpirun -n {ranks} talcmp-mpi{over_tcp}", "inside_seconds")
            yield {"files": files, "workload": workload, "name": name,
                   "measured": costs.command(files, workload, name)["inside_seconds"],
                   "simulated": begin + simulate(job, ranks, network, MEMORY).seconds}


def main():
    quick = "--quick" in sys.argv
    results = json.loads(Path(sys.argv[1], "talcmp_mpi.json").read_text(encoding="utf-8"))
    if results["left_out"]:
        print(json.dumps({"left_out": results["left_out"]}))
        return
    costs = MeasuredCosts(results)
    scenarios = list(scenarios_of(costs, quick))
    all_ranks = (1, 2, 10) if quick else RANKS
    print(json.dumps({
        "left_out": None,
        "costs": [asdict(cost) for cost in (*costs.table(), *ASSUMED)],
        "rows": [row for scenario in scenarios for row in rows_of(scenario, costs, all_ranks)],
        "difference": [row for scenario in scenarios if scenario.storage == CLUSTER
                       for row in difference_rows(scenario, costs, all_ranks)],
        "validation": list(validation_rows(costs)),
    }))


if __name__ == "__main__":
    main()
