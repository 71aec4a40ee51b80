// Times a fetch-and-add on a counter at rank 0, as ranks other than 0 see it: mpi_counter
// [--quick]. Rank 0 is busy for some microseconds at a time, and between them takes a number itself
// and looks for messages. Rank 0 prints JSON.

#include <mpi.h>

#include "json_rows.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <limits>
#include <string_view>

namespace {

class Counter {
  public:
    Counter() {
        MPI_Win_allocate(sizeof(std::int64_t), 1, MPI_INFO_NULL, MPI_COMM_WORLD, &memory_,
                         &window_);
        *memory_ = 0;
        MPI_Barrier(MPI_COMM_WORLD);
        MPI_Win_lock_all(0, window_);
    }

    Counter(const Counter&) = delete;
    Counter& operator=(const Counter&) = delete;
    ~Counter() {
        MPI_Win_unlock_all(window_);
        MPI_Win_free(&window_);
    }

    [[nodiscard]] std::int64_t next() const {
        const std::int64_t one = 1;
        std::int64_t before = 0;
        MPI_Fetch_and_op(&one, &before, MPI_INT64_T, 0, 0, MPI_SUM, window_);
        MPI_Win_flush(0, window_);
        return before;
    }

  private:
    std::int64_t* memory_ = nullptr;
    MPI_Win window_{};
};

// Until the others are done.
void serve(const Counter& counter, const double work) {
    MPI_Request done{};
    MPI_Ibarrier(MPI_COMM_WORLD, &done);
    for (int is_done = 0; is_done == 0;) {
        const double begin = MPI_Wtime();
        while (MPI_Wtime() - begin < work) {
        }
        (void)counter.next();
        MPI_Test(&done, &is_done, MPI_STATUS_IGNORE);
    }
}

// The mean of the shortest of several turns, as other work of the machine only makes them longer.
double seconds_of_fetch(const Counter& counter, const int turns) {
    constexpr int fetches = 200;
    double shortest = std::numeric_limits<double>::infinity();
    for (int turn = 0; turn < turns; ++turn) {
        const double begin = MPI_Wtime();
        for (int i = 0; i < fetches; ++i) {
            (void)counter.next();
        }
        shortest = std::min(shortest, MPI_Wtime() - begin);
    }
    MPI_Request done{};
    MPI_Ibarrier(MPI_COMM_WORLD, &done);
    MPI_Wait(&done, MPI_STATUS_IGNORE);
    return shortest / fetches;
}

double measured(const int rank, const std::size_t microseconds, const int turns) {
    const Counter counter;
    double seconds = 0;
    if (rank == 0) {
        serve(counter, static_cast<double>(microseconds) * 1e-6);
    } else {
        seconds = seconds_of_fetch(counter, turns);
    }
    double slowest = 0;
    MPI_Reduce(&seconds, &slowest, 1, MPI_DOUBLE, MPI_MAX, 0, MPI_COMM_WORLD);
    return slowest;
}

} // namespace

int main(int count, char** arguments) {
    MPI_Init(&count, &arguments);
    int rank = 0;
    MPI_Comm_rank(MPI_COMM_WORLD, &rank);
    const bool quick = count > 1 && std::string_view(arguments[1]) == "--quick";
    const int turns = quick ? 1 : 10;
    JsonRows rows;
    for (const std::size_t work : {0U, 25U, 250U}) {
        const double seconds = measured(rank, work, turns);
        if (rank == 0) {
            rows.row().add("work", work).add("nanoseconds", seconds * 1e9);
        }
    }
    if (rank == 0) {
        std::puts("\n]");
    }
    MPI_Finalize();
}
