#!/usr/bin/python3
"""Checks mpi_simulation.py where its result can be calculated: mpi_simulation_test.py BENCH."""

import math
import sys
import unittest
from dataclasses import replace

sys.path.insert(0, sys.argv.pop(1))

# pylint: disable=wrong-import-position
from mpi_simulation import INFINITE, Job, Merge, Network, Storage, batch_of, limits, simulate

JOB = Job(boxes=4096, bytes_of_box=1 << 19, seconds_of_box=2e-5, spread=0)
NO_TIME = Network("no time", 0, 0, 0, INFINITE)
MEMORY = Storage("memory", INFINITE, INFINITE, 0, 32)


class Simulated(unittest.TestCase):
    def assert_seconds(self, run, expected):
        self.assertAlmostEqual(run.seconds / expected, 1, places=9)

    def test_a_batch_is_a_32nd_of_a_ranks_share_from_1_to_16_boxes(self):
        cases = {(4096, 1): 16, (4096, 16): 8, (4096, 100): 1, (4096, 5000): 1, (1, 1): 1}
        for (boxes, ranks), expected in cases.items():
            self.assertEqual(batch_of(boxes, ranks), expected)

    def test_one_rank_takes_the_time_of_all_boxes(self):
        self.assert_seconds(simulate(JOB, 1, NO_TIME, MEMORY), 4096 * 2e-5)

    def test_one_rank_reads_and_compares_in_turn(self):
        storage = replace(MEMORY, bandwidth_of_node=1e10, seconds_of_open=1e-3)
        expected = 4096 * 2e-5 + 4096 * (1 << 19) / 1e10 + 2e-3
        self.assert_seconds(simulate(JOB, 1, NO_TIME, storage), expected)

    def test_ranks_share_the_boxes_evenly_if_messages_take_no_time(self):
        for ranks in (2, 16, 128):
            self.assert_seconds(simulate(JOB, ranks, NO_TIME, MEMORY), 4096 / ranks * 2e-5)

    def test_every_batch_and_every_rank_at_its_end_asks_the_counter(self):
        for ranks in (1, 3, 16, 100):
            run = simulate(JOB, ranks, NO_TIME, MEMORY)
            self.assertEqual(run.fetches, math.ceil(4096 / batch_of(4096, ranks)) + ranks)
            self.assertEqual(run.boxes, 4096)

    def test_nothing_is_faster_than_the_file_system(self):
        storage = replace(MEMORY, bandwidth=1e9)
        read = 4096 * (1 << 19) / 1e9
        run = simulate(JOB, 64, NO_TIME, storage)
        # After the last bytes one rank compares its last batch.
        self.assert_seconds(run, read + batch_of(4096, 64) * 2e-5)
        self.assertEqual(limits(JOB, 64, NO_TIME, storage)["file system"], read)

    def test_nothing_is_faster_than_the_nodes(self):
        storage = replace(MEMORY, bandwidth_of_node=1e9)
        read = 4096 * (1 << 19) / 1e9 / 2  # 64 ranks are on two nodes
        self.assert_seconds(simulate(JOB, 64, NO_TIME, storage), read + batch_of(4096, 64) * 2e-5)

    def test_a_slow_counter_serves_one_after_the_other(self):
        busy = 1e-3
        run = simulate(JOB, 64, replace(NO_TIME, service_seconds=busy), MEMORY)
        batches = 4096 / batch_of(4096, 64)
        # Rank 0 has its own batches at once; others share what is left and ask once more.
        self.assertLess(run.seconds, batches * busy)
        alone = simulate(JOB, 2, replace(NO_TIME, service_seconds=busy), MEMORY)
        self.assertGreater(alone.seconds, 4096 / 2 * 2e-5)

    def test_a_rank_waits_for_an_answer_before_each_batch(self):
        # Rank 0 is alone on a machine that takes very long for its first batch.
        network = replace(NO_TIME, fetch_seconds=1e-3)
        both = simulate(JOB, 2, network, MEMORY).seconds
        batch = 16 * 2e-5
        # In the time of one batch of rank 1 and its fetch, rank 0 compares several.
        rate = 16 / batch + 16 / (batch + 1e-3)
        self.assertAlmostEqual(both, 4096 / rate, delta=batch + 1e-3)

    def test_others_wait_for_boxes_of_rank_0_if_the_network_does_not_answer(self):
        box = 2e-5
        for looks in (1, 2, 3):
            # Before each batch, rank 1 waits for so many boxes of rank 0.
            rate = (1 + 16 / (16 + looks)) / box
            self.assertAlmostEqual(simulate(JOB, 2, replace(NO_TIME, looks=looks), MEMORY).seconds,
                                   4096 / rate, delta=(16 + looks) * box)

    def test_an_answer_takes_time_of_rank_0(self):
        box, busy = 2e-5, 1e-5
        network = replace(NO_TIME, looks=1, service_seconds=busy)
        # In 17 boxes and an answer, rank 0 compares 17 boxes and rank 1 a batch of 16.
        self.assertAlmostEqual(simulate(JOB, 2, network, MEMORY).seconds,
                               4096 / 33 * (17 * box + busy), delta=17 * box + busy)

    def test_a_report_is_merged_in_as_many_rounds_as_the_ranks_have_doublings(self):
        network = replace(NO_TIME, bandwidth=1e6)
        without = simulate(JOB, 64, network, MEMORY).seconds
        merged = simulate(JOB, 64, network, MEMORY, Merge(bytes=1000, seconds=1e-4)).seconds
        self.assertAlmostEqual(merged - without, 6 * (1000 / 1e6 + 1e-4), places=9)

    def test_a_difference_at_the_beginning_leaves_each_rank_at_most_a_batch(self):
        for ranks in (1, 2, 16, 100):
            run = simulate(JOB, ranks, NO_TIME, MEMORY, difference=0)
            batch = batch_of(4096, ranks)
            self.assertEqual(run.boxes, 1 + (ranks - 1) * batch)
            self.assert_seconds(run, (batch if ranks > 1 else 1) * 2e-5)

    def test_a_run_is_drawn_from_its_seed(self):
        job = replace(JOB, spread=0.5)
        first, again, other = (simulate(job, 7, NO_TIME, MEMORY, seed=seed).seconds
                               for seed in (1, 1, 2))
        self.assertEqual(first, again)
        self.assertNotEqual(first, other)


if __name__ == "__main__":
    unittest.main()
