#include "compare_operands.h"

#include "array_file.h"
#include "operands.h"
#include "picture.h"
#include "shape_text.h"
#include "shown.h"
#include "status_line.h"
#include "trouble.h"

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <new>
#include <numeric>
#include <system_error>
#include <tuple>
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

// In bytes; 0 if the file is not there.
std::uint64_t file_size(const std::string& path) {
    std::error_code error;
    const std::uint64_t size = std::filesystem::file_size(path, error);
    return error ? 0 : size;
}

class OperandComparison {
  public:
    OperandComparison(const CommandLine& command_line, Answers& answers, ProgressListener& progress,
                      const MakeGroup& make_group)
        : command_line_(command_line), answers_(answers), progress_(progress),
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
                const bool suits_one = files.many && group_->suits_one(pair.bytes, total);
                by_one_or_all(suits_one, *pair.first, *pair.second, [&] {
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
                pair.bytes = file_size(*pair.first) + file_size(*pair.second);
            }
        }
    }

    static std::uint64_t total_bytes(const std::vector<NamedPair>& pairs) {
        return std::accumulate(
            pairs.begin(), pairs.end(), std::uint64_t{0},
            [](const std::uint64_t sum, const NamedPair& pair) { return sum + pair.bytes; });
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

    // An open file, and which of its arrays the operand named, if it did.
    struct Operand {
        std::string path;
        std::optional<std::string> member;
        std::unique_ptr<ArrayFile> file = {};
    };

    // The name of one of its arrays, in messages and as an operand.
    static std::string name_of(const Operand& operand, const std::string& array) {
        return operand.file->is_archive() ? operand.path + "[" + operand.file->root() + array + "]"
                                          : operand.path;
    }

    void compare_files(Operand first, Operand second) {
        group_->agree(
            [&] {
                open(first);
                open(second);
            },
            [&] {
                return std::vector<ProcessGroup::Sight>{contents_of(first), contents_of(second)};
            });
        if (first.file->is_archive() && second.file->is_archive() && !first.member
            && !second.member) {
            compare_members(first, second);
        } else {
            const NameFilter& filter = command_line_.filter;
            const std::string member1 = chosen_member(first, second, filter);
            compare_arrays(first, member1, second, chosen_member(second, first, filter));
        }
    }

    // What all processes have to see of a file alike.
    static ProcessGroup::Sight contents_of(const Operand& operand) {
        std::string text = std::to_string(file_size(operand.path)) + " bytes";
        if (operand.file->is_archive()) {
            for (const std::string& member : operand.file->members()) {
                text +=
                    ", " + member + " of " + std::to_string(operand.file->divisible_bytes(member));
            }
        }
        return {operand.path, text};
    }

    static void find_sizes(std::vector<NamedPair>& pairs, const Operand& first,
                           const Operand& second) {
        for (NamedPair& pair : pairs) {
            if (pair.first && pair.second) {
                const std::uint64_t bytes1 = first.file->divisible_bytes(pair.name);
                const std::uint64_t bytes2 = second.file->divisible_bytes(pair.name);
                pair.bytes = bytes1 == 0 || bytes2 == 0 ? 0 : bytes1 + bytes2;
            }
        }
    }

    static void open(Operand& operand) {
        operand.file = open_array_file(operand.path);
        if (operand.member && !operand.file->is_archive()) {
            throw Trouble(operand.path,
                          "holds one array, without a name; leave out [" + *operand.member + "]");
        }
    }

    void compare_members(const Operand& first, const Operand& second) {
        const auto members1 = first.file->members();
        const auto members2 = second.file->members();
        auto pairs = match_names(members1, members2, command_line_.filter);
        if (pairs.empty() && !(members1.empty() && members2.empty())) {
            throw Trouble(first.path, "has no array that --include and --exclude leave, nor has "
                                          + second.path);
        }
        check_suits_many();
        summary_.many = true;
        if (!group_->is_alone()) {
            find_sizes(pairs, first, second);
        }
        const std::uint64_t total = total_bytes(pairs);
        for (const NamedPair& pair : pairs) {
            if (group_->has_ended()) {
                return;
            }
            if (pair.first && pair.second) {
                by_one_or_all(group_->suits_one(pair.bytes, total), name_of(first, pair.name),
                              name_of(second, pair.name),
                              [&] { compare_arrays(first, pair.name, second, pair.name); });
            } else {
                const Operand& owner = pair.first ? first : second;
                report_single(pair, owner.file->root() + pair.name, first.path, second.path);
            }
        }
    }

    // The array of the operand that is compared with one of the other operand.
    static std::string chosen_member(const Operand& operand, const Operand& other,
                                     const NameFilter& filter) {
        if (!operand.file->is_archive()) {
            return "";
        }
        if (operand.member) {
            if (!operand.file->has(*operand.member)) {
                throw Trouble(operand.path, std::string("has no array '") + operand.file->root()
                                                + *operand.member + "'" + some(*operand.file));
            }
            return *operand.member;
        }
        const auto names = operand.file->members();
        const auto members = match_names(names, {}, filter);
        if (members.size() == 1) {
            return members.front().name;
        }
        if (other.member && operand.file->has(*other.member)) {
            return *other.member;
        }
        if (members.empty()) {
            throw Trouble(operand.path, names.empty()
                                            ? "holds no array"
                                            : "has no array that --include and --exclude leave");
        }
        throw Trouble(operand.path, "has " + std::to_string(members.size())
                                        + " arrays, and one is needed; choose one, such as "
                                        + name_of(operand, members.front().name));
    }

    // Some of the arrays that a file has, for a message.
    static std::string some(const ArrayFile& file) {
        constexpr std::size_t most = 5;
        const auto names = file.members();
        std::string text;
        for (std::size_t i = 0; i < std::min(most, names.size()); ++i) {
            text += (i == 0 ? "; it has " : ", ") + (file.root() + names[i]);
        }
        return text + (names.size() > most ? ", ..." : "");
    }

    // An array, or why it is none of numbers.
    struct OpenedArray {
        NamedArray array;
        std::optional<std::string> not_numbers;
    };

    // What all processes have to see of an array alike.
    static ProcessGroup::Sight header_of(const NamedArray& array,
                                         const std::optional<std::string>& not_numbers) {
        const ArraySource* const source = array.source.get();
        std::string text = not_numbers.value_or("");
        if (source != nullptr) {
            text = source->type_name() + " " + shape_text(source->shape()) + ", "
                   + (source->fortran_order() ? "column-major" : "row-major");
            if (!source->block().empty()) {
                text += ", in blocks " + shape_text(source->block());
            }
        }
        return {array.name, text};
    }

    static OpenedArray open_array(const Operand& operand, const std::string& member) {
        OpenedArray opened;
        opened.array.name = name_of(operand, member);
        try {
            opened.array.source = operand.file->open(member);
        } catch (const NotNumbers& reason) {
            opened.not_numbers = reason.what();
        }
        return opened;
    }

    NamedArray open_mask() const {
        NamedArray mask;
        if (!command_line_.ignore.empty()) {
            Operand operand;
            std::tie(operand.path, operand.member) = split_member(command_line_.ignore);
            open(operand);
            const std::string member = chosen_member(operand, {}, {});
            mask.name = name_of(operand, member);
            mask.source = operand.file->open(member);
        }
        return mask;
    }

    void compare_arrays(const Operand& operand1, const std::string& member1,
                        const Operand& operand2, const std::string& member2) {
        OpenedArray first;
        OpenedArray second;
        NamedArray mask;
        group_->agree(
            [&] {
                first = open_array(operand1, member1);
                second = open_array(operand2, member2);
                if (!first.not_numbers && !second.not_numbers) {
                    mask = open_mask();
                }
            },
            [&] {
                return std::vector<ProcessGroup::Sight>{header_of(first.array, first.not_numbers),
                                                        header_of(second.array, second.not_numbers),
                                                        header_of(mask, {})};
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
            compare(std::move(first.array), std::move(second.array), std::move(mask),
                    command_line_.question, group_->boxes(), progress_);
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
        ProcessGroup* const group = std::exchange(group_, &single);
        guarded(outcome.first, outcome.second,
                [&, path1 = path1, member1 = member1, path2 = path2, member2 = member2] {
                    compare_files({path1, member1}, {path2, member2});
                });
        group_ = group;
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
    ProgressListener& progress_;
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
