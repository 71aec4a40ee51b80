#include "compare_operands.h"

#include "array_file.h"
#include "operands.h"
#include "status_line.h"
#include "trouble.h"

#include <cstdio>
#include <new>

namespace talcmp {
namespace {

class OperandComparison {
  public:
    OperandComparison(const CommandLine& command_line, Answers& answers, ProgressBar& progress)
        : command_line_(command_line), answers_(answers), progress_(progress) {}

    Summary compare_all() {
        for (const NamedPair& pair : file_pairs()) {
            if (pair.trouble) {
                report_trouble(pair.first.value_or(command_line_.first),
                               pair.second.value_or(command_line_.second), *pair.trouble);
            } else if (pair.first && pair.second) {
                guarded(*pair.first, *pair.second,
                        [&] { compare_files(*pair.first, *pair.second); });
            } else {
                report_single(pair, command_line_.first, command_line_.second);
            }
        }
        answers_.finish(summary_);
        return summary_;
    }

  private:
    // None if there was trouble, which is then reported.
    std::vector<NamedPair> file_pairs() {
        const std::string& first = command_line_.first;
        const std::string& second = command_line_.second;
        try {
            FilePairs files = match_files(first, second, command_line_.filter.exclude);
            answers_.begin(files.many);
            return std::move(files.pairs);
        } catch (const Trouble& trouble) {
            answers_.begin(false);
            report_trouble(first, second, trouble.what());
            return {};
        }
    }

    // Trouble with these two does not stop the comparison of the others.
    template <typename Action>
    void guarded(const std::string& first, const std::string& second, const Action& action) {
        try {
            action();
        } catch (const Trouble& trouble) {
            report_trouble(first, second, trouble.what());
        } catch (const std::bad_alloc&) {
            report_trouble(
                first, second,
                Trouble(first, "there is not enough memory to compare it with " + second).what());
        }
    }

    void report_trouble(const std::string& first, const std::string& second,
                        const std::string& message) {
        Outcome outcome;
        outcome.kind = Outcome::Kind::trouble;
        outcome.first = first;
        outcome.second = second;
        outcome.message = message;
        report(outcome);
    }

    void compare_files(const std::string& path1, const std::string& path2) {
        const auto file1 = open_array_file(path1);
        const auto file2 = open_array_file(path2);
        if (file1->is_archive() && file2->is_archive()) {
            compare_members(path1, *file1, path2, *file2);
        } else {
            compare_arrays(path1, *file1, only_member(path1, *file1), path2, *file2,
                           only_member(path2, *file2));
        }
    }

    void compare_members(const std::string& path1, ArrayFile& file1, const std::string& path2,
                         ArrayFile& file2) {
        const auto pairs = match_names(file1.members(), file2.members(), command_line_.filter);
        if (pairs.empty() && !(file1.members().empty() && file2.members().empty())) {
            throw Trouble(path1,
                          "has no array that --include and --exclude leave, nor has " + path2);
        }
        for (const NamedPair& pair : pairs) {
            if (pair.first && pair.second) {
                guarded(member_name(path1, pair.name), member_name(path2, pair.name),
                        [&] { compare_arrays(path1, file1, pair.name, path2, file2, pair.name); });
            } else {
                report_single(pair, path1, path2);
            }
        }
    }

    // The member to be compared with a file of one array.
    std::string only_member(const std::string& path, const ArrayFile& file) const {
        if (!file.is_archive()) {
            return "";
        }
        const auto members = match_names(file.members(), {}, command_line_.filter);
        if (members.size() != 1) {
            throw Trouble(path, "has " + std::to_string(members.size())
                                    + " arrays, the other file one; choose one with --include");
        }
        return members.front().name;
    }

    static std::string member_name(const std::string& path, const std::string& member) {
        return path + "[" + member + "]";
    }

    void compare_arrays(const std::string& path1, ArrayFile& file1, const std::string& member1,
                        const std::string& path2, ArrayFile& file2, const std::string& member2) {
        NamedArray first{file1.is_archive() ? member_name(path1, member1) : path1, nullptr};
        NamedArray second{file2.is_archive() ? member_name(path2, member2) : path2, nullptr};
        first.source = file1.open(member1);
        second.source = file2.open(member2);
        Outcome outcome;
        outcome.first = first.name;
        outcome.second = second.name;
        outcome.comparison =
            compare(std::move(first), std::move(second), command_line_.question, progress_);
        if (outcome.comparison.difference != Difference::none) {
            outcome.kind = Outcome::Kind::different;
        }
        report(outcome);
    }

    void report_single(const NamedPair& pair, const std::string& first, const std::string& second) {
        Outcome outcome;
        outcome.kind = pair.first ? Outcome::Kind::only_in_first : Outcome::Kind::only_in_second;
        outcome.first = first;
        outcome.second = second;
        outcome.name = pair.name;
        report(outcome);
    }

    void report(const Outcome& outcome) {
        clear_status();
        count(summary_, outcome.kind);
        if (outcome.kind == Outcome::Kind::trouble) {
            std::fflush(stdout); // so that lines on one terminal stay in their order
            std::fprintf(stderr, "talcmp: %s\n", outcome.message.c_str());
        }
        answers_.print(outcome);
    }

    const CommandLine& command_line_;
    Answers& answers_;
    ProgressBar& progress_;
    Summary summary_;
};

} // namespace

Summary compare_operands(const CommandLine& command_line, Answers& answers, ProgressBar& progress) {
    return OperandComparison(command_line, answers, progress).compare_all();
}

} // namespace talcmp
