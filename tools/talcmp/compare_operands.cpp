#include "compare_operands.h"

#include "array_file.h"
#include "operand_file.h"
#include "operands.h"
#include "picture.h"
#include "shown.h"
#include "status_line.h"
#include "trouble.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <new>
#include <numeric>
#include <system_error>
#include <utility>
#include <vector>

namespace talcmp {
namespace {

bool is_pipe(const std::string& path) {
    std::error_code error;
    return path == standard_input_path || std::filesystem::is_fifo(path, error);
}

std::string name_of_input(const std::string& path) {
    return path == standard_input_path ? "standard input" : path;
}

class OperandComparison {
  public:
    OperandComparison(const CommandLine& command_line, Answers& answers, ProgressListener& progress,
                      const MakeGroup& make_group)
        : command_line_(command_line), answers_(answers), progress_(&progress),
          all_(make_group([this](const Outcome& outcome) { return print(outcome); },
                          command_line.question)),
          group_(all_.get()) {}

    Summary compare_all() {
        if (group_->leads()) {
            answers_.begin();
        }
        const FilePairs files = group_->same_files([this] { return file_pairs(); });
        try {
            compare_pairs(files);
        } catch (const Ended&) {
            // The process that leads has printed the last outcome.
        }
        group_->finish();
        if (group_->leads()) {
            answers_.finish(summary_);
        }
        return summary_;
    }

  private:
    void compare_pairs(const FilePairs& files) {
        const std::uint64_t total = total_bytes(files.pairs);
        for (const NamedPair& pair : files.pairs) {
            if (group_->has_ended()) {
                break;
            }
            if (pair.trouble) {
                report_trouble(pair.first.value_or(command_line_.first),
                               pair.second.value_or(command_line_.second), *pair.trouble);
            } else if (pair.first && pair.second) {
                const bool suits_one = files.many && group_->suits_one(both_bytes(pair), total);
                by_one_or_all(suits_one, *pair.first, *pair.second, [&] {
                    if (suits_one) {
                        check_sizes(pair);
                    }
                    compare_files({*pair.first, files.member1}, {*pair.second, files.member2});
                });
            } else {
                report_single(pair, pair.name, command_line_.first, command_line_.second);
            }
        }
    }

    // None if there was trouble, which is then reported.
    FilePairs file_pairs() {
        const std::string& first = command_line_.first;
        const std::string& second = command_line_.second;
        try {
            if (!group_->is_alone()) {
                refuse_pipes();
            }
            FilePairs files = match_files(first, second, command_line_.filter.exclude);
            if (files.many) {
                check_suits_many();
            }
            if (!group_->is_alone()) {
                find_sizes(files.pairs);
            }
            summary_.many = files.many;
            summary_.other_files = files.others;
            return files;
        } catch (const Trouble& trouble) {
            report_trouble(first, second, trouble.what());
            return {};
        }
    }

    void refuse_pipes() const {
        for (const std::string& operand :
             {command_line_.first, command_line_.second, command_line_.ignore}) {
            const std::string path = split_member(operand).first;
            if (is_pipe(path)) {
                throw Trouble(name_of_input(path),
                              "can be read by one process only; save it to a file first");
            }
        }
    }

    static void find_sizes(std::vector<NamedPair>& pairs) {
        for (NamedPair& pair : pairs) {
            if (pair.first && pair.second) {
                pair.bytes = {file_size(*pair.first), file_size(*pair.second)};
            }
        }
    }

    // Throws Trouble if this process sees other files than the one that has found them.
    static void check_sizes(const NamedPair& pair) {
        const auto check = [](const std::string& path, const std::uint64_t expected) {
            const std::uint64_t size = file_size(path);
            if (size != 0 && size != expected) {
                throw Trouble(path, "has " + std::to_string(size) + " bytes, but "
                                        + std::to_string(expected)
                                        + " for the first rank; give all ranks the same files");
            }
        };
        check(*pair.first, pair.bytes[0]);
        check(*pair.second, pair.bytes[1]);
    }

    // Of arrays that can be divided; 0 where one of the two cannot.
    static std::uint64_t both_bytes(const NamedPair& pair) {
        const std::uint64_t first = pair.bytes[0];
        const std::uint64_t second = pair.bytes[1];
        return first == 0 || second == 0 ? 0 : first + second;
    }

    static std::uint64_t total_bytes(const std::vector<NamedPair>& pairs) {
        return std::accumulate(
            pairs.begin(), pairs.end(), std::uint64_t{0},
            [](const std::uint64_t sum, const NamedPair& pair) { return sum + both_bytes(pair); });
    }

    // Runs `compare` in one process, or in all of them.
    template <typename Action>
    void by_one_or_all(const bool one, const std::string& first, const std::string& second,
                       const Action& compare) {
        if (!one) {
            guarded(first, second, compare);
            return;
        }
        group_->by_one([&] {
            std::vector<Outcome> outcomes;
            SingleProcess single([&](const Outcome& outcome) {
                outcomes.push_back(outcome);
                return !stops_at(outcome);
            });
            group_ = &single;
            guarded(first, second, compare);
            group_ = all_.get();
            return outcomes;
        });
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

    // Whether what there is only one of is enough for several comparisons.
    void check_suits_many() const {
        if (!command_line_.picture.empty()) {
            throw Trouble(command_line_.picture, "cannot show several arrays; compare two, such as "
                                                 "a.npz[x] and b.npz[x]");
        }
        const std::string mask = split_member(command_line_.ignore).first;
        if (is_pipe(mask)) {
            throw Trouble(name_of_input(mask),
                          "can be read only once, but several arrays are compared without what "
                          "--ignore names; save that to a file first");
        }
    }

    // The path of a file, and the array that is named in it, if one is.
    using NamedFile = std::pair<std::string, std::optional<std::string>>;

    void compare_files(const NamedFile& named1, const NamedFile& named2) {
        std::optional<OperandFile> first;
        std::optional<OperandFile> second;
        group_->agree(
            [&] {
                first.emplace(named1.first, named1.second);
                second.emplace(named2.first, named2.second);
            },
            [&] {
                return ProcessGroup::Sights{{first->path(), first->contents()},
                                            {second->path(), second->contents()}};
            });
        if (first->file().is_archive() && second->file().is_archive() && !first->member()
            && !second->member()) {
            compare_members(*first, *second);
        } else {
            const NameFilter& filter = command_line_.filter;
            const std::string array1 = first->chosen_array(&*second, filter);
            compare_arrays(*first, array1, *second, second->chosen_array(&*first, filter));
        }
    }

    static void find_sizes(std::vector<NamedPair>& pairs, const OperandFile& first,
                           const OperandFile& second) {
        for (NamedPair& pair : pairs) {
            if (pair.first && pair.second) {
                pair.bytes = {first.divisible_bytes(pair.name), second.divisible_bytes(pair.name)};
            }
        }
    }

    void compare_members(const OperandFile& first, const OperandFile& second) {
        const auto members1 = first.file().members();
        const auto members2 = second.file().members();
        FilePairs matched;
        matched.pairs = match_names(members1, members2, command_line_.filter);
        if (matched.pairs.empty() && !(members1.empty() && members2.empty())) {
            throw Trouble(first.path(), "has no array that --include and --exclude leave, nor has "
                                            + second.path());
        }
        check_suits_many();
        summary_.many = true;
        if (!group_->is_alone()) {
            matched = group_->same_files([&] {
                find_sizes(matched.pairs, first, second);
                return matched;
            });
        }
        const std::vector<NamedPair>& pairs = matched.pairs;
        const std::uint64_t total = total_bytes(pairs);
        for (const NamedPair& pair : pairs) {
            if (group_->has_ended()) {
                return;
            }
            if (pair.first && pair.second) {
                by_one_or_all(group_->suits_one(both_bytes(pair), total), first.name_of(pair.name),
                              second.name_of(pair.name),
                              [&] { compare_arrays(first, pair.name, second, pair.name); });
            } else {
                const OperandFile& owner = pair.first ? first : second;
                report_single(pair, owner.file().root() + pair.name, first.path(), second.path());
            }
        }
    }

    OpenedArray open_mask() const {
        if (command_line_.ignore.empty()) {
            return {};
        }
        const auto [path, member] = split_member(command_line_.ignore);
        const OperandFile file(path, member);
        OpenedArray mask = file.open(file.chosen_array(nullptr, {}));
        if (mask.not_numbers) {
            throw Trouble(*mask.not_numbers);
        }
        return mask;
    }

    void compare_arrays(const OperandFile& file1, const std::string& array1,
                        const OperandFile& file2, const std::string& array2) {
        OpenedArray first;
        OpenedArray second;
        OpenedArray mask;
        group_->agree(
            [&] {
                first = file1.open(array1);
                second = file2.open(array2);
                if (!first.not_numbers && !second.not_numbers) {
                    mask = open_mask();
                }
            },
            [&] {
                return ProcessGroup::Sights{{first.array.name, header_of(first)},
                                            {second.array.name, header_of(second)},
                                            {mask.array.name, header_of(mask)}};
            });
        Outcome outcome;
        outcome.first = first.array.name;
        outcome.second = second.array.name;
        if (first.not_numbers || second.not_numbers) {
            // One that is and one that is not are never the same.
            const bool both = first.not_numbers && second.not_numbers;
            outcome.kind =
                command_line_.skip_others && both ? Outcome::Kind::skipped : Outcome::Kind::trouble;
            outcome.message = *(first.not_numbers ? first.not_numbers : second.not_numbers);
            report(outcome);
            return;
        }
        outcome.comparison =
            compare(std::move(first.array), std::move(second.array), std::move(mask.array),
                    command_line_.question, group_->boxes(), *progress_);
        if (outcome.comparison.difference != Difference::none) {
            outcome.kind = Outcome::Kind::different;
        }
        report(outcome);
        if (group_->leads()) {
            draw(outcome.comparison);
        }
    }

    // The last map is the one of the picture.
    void draw(const Comparison& comparison) const {
        const std::string& path = command_line_.picture;
        if (path.empty()) {
            return;
        }
        if (comparison.maps.empty()) {
            std::fprintf(stderr, "talcmp: note: %s: not drawn, as there are no pairs of elements\n",
                         shown(path).c_str());
            return;
        }
        write_picture(comparison, *comparison.maps.back(), path);
    }

    // `name` is that of the array or file, as messages have it.
    void report_single(const NamedPair& pair, const std::string& name, const std::string& first,
                       const std::string& second) {
        Outcome outcome;
        outcome.kind = pair.first ? Outcome::Kind::only_in_first : Outcome::Kind::only_in_second;
        outcome.first = first;
        outcome.second = second;
        outcome.name = name;
        report(outcome);
    }

    void report(const Outcome& outcome) { group_->report(outcome); }

    // Returns whether more outcomes are wanted.
    bool print(const Outcome& outcome) {
        clear_status();
        count(summary_, outcome.kind);
        if (outcome.kind == Outcome::Kind::trouble) {
            const std::string where = outcome.process.empty() || is_trouble_here(outcome)
                                          ? ""
                                          : " (" + outcome.process + ")";
            std::fflush(stdout); // so that lines on one terminal stay in their order
            std::fprintf(stderr, "talcmp: %s%s\n", outcome.message.c_str(), where.c_str());
        }
        answers_.print(outcome);
        summary_.stopped = stops_at(outcome);
        return !summary_.stopped;
    }

    // Whether this process has the same trouble as another one.
    bool is_trouble_here(const Outcome& outcome) {
        const auto [path1, member1] = split_member(outcome.first);
        const auto [path2, member2] = split_member(outcome.second);
        bool is_same = false;
        SingleProcess single([&](const Outcome& here) {
            is_same = is_same || here.message == outcome.message;
            return true;
        });
        NoProgress no_progress; // that of what is compared meanwhile goes on
        ProcessGroup* const group = std::exchange(group_, &single);
        ProgressListener* const progress = std::exchange(progress_, &no_progress);
        guarded(outcome.first, outcome.second,
                [&, path1 = path1, member1 = member1, path2 = path2, member2 = member2] {
                    compare_files({path1, member1}, {path2, member2});
                });
        group_ = group;
        progress_ = progress;
        return is_same;
    }

    // Whether the outcome is the last that is wanted.
    bool stops_at(const Outcome& outcome) const {
        const bool differs = outcome.kind == Outcome::Kind::different
                             || outcome.kind == Outcome::Kind::only_in_first
                             || outcome.kind == Outcome::Kind::only_in_second;
        return command_line_.only_first && differs;
    }

    const CommandLine& command_line_;
    Answers& answers_;
    ProgressListener* progress_;
    Summary summary_;
    std::unique_ptr<ProcessGroup> all_;
    ProcessGroup* group_; // that compares at the moment: all processes, or this one
};

} // namespace

Summary compare_operands(const CommandLine& command_line, Answers& answers,
                         ProgressListener& progress, const MakeGroup& make_group) {
    return OperandComparison(command_line, answers, progress, make_group).compare_all();
}

} // namespace talcmp
