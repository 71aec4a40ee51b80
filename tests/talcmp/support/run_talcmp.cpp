#include "run_talcmp.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <memory>
#include <stdexcept>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

constexpr unsigned longest_run = 300; // seconds
constexpr int not_started = 127;      // the exit status that a shell has for it

// A file without a name, which is gone with this object.
class Capture {
  public:
    Capture() {
        if (file_ == nullptr) {
            throw std::runtime_error("no temporary file for the output of talcmp");
        }
    }

    int descriptor() const { return ::fileno(file_.get()); }

    std::string contents() const {
        std::rewind(file_.get());
        std::string text;
        for (int c = std::fgetc(file_.get()); c != EOF; c = std::fgetc(file_.get())) {
            text += static_cast<char>(c);
        }
        return text;
    }

  private:
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> file_ = {std::tmpfile(), std::fclose};
};

// In the child only system calls are made, as other threads may have held locks at the fork.
[[noreturn]] void become_talcmp(char* const* arguments, const int output, const int errors) {
    ::alarm(longest_run); // outlives the change of program
    ::dup2(errors, STDERR_FILENO);
    if (output < 0) {
        ::close(STDOUT_FILENO);
    } else {
        ::dup2(output, STDOUT_FILENO);
    }
    ::execv(arguments[0], arguments);
    ::_exit(not_started);
}

int start_and_wait(const std::vector<std::string>& arguments, const int output, const int errors,
                   struct rusage& usage) {
    std::vector<std::string> command = {TALCMP_COMMAND};
    command.insert(command.end(), arguments.begin(), arguments.end());
    std::vector<char*> pointers;
    pointers.reserve(command.size() + 1);
    for (std::string& word : command) {
        pointers.push_back(word.data());
    }
    pointers.push_back(nullptr);
    const pid_t child = ::fork();
    if (child == 0) {
        become_talcmp(pointers.data(), output, errors);
    }
    int status = 0;
    if (child < 0 || ::wait4(child, &status, 0, &usage) != child) {
        throw std::runtime_error("no child process for talcmp");
    }
    return status;
}

bool is_one_printable_line(const std::string& text) {
    return !text.empty() && text.back() == '\n'
           && std::all_of(text.begin(), text.end() - 1,
                          [](const char c) { return c >= ' ' && c <= '~'; });
}

} // namespace

ProcessResult run_talcmp(const std::vector<std::string>& arguments, const Output output) {
    const Capture captured;
    const Capture errors;
    const int full = output == Output::full ? ::open("/dev/full", O_WRONLY | O_CLOEXEC) : -1;
    const int descriptor = output == Output::captured      ? captured.descriptor()
                           : output == Output::with_errors ? errors.descriptor()
                                                           : full;
    struct rusage usage = {};
    const int status = start_and_wait(arguments, descriptor, errors.descriptor(), usage);
    if (full >= 0) {
        ::close(full);
    }
    EXPECT_TRUE(WIFEXITED(status)) << "ended by signal " << WTERMSIG(status);
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, captured.contents(), errors.contents(),
            usage.ru_maxrss}; // NOLINT(cppcoreguidelines-pro-type-union-access)
}

void expect_trouble(const ProcessResult& outcome, const std::string& beginning,
                    const std::string& fragment) {
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.output, "");
    EXPECT_TRUE(is_one_printable_line(outcome.errors)) << outcome.errors;
    EXPECT_EQ(outcome.errors.rfind("talcmp: " + beginning, 0), 0U) << outcome.errors;
    EXPECT_NE(outcome.errors.find(fragment), std::string::npos)
        << outcome.errors << "lacks: " << fragment;
}
