#include "ranks.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <limits>
#include <utility>

#include <unistd.h>

namespace talcmp {
namespace {

constexpr int first_rank = 0;

// Ends the run if a call of MPI has failed.
void checked(const int error, const std::string& what_to_do = "") {
    if (error != MPI_SUCCESS) {
        std::array<char, MPI_MAX_ERROR_STRING> text = {};
        int length = 0;
        ::MPI_Error_string(error, text.data(), &length);
        end_run("MPI has failed on " + process_name() + ": " + text.data() + what_to_do);
    }
}

// Debian's settings of Open MPI leave out the one-sided calls between machines that have no RDMA.
void choose_one_sided_calls() {
    std::ifstream settings("/etc/openmpi/openmpi-mca-params.conf");
    for (std::string line; std::getline(settings, line);) {
        if (line.compare(0, 3, "osc") == 0 && line.find("pt2pt") != std::string::npos) {
            // NOLINTNEXTLINE(concurrency-mt-unsafe): there is one thread.
            ::setenv("OMPI_MCA_osc", "^ucx", 0);
        }
    }
}

// How many bytes a call is told of.
int count_of(const std::size_t bytes) {
    if (bytes > static_cast<std::size_t>(std::numeric_limits<int>::max())) {
        end_run("what " + process_name() + " has found takes " + std::to_string(bytes)
                + " bytes, too many to be sent; lower --max-differences");
    }
    return static_cast<int>(bytes);
}

Message received(MPI_Message message, const MPI_Status& status) {
    int count = 0;
    checked(::MPI_Get_count(&status, MPI_CHAR, &count));
    Message result = {status.MPI_SOURCE, std::string(static_cast<std::size_t>(count), '\0')};
    checked(::MPI_Mrecv(result.bytes.data(), count, MPI_CHAR, &message, MPI_STATUS_IGNORE));
    return result;
}

} // namespace

Mpi::Mpi() {
    choose_one_sided_calls();
    int provided = 0;
    ::MPI_Init_thread(nullptr, nullptr, MPI_THREAD_SERIALIZED, &provided);
    ::MPI_Comm_set_errhandler(MPI_COMM_WORLD, MPI_ERRORS_RETURN);
    if (provided < MPI_THREAD_SERIALIZED) {
        end_run("this MPI takes no calls from several threads; install one that does");
    }
}

Mpi::~Mpi() {
    ::MPI_Finalize();
}

int rank() {
    int number = 0;
    ::MPI_Comm_rank(MPI_COMM_WORLD, &number);
    return number;
}

int rank_count() {
    int count = 0;
    ::MPI_Comm_size(MPI_COMM_WORLD, &count);
    return count;
}

std::string process_name() {
    std::array<char, MPI_MAX_PROCESSOR_NAME> host = {};
    int length = 0;
    ::MPI_Get_processor_name(host.data(), &length);
    return "rank " + std::to_string(rank()) + " on " + host.data();
}

void end_run(const std::string& reason) {
    std::fflush(stdout);
    std::fprintf(stderr, "talcmp: %s\n", reason.c_str());
    ::_exit(2);
}

void send(const int to, const Tag tag, const std::string& bytes) {
    checked(::MPI_Send(bytes.data(), count_of(bytes.size()), MPI_CHAR, to, static_cast<int>(tag),
                       MPI_COMM_WORLD));
}

void Sendings::send(const int to, const Tag tag, std::string bytes) {
    sendings_.remove_if([](Sending& sending) {
        int has_arrived = 0;
        checked(::MPI_Test(&sending.request, &has_arrived, MPI_STATUS_IGNORE));
        return has_arrived != 0;
    });
    Sending& sending = sendings_.emplace_back();
    sending.bytes = std::move(bytes);
    // NOLINTNEXTLINE(clang-analyzer-optin.mpi.MPI-Checker): `wait` waits for it.
    checked(::MPI_Isend(sending.bytes.data(), count_of(sending.bytes.size()), MPI_CHAR, to,
                        static_cast<int>(tag), MPI_COMM_WORLD, &sending.request));
}

void Sendings::wait() {
    for (Sending& sending : sendings_) {
        // NOLINTNEXTLINE(clang-analyzer-optin.mpi.MPI-Checker): `send` has sent it.
        checked(::MPI_Wait(&sending.request, MPI_STATUS_IGNORE));
    }
    sendings_.clear();
}

Message receive(const Tag tag, const std::optional<int> from) {
    MPI_Message message = MPI_MESSAGE_NULL;
    MPI_Status status;
    checked(::MPI_Mprobe(from.value_or(MPI_ANY_SOURCE), static_cast<int>(tag), MPI_COMM_WORLD,
                         &message, &status));
    return received(message, status);
}

std::optional<Message> receive_if_there(const Tag tag) {
    int is_there = 0;
    MPI_Message message = MPI_MESSAGE_NULL;
    MPI_Status status;
    checked(::MPI_Improbe(MPI_ANY_SOURCE, static_cast<int>(tag), MPI_COMM_WORLD, &is_there,
                          &message, &status));
    return is_there == 0 ? std::nullopt : std::optional(received(message, status));
}

void broadcast(void* const bytes, const std::size_t count) {
    checked(::MPI_Bcast(bytes, count_of(count), MPI_CHAR, first_rank, MPI_COMM_WORLD));
}

std::string broadcast(std::string bytes) {
    std::size_t size = bytes.size();
    broadcast(&size, sizeof size);
    bytes.resize(size);
    broadcast(bytes.data(), size);
    return bytes;
}

int least_of_all(const int number) {
    int least = 0;
    checked(::MPI_Reduce(&number, &least, 1, MPI_INT, MPI_MIN, first_rank, MPI_COMM_WORLD));
    broadcast(&least, sizeof least);
    return least;
}

SharedCounters::SharedCounters(const std::size_t count) {
    void* numbers = nullptr;
    const std::size_t bytes = rank() == first_rank ? count * sizeof(std::uint64_t) : 0;
    checked(::MPI_Win_allocate(static_cast<MPI_Aint>(bytes), sizeof(std::uint64_t), MPI_INFO_NULL,
                               MPI_COMM_WORLD, static_cast<void*>(&numbers), &window_),
            "; these ranks have no one-sided calls, which mpirun --mca osc pt2pt may give them");
    ::MPI_Win_set_errhandler(window_, MPI_ERRORS_RETURN);
    std::fill_n(static_cast<char*>(numbers), bytes, '\0');
    checked(::MPI_Barrier(MPI_COMM_WORLD));
    checked(::MPI_Win_lock_all(MPI_MODE_NOCHECK, window_));
}

SharedCounters::~SharedCounters() {
    checked(::MPI_Win_unlock_all(window_));
    ::MPI_Win_free(&window_);
}

std::uint64_t SharedCounters::change(const std::size_t counter, const std::uint64_t operand,
                                     MPI_Op operation) {
    std::uint64_t before = 0;
    checked(::MPI_Fetch_and_op(&operand, &before, MPI_UINT64_T, first_rank,
                               static_cast<MPI_Aint>(counter), operation, window_));
    checked(::MPI_Win_flush(first_rank, window_));
    return before;
}

std::uint64_t SharedCounters::add(const std::size_t counter, const std::uint64_t summand) {
    return change(counter, summand, MPI_SUM);
}

void SharedCounters::reset(const std::size_t counter) {
    change(counter, 0, MPI_REPLACE);
}

} // namespace talcmp
