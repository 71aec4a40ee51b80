// The ranks of a run: how MPI is started, and what is sent between them.

#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <optional>
#include <string>

#include <mpi.h>

namespace talcmp {

// MPI, from its start to its end. Calls come from one thread at a time. When one fails, the run
// ends.
class Mpi {
  public:
    Mpi();
    Mpi(const Mpi&) = delete;
    Mpi& operator=(const Mpi&) = delete;
    ~Mpi();
};

int rank();
int rank_count();

// "rank 3 on node7"
std::string process_name();

// Ends this process with exit status 2 after a line, and with it the run.
[[noreturn]] void end_run(const std::string& reason);

// What messages are about. Those of one kind arrive in the order in which they were sent.
enum class Tag : int { outcomes = 1, findings, trouble };

void send(int to, Tag tag, const std::string& bytes);

// Messages that are not waited for until they are to have arrived.
class Sendings {
  public:
    void send(int to, Tag tag, std::string bytes);
    void wait();

  private:
    struct Sending {
        std::string bytes;
        MPI_Request request = MPI_REQUEST_NULL;
    };

    std::list<Sending> sendings_;
};

struct Message {
    int from;
    std::string bytes;
};

// Waits for a message, from any rank if none is given.
Message receive(Tag tag, std::optional<int> from = std::nullopt);

// Receives a message if one has arrived.
std::optional<Message> receive_if_there(Tag tag);

// From the first rank to all others.
void broadcast(void* bytes, std::size_t count);
std::string broadcast(std::string bytes);

// The least of the numbers that all ranks give.
int least_of_all(int number);

// Numbers at the first rank, to which any rank adds without waiting for another one.
class SharedCounters {
  public:
    explicit SharedCounters(std::size_t count);
    SharedCounters(const SharedCounters&) = delete;
    SharedCounters& operator=(const SharedCounters&) = delete;
    ~SharedCounters();

    // Returns what the number was.
    std::uint64_t add(std::size_t counter, std::uint64_t summand);

    // Makes the number 0; nobody may be adding to it.
    void reset(std::size_t counter);

  private:
    std::uint64_t change(std::size_t counter, std::uint64_t operand, MPI_Op operation);

    MPI_Win window_ = MPI_WIN_NULL;
};

} // namespace talcmp
