#!/usr/bin/env python3
"""Ranks on two hosts without RDMA, as talcmp-mpi is installed and mpirun is set up: two network
namespaces that this test makes."""

import os
import shutil
import subprocess
import sys
import unittest

import numpy as np

from ranks import Folder, MarkedRun, run_alone, run_tests, talcmp_mpi

NAMES = [f"talcmp{os.getpid()}x{number}" for number in (1, 2)]
ADDRESSES = ["10.213.77.1", "10.213.77.2"]
NETWORK = "10.213.77.0/24"
# mpirun starts the rest of itself on a host by AGENT HOST COMMAND...
AGENT = f"""#!/bin/sh
host=$1
shift
case $host in {ADDRESSES[0]}) name={NAMES[0]} ;; *) name={NAMES[1]} ;; esac
exec ip netns exec $name unshare --uts sh -c 'hostname '$name'; exec sh -c "$*"' sh "$@"
"""


def run(*words):
    subprocess.run(words, check=True, capture_output=True)


def make_hosts():
    for name in NAMES:
        run("ip", "netns", "add", name)
    links = [f"tal{os.getpid() % 100000}{end}" for end in "ab"]
    run("ip", "link", "add", links[0], "type", "veth", "peer", "name", links[1])
    for name, link, address in zip(NAMES, links, ADDRESSES):
        run("ip", "link", "set", link, "netns", name)
        within = ["ip", "netns", "exec", name, "ip"]
        run(*within, "addr", "add", address + "/24", "dev", link)
        run(*within, "link", "set", link, "up")
        run(*within, "link", "set", "lo", "up")


def remove_hosts():
    for name in NAMES:
        subprocess.run(["ip", "netns", "delete", name], check=False, capture_output=True)


class TwoHosts(Folder):
    @classmethod
    def setUpClass(cls):
        cls.addClassCleanup(remove_hosts)
        try:
            make_hosts()
        except subprocess.CalledProcessError as error:
            reason = error.stderr.decode().strip()
            raise unittest.SkipTest(f"NOT TESTED: ranks on two hosts: {reason}") from None

    def run_ranks(self, ranks, *arguments):
        agent = self.write("agent", AGENT.encode())
        os.chmod(agent, 0o755)
        hosts = ",".join(f"{address}:8" for address in ADDRESSES)
        mpirun = ["mpirun", "-q", "--oversubscribe", "--map-by", "node",
                  "--mca", "plm", "rsh", "--mca", "plm_rsh_agent", agent,
                  "--mca", "oob_tcp_if_include", NETWORK, "--mca", "btl_tcp_if_include", NETWORK,
                  "--host", hosts, "-n", str(ranks), talcmp_mpi(), *arguments]
        command = ["ip", "netns", "exec", NAMES[0], "unshare", "--uts", "sh", "-c",
                   f'hostname {NAMES[0]}; exec "$@"', "sh", *mpirun]
        return MarkedRun(command).finish()

    def check(self, *arguments):
        for ranks in 2, 3:
            self.assertEqual(self.run_ranks(ranks, *arguments), run_alone(*arguments))

    def test_share_arrays(self):
        values = np.random.default_rng(1).standard_normal(2**22)
        a = self.save("a.npy", values)
        values[3000000] *= 1 + 1e-10
        b = self.save("b.npy", values)
        self.check("--report", a, b)
        self.check("--tol", "40", a, b)

    def test_share_files(self):
        for number in range(40):
            values = np.arange(1000.0) + number
            self.save(f"one/{number}.npy", values)
            values[number] += number % 7 == 0
            self.save(f"two/{number}.npy", values)
        self.check("-v", self.path("one"), self.path("two"))


if __name__ == "__main__":
    lacking = [name for name in ("ip", "unshare") if shutil.which(name) is None]
    if os.geteuid() != 0 or lacking:
        print("NOT TESTED: ranks on two hosts, as only root with ip and unshare can make them",
              file=sys.stderr)
        sys.exit(77)
    run_tests()
