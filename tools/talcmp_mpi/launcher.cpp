#include "launcher.h"

#include "environment.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <fstream>
#include <string>
#include <string_view>

#include <fcntl.h>
#include <sys/stat.h>

namespace talcmp {
namespace {

struct Process {
    std::string name;
    int parent = 0;
};

// Nothing but zeros of a process that has ended.
Process process_of(const int number) {
    Process process;
    std::string line;
    std::getline(std::ifstream("/proc/" + std::to_string(number) + "/stat"), line);
    // "NUMBER (NAME) STATE PARENT ...", where a name may have parentheses.
    const auto begin = line.find('(');
    const auto end = line.rfind(')');
    if (begin != std::string::npos && end != std::string::npos && end + 4 < line.size()) {
        process.name = line.substr(begin + 1, end - begin - 1);
        constexpr int decimal = 10;
        process.parent = static_cast<int>(std::strtol(line.c_str() + end + 4, nullptr, decimal));
    }
    return process;
}

bool is_launcher(const std::string& name) {
    constexpr std::array<std::string_view, 6> launchers = {"mpirun", "mpiexec", "orterun",
                                                           "orted",  "prterun", "prted"};
    return std::find(launchers.begin(), launchers.end(), name) != launchers.end();
}

// The number of the process above this one that started the ranks; 0 if none is known.
int launcher() {
    int number = ::getppid();
    while (number > 1) {
        const Process process = process_of(number);
        if (is_launcher(process.name)) {
            return number;
        }
        number = process.parent;
    }
    return 0;
}

bool is_device(const std::string& path) {
    struct stat status = {};
    return ::stat(path.c_str(), &status) == 0 && S_ISCHR(status.st_mode);
}

} // namespace

Descriptor shown_by_launcher(const int descriptor) {
    if (environment("OMPI_COMM_WORLD_RANK").empty() && environment("PMIX_RANK").empty()) {
        return Descriptor(::dup(descriptor));
    }
    const std::string path =
        "/proc/" + std::to_string(launcher()) + "/fd/" + std::to_string(descriptor);
    // A file or a pipe is not opened, as that may have effects.
    return Descriptor(
        ::open(is_device(path) ? path.c_str() : "/dev/null", O_RDONLY | O_NOCTTY | O_CLOEXEC));
}

} // namespace talcmp
