// The comparison of all boxes by several threads.

#pragma once

#include "box_supply.h"
#include "progress_listener.h"

namespace talcmp {

// How many threads are worthwhile, up to as many as the question allows.
unsigned thread_count(const BoxPlan& plan);

// Compares the boxes that are supplied. If the supply leads, the findings are those of a single
// thread that compares all boxes; throws Trouble if that would have reached a box that cannot be
// read, std::bad_alloc if there was not enough memory.
Findings compare_boxes(const BoxPlan& plan, unsigned threads, BoxSupply& supply,
                       ProgressListener& progress);

} // namespace talcmp
