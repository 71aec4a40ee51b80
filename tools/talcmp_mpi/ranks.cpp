#include "ranks.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <utility>

#include <unistd.h>

namespace talcmp {
namespace {

constexpr int first_rank = 0;

[[noreturn]] void end_after(const int error) {
    std::array<char, MPI_MAX_ERROR_STRING> text = {};
    int length = 0;
    ::MPI_Error_string(error, text.data(), &length);
    end_run("MPI has failed on " + process_name() + ": " + text.data());
}

void end_of_communicator(MPI_Comm* /*communicator*/, int* const error, ...) {
    end_after(*error);
}

void end_of_window(MPI_Win* /*window*/, int* const error, ...) {
    end_after(*error);
}

Message received(MPI_Message message, const MPI_Status& status) {
    int count = 0;
    ::MPI_Get_count(&status, MPI_CHAR, &count);
    Message result = {status.MPI_SOURCE, std::string(static_cast<std::size_t>(count), '\0')};
    ::MPI_Mrecv(result.bytes.data(), count, MPI_CHAR, &message, MPI_STATUS_IGNORE);
    return result;
}

} // namespace

Mpi::Mpi() {
    int provided = 0;
    ::MPI_Init_thread(nullptr, nullptr, MPI_THREAD_SERIALIZED, &provided);
    MPI_Errhandler handler = MPI_ERRHANDLER_NULL;
    ::MPI_Comm_create_errhandler(end_of_communicator, &handler);
    ::MPI_Comm_set_errhandler(MPI_COMM_WORLD, handler);
    ::MPI_Errhandler_free(&handler);
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
    ::MPI_Send(bytes.data(), static_cast<int>(bytes.size()), MPI_CHAR, to, static_cast<int>(tag),
               MPI_COMM_WORLD);
}

void Sendings::send(const int to, const Tag tag, std::string bytes) {
    sendings_.remove_if([](Sending& sending) {
        int has_arrived = 0;
        ::MPI_Test(&sending.request, &has_arrived, MPI_STATUS_IGNORE);
        return has_arrived != 0;
    });
    Sending& sending = sendings_.emplace_back();
    sending.bytes = std::move(bytes);
    ::MPI_Isend(sending.bytes.data(), static_cast<int>(sending.bytes.size()), MPI_CHAR, to,
                static_cast<int>(tag), MPI_COMM_WORLD, &sending.request);
}

void Sendings::wait() {
    for (Sending& sending : sendings_) {
        ::MPI_Wait(&sending.request, MPI_STATUS_IGNORE);
    }
    sendings_.clear();
}

Message receive(const Tag tag, const std::optional<int> from) {
    MPI_Message message = MPI_MESSAGE_NULL;
    MPI_Status status;
    ::MPI_Mprobe(from.value_or(MPI_ANY_SOURCE), static_cast<int>(tag), MPI_COMM_WORLD, &message,
                 &status);
    return received(message, status);
}

std::optional<Message> receive_if_there(const Tag tag) {
    int is_there = 0;
    MPI_Message message = MPI_MESSAGE_NULL;
    MPI_Status status;
    ::MPI_Improbe(MPI_ANY_SOURCE, static_cast<int>(tag), MPI_COMM_WORLD, &is_there, &message,
                  &status);
    return is_there == 0 ? std::nullopt : std::optional(received(message, status));
}

void broadcast(void* const bytes, const std::size_t count) {
    ::MPI_Bcast(bytes, static_cast<int>(count), MPI_CHAR, first_rank, MPI_COMM_WORLD);
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
    ::MPI_Reduce(&number, &least, 1, MPI_INT, MPI_MIN, first_rank, MPI_COMM_WORLD);
    broadcast(&least, sizeof least);
    return least;
}

SharedCounters::SharedCounters(const std::size_t count) {
    void* numbers = nullptr;
    const std::size_t bytes = rank() == first_rank ? count * sizeof(std::uint64_t) : 0;
    ::MPI_Win_allocate(static_cast<MPI_Aint>(bytes), sizeof(std::uint64_t), MPI_INFO_NULL,
                       MPI_COMM_WORLD, static_cast<void*>(&numbers), &window_);
    MPI_Errhandler handler = MPI_ERRHANDLER_NULL;
    ::MPI_Win_create_errhandler(end_of_window, &handler);
    ::MPI_Win_set_errhandler(window_, handler);
    ::MPI_Errhandler_free(&handler);
    std::fill_n(static_cast<char*>(numbers), bytes, '\0');
    ::MPI_Barrier(MPI_COMM_WORLD);
    ::MPI_Win_lock_all(MPI_MODE_NOCHECK, window_);
}

SharedCounters::~SharedCounters() {
    ::MPI_Win_unlock_all(window_);
    ::MPI_Win_free(&window_);
}

std::uint64_t SharedCounters::change(const std::size_t counter, const std::uint64_t operand,
                                     const MPI_Op operation) {
    std::uint64_t before = 0;
    ::MPI_Fetch_and_op(&operand, &before, MPI_UINT64_T, first_rank, static_cast<MPI_Aint>(counter),
                       operation, window_);
    ::MPI_Win_flush(first_rank, window_);
    return before;
}

std::uint64_t SharedCounters::add(const std::size_t counter, const std::uint64_t summand) {
    return change(counter, summand, MPI_SUM);
}

void SharedCounters::reset(const std::size_t counter) {
    change(counter, 0, MPI_REPLACE);
}

} // namespace talcmp
