// Preloaded into a rank: writes how long it took from the end of MPI_Init to the beginning of
// MPI_Finalize, what starting all ranks takes apart from what they do, into the file that
// MPI_SECONDS names, if it is rank 0.

#include <mpi.h>

#include <cstdlib>
#include <fstream>
#include <iomanip>

namespace {

double begin = 0;

void write_seconds(const double seconds) {
    int rank = 0;
    PMPI_Comm_rank(MPI_COMM_WORLD, &rank);
    // NOLINTNEXTLINE(concurrency-mt-unsafe): nobody changes the environment.
    const char* const path = std::getenv("MPI_SECONDS");
    if (rank == 0 && path != nullptr) {
        std::ofstream(path) << std::fixed << std::setprecision(6) << seconds << '\n';
    }
}

} // namespace

int MPI_Init(int* const count, char*** const arguments) {
    const int result = PMPI_Init(count, arguments);
    begin = PMPI_Wtime();
    return result;
}

int MPI_Init_thread(int* const count, char*** const arguments, const int required,
                    int* const provided) {
    const int result = PMPI_Init_thread(count, arguments, required, provided);
    begin = PMPI_Wtime();
    return result;
}

int MPI_Finalize() {
    write_seconds(PMPI_Wtime() - begin);
    return PMPI_Finalize();
}
