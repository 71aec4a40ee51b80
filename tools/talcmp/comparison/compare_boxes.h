// The comparison of all boxes by several threads.

#pragma once

#include "box_comparer.h"
#include "progress_listener.h"

namespace talcmp {

// How many threads are worthwhile, up to as many as the question allows.
unsigned thread_count(const BoxPlan& plan);

// The findings are those of a single thread. Throws Trouble if a single thread would have reached a
// box that cannot be read; throws std::bad_alloc.
Findings compare_boxes(const BoxPlan& plan, unsigned threads, ProgressListener& progress);

} // namespace talcmp
