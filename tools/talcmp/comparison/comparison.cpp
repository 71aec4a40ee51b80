#include "comparison.h"

#include "temporary_copy.h"
#include "traversal.h"
#include "trouble.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <future>
#include <limits>
#include <mutex>
#include <new>
#include <stdexcept>
#include <system_error>
#include <thread>

namespace talcmp {
namespace {

View selected(const NamedArray& array, const Selection& selection) {
    try {
        return select(*array.source, selection);
    } catch (const std::invalid_argument& error) {
        throw Trouble(array.name, error.what());
    }
}

ArrayFacts facts_of(const NamedArray& array, const View& view) {
    return {array.name, array.source->element_type(), array.source->shape(), view.shape,
            array.source->fortran_order()};
}

// ---- What the threads of one comparison share

// Otherwise boxes are gone through in row-major order.
bool column_major(const ArraySource& first, const ArraySource& second) {
    return first.fortran_order() && second.fortran_order();
}

// What is to be done.
struct Task {
    const Traversal& way;
    ArraySource& first;
    ArraySource& second;
    const Question& question;
    ProgressListener& progress;
    bool in_order = true; // whether places are met in their order
    RowMajorOrder order;  // of places; as they are met, where any of them will do
};

Task make_task(const Traversal& way, ArraySource& first, ArraySource& second,
               const Question& question, ProgressListener& progress) {
    const bool as_stored = !column_major(first, second);
    const bool as_met = question.only_whether && !as_stored;
    return {way,
            first,
            second,
            question,
            progress,
            as_stored || as_met,
            as_met ? RowMajorOrder() : RowMajorOrder(first)};
}

// How far it is.
class Work {
  public:
    explicit Work(const std::uint64_t box_count) : box_count_(box_count) {}

    // The number of the next box to look at; nothing when all is done or something failed.
    std::optional<std::uint64_t> next_box() {
        const std::uint64_t box = next_box_++;
        return box < box_count_ && !stopped_ ? std::optional(box) : std::nullopt;
    }

    // All boxes before it have been given out, so that of several failures the first is known.
    void fail(const std::uint64_t box, const std::exception_ptr& failure) {
        const std::lock_guard<std::mutex> lock(mutex_);
        if (!failure_ || box < failed_box_) {
            failed_box_ = box;
            failure_ = failure;
        }
        stopped_ = true;
    }

    // The first box that failed; nothing where none did. When all threads have ended.
    std::optional<std::uint64_t> failed_box() const {
        return failure_ ? std::optional(failed_box_) : std::nullopt;
    }
    [[noreturn]] void rethrow_failure() const { std::rethrow_exception(failure_); }

    // Places from `bound` on are no longer of interest.
    void lower_bound(const std::uint64_t bound) {
        std::uint64_t known = bound_;
        while (bound < known && !bound_.compare_exchange_weak(known, bound)) {
        }
    }
    std::uint64_t bound() const { return bound_; }

  private:
    std::uint64_t box_count_;
    std::atomic<std::uint64_t> next_box_ = 0;
    std::atomic<std::uint64_t> bound_ = std::numeric_limits<std::uint64_t>::max();
    std::atomic<bool> stopped_ = false;
    std::mutex mutex_;
    std::exception_ptr failure_;
    std::uint64_t failed_box_ = 0;
};

// Whether the answer does without the box, as all its places come later than those that are told,
// which are below `bound`.
bool is_beyond(const Task& task, const Box& box, const std::uint64_t bound) {
    if (task.question.report) {
        return false;
    }
    const std::uint64_t earliest =
        task.in_order ? task.order.of(task.way.first_position(box, 0)) : 0;
    return earliest >= bound;
}

// ---- What one thread does

class Worker {
  public:
    Worker(const Task& task, Work& work)
        : task_(task), work_(work), size1_(element_size(task.first)),
          size2_(element_size(task.second)),
          buffer1_(new unsigned char[task.way.largest_box() * size1_]),
          buffer2_(new unsigned char[task.way.largest_box() * size2_]),
          places_(task.question.differences), reporter_(task.question.tolerance) {}

    void run() {
        remember_factor_of(task_.question.tolerance);
        while (const auto box = work_.next_box()) {
            try {
                look_at(task_.way.box(*box));
            } catch (...) {
                work_.fail(*box, std::current_exception());
            }
        }
    }

    const FirstPlaces& places() const { return places_; }
    const Report& report() const { return reporter_.report(); }

  private:
    Place place(const Pairs& pairs, const Box& box, const std::size_t i) const {
        const std::uint64_t position = task_.way.first_position(box, i);
        return place_of(pairs, i, task_.order.of(position), position);
    }

    void read(const Box& box) {
        const auto read_second = [&] {
            task_.way.read(Side::second, task_.second, box, buffer2_.get());
        };
        // What is read but once may have to be decompressed, of which one thread can do one side.
        const bool side_by_side = !task_.first.random_access() && !task_.second.random_access();
        auto second = std::async(side_by_side ? std::launch::async | std::launch::deferred
                                              : std::launch::deferred,
                                 read_second);
        task_.way.read(Side::first, task_.first, box, buffer1_.get());
        second.get();
    }

    void look_at(const Box& box) {
        if (is_beyond(task_, box, work_.bound())) {
            return;
        }
        read(box);
        const Pairs pairs(task_.first.element_type(), buffer1_.get(), task_.second.element_type(),
                          buffer2_.get(), box.count);
        if (task_.question.report) {
            const auto make_place = [&](const std::size_t i) { return place(pairs, box, i); };
            reporter_.add(pairs, make_place, task_.in_order, places_);
        } else {
            add_places(pairs, box);
        }
        task_.progress.advance(box.count * (size1_ + size2_));
    }

    void add_places(const Pairs& pairs, const Box& box) {
        const talreal tolerance = task_.question.tolerance;
        for (std::size_t i = pairs.find_different(tolerance, 0); i < pairs.count();
             i = pairs.find_different(tolerance, i + 1)) {
            const Place next = place(pairs, box, i);
            if (next.order < places_.bound()) {
                places_.add(next);
                work_.lower_bound(places_.bound());
            } else if (task_.in_order) {
                return; // those behind it come later still
            }
        }
    }

    const Task& task_;
    Work& work_;
    std::size_t size1_;
    std::size_t size2_;
    std::unique_ptr<unsigned char[]> buffer1_;
    std::unique_ptr<unsigned char[]> buffer2_;
    FirstPlaces places_;
    Reporter reporter_;
};

unsigned thread_count(const Task& task) {
    if (!task.first.random_access() || !task.second.random_access()) {
        return 1;
    }
    constexpr unsigned most = 8; // a few MiB each; more hardly read faster
    const unsigned wanted = task.question.threads != 0
                                ? task.question.threads
                                : std::clamp(std::thread::hardware_concurrency(), 1U, most);
    return static_cast<unsigned>(std::min<std::uint64_t>(wanted, task.way.box_count()));
}

void run_all(std::vector<std::unique_ptr<Worker>>& workers) {
    std::vector<std::thread> threads;
    try {
        for (std::size_t i = 1; i < workers.size(); ++i) {
            threads.emplace_back([&workers, i] { workers[i]->run(); });
        }
    } catch (const std::system_error&) {
        // The system has no more threads; those that there are do all of the work.
    }
    workers.front()->run();
    for (std::thread& thread : threads) {
        thread.join();
    }
}

// One thread alone would not have come to a box behind the places that are told.
void rethrow_failure_before(const std::uint64_t bound, const Task& task, const Work& work) {
    const auto box = work.failed_box();
    if (box && !is_beyond(task, task.way.box(*box), bound)) {
        work.rethrow_failure();
    }
}

// ---- The whole comparison

void make_readable_in_any_order(NamedArray& array, ProgressListener& progress) {
    if (!array.source->random_access()) {
        array.source = std::make_unique<TemporaryCopy>(
            std::move(array.source), [&](const std::uint64_t bytes) { progress.advance(bytes); });
    }
}

// Of the copy that is taken where elements come but once and in another order than wanted.
std::uint64_t bytes_to_copy(const Traversal& way, const ArraySource& source) {
    return way.is_linear() || source.random_access() ? 0
                                                     : element_count(source) * element_size(source);
}

// What the comparison may take, to be said where it is not to be had.
std::string memory_text(const Task& task, const std::string& other_name, const unsigned threads) {
    const std::uint64_t piece =
        task.way.largest_box() * (element_size(task.first) + element_size(task.second));
    const std::uint64_t places =
        std::min<std::uint64_t>(task.question.differences, task.way.pair_count()) * sizeof(Place);
    return "there is not enough memory to compare it with " + other_name + ": "
           + std::to_string(threads * piece) + " bytes for pieces of both, up to "
           + std::to_string(threads * places)
           + " for differences; fewer --threads and --max-differences take less";
}

void compare_all_boxes(const Task& task, const unsigned threads, Comparison& result) {
    Work work(task.way.box_count());
    std::vector<std::unique_ptr<Worker>> workers;
    for (unsigned i = 0; i < threads; ++i) {
        workers.push_back(std::make_unique<Worker>(task, work));
    }
    run_all(workers);
    FirstPlaces places(task.question.differences);
    for (const auto& worker : workers) {
        places.add(worker->places());
        if (task.question.report) {
            add(*result.report, worker->report());
        }
    }
    rethrow_failure_before(places.bound(), task, work);
    result.places = places.in_order();
}

void compare_elements(NamedArray& first, NamedArray& second, const View& view1, const View& view2,
                      const Question& question, ProgressListener& progress, Comparison& result) {
    const std::size_t size1 = element_size(*first.source);
    const std::size_t size2 = element_size(*second.source);
    const Traversal way(view1, view2, column_major(*first.source, *second.source),
                        std::max(size1, size2));
    progress.begin(way.pair_count() * (size1 + size2) + bytes_to_copy(way, *first.source)
                   + bytes_to_copy(way, *second.source));
    if (!way.is_linear()) {
        make_readable_in_any_order(first, progress);
        make_readable_in_any_order(second, progress);
    }
    const Task task = make_task(way, *first.source, *second.source, question, progress);
    const unsigned threads = thread_count(task);
    try {
        compare_all_boxes(task, threads, result);
    } catch (const std::bad_alloc&) {
        throw Trouble(first.name, memory_text(task, second.name, threads));
    }
}

// Of arrays of one shape.
void compare_contents(NamedArray& first, NamedArray& second, const View& view1, const View& view2,
                      const Question& question, ProgressListener& progress, Comparison& result) {
    if (question.report) {
        result.report.emplace();
    }
    result.has_elements =
        std::find(view1.shape.begin(), view1.shape.end(), 0U) == view1.shape.end();
    const bool types_differ = question.strict_type && result.array1.type != result.array2.type;
    if (result.has_elements && (!types_differ || question.report)) {
        compare_elements(first, second, view1, view2, question, progress, result);
    }
    if (types_differ) {
        result.difference = Difference::type;
    } else if (question.report ? result.report->differing != 0 : !result.places.empty()) {
        result.difference = Difference::elements;
    }
}

} // namespace

Comparison compare(NamedArray first, NamedArray second, const Question& question,
                   ProgressListener& progress) {
    const View view1 = selected(first, question.selection);
    const View view2 = selected(second, question.selection);
    Comparison result;
    result.array1 = facts_of(first, view1);
    result.array2 = facts_of(second, view2);
    // Not by the records' dimensions, which are 32-bit: those of a file may be larger.
    if (view1.shape != view2.shape) {
        result.difference = Difference::shape;
    } else {
        compare_contents(first, second, view1, view2, question, progress, result);
    }
    first.source->check_to_end();
    second.source->check_to_end();
    return result;
}

} // namespace talcmp
