#include "mpi_group.h"

#include "packed.h"
#include "trouble.h"

#include <algorithm>
#include <exception>
#include <new>
#include <utility>

namespace talcmp {
namespace {

enum Counter : std::size_t { numbers_taken, boxes_handed_out, counter_count = 3 };

// What the first rank says before all open something, or at the end.
enum class Word : char { opened = 'o', failed = 'f', end = 'e' };

std::string packed(const Word word, const ProcessGroup::Sights& sights = {}) {
    Packer packer;
    packer.pass(word);
    packer.pass(sights.size());
    for (const auto& [file, text] : sights) {
        packer.pass(file);
        packer.pass(text);
    }
    return packer.take();
}

// Of a description, which may list many arrays.
std::string beginning(const std::string& text) {
    constexpr std::size_t most = 100;
    return text.size() > most ? text.substr(0, most) + "..." : text;
}

// Without enough memory, an outcome would be lost that the first rank waits for.
template <typename Action>
void or_end_run(const Action& action) {
    try {
        action();
    } catch (const std::bad_alloc&) {
        end_run("there is not enough memory (" + process_name() + ")");
    }
}

// Why this rank cannot go on: it sees another file than the first rank does.
std::string complaint(const ProcessGroup::Sights& sights, Unpacker& first_rank) {
    std::size_t count = 0;
    first_rank.pass(count);
    if (count != sights.size()) {
        return "other files are opened on " + process_name() + " than on the first rank";
    }
    for (const auto& [file, text] : sights) {
        std::string expected_file;
        std::string expected;
        first_rank.pass(expected_file);
        first_rank.pass(expected);
        if (file != expected_file || text != expected) {
            return Trouble(file, process_name() + " sees another file (" + beginning(text)
                                     + ") than the first rank (" + beginning(expected)
                                     + "); give all ranks the same files")
                .what();
        }
    }
    return "";
}

} // namespace

MpiGroup::MpiGroup(Reporter reporter, const Question& question)
    : reporter_(std::move(reporter)), question_(question), counters_(counter_count),
      boxes_(counters_, boxes_handed_out, [this] { print_next(); }) {}

FilePairs MpiGroup::same_files(const std::function<FilePairs()>& find) {
    std::string bytes;
    if (leads()) {
        FilePairs files = find();
        bytes = talcmp::packed(files);
    }
    return unpacked_files(broadcast(std::move(bytes)));
}

// ---- What all open

// The first rank opens first: what it cannot open no other rank has to try, and a broken file is
// found by one.
void MpiGroup::agree(const std::function<void()>& open, const std::function<Sights()>& seen) {
    std::string trouble;
    if (leads()) {
        open_first(open, seen);
    } else {
        trouble = open_like_first(open, seen);
    }
    const int in_trouble = least_of_all(trouble.empty() ? rank_count() : rank());
    if (in_trouble == rank_count()) {
        boxes_.expect();
        return;
    }
    if (in_trouble == rank()) {
        send(0, Tag::trouble, trouble);
    }
    throw Trouble(leads() ? receive(Tag::trouble, in_trouble).bytes : trouble);
}

void MpiGroup::open_first(const std::function<void()>& open, const std::function<Sights()>& seen) {
    Sights sights;
    try {
        open();
        sights = seen();
    } catch (...) {
        broadcast(packed(Word::failed));
        throw;
    }
    broadcast(packed(Word::opened, sights));
}

// Returns why this rank cannot go on, nothing if it can.
std::string MpiGroup::open_like_first(const std::function<void()>& open,
                                      const std::function<Sights()>& seen) {
    const std::string bytes = broadcast("");
    Unpacker first_rank(bytes);
    Word word = {};
    first_rank.pass(word);
    if (word == Word::end) {
        ended_ = true;
        throw Ended();
    }
    if (word == Word::failed) {
        throw Trouble("the first rank reports it");
    }
    try {
        open();
        return complaint(seen(), first_rank);
    } catch (const std::bad_alloc&) {
        return "there is not enough memory (" + process_name() + ")";
    } catch (const std::exception& error) {
        return std::string(error.what()) + " (" + process_name() + ")";
    }
}

// ---- What one rank compares

// A large pair is shared, but not if there are many of its size for each rank.
bool MpiGroup::suits_one(const std::uint64_t bytes, const std::uint64_t total) const {
    constexpr std::uint64_t small = std::uint64_t{32} << 20U;
    constexpr std::uint64_t pairs_of_rank = 8;
    const auto ranks = static_cast<std::uint64_t>(rank_count());
    return ranks > 1 && bytes <= std::max(small, total / (pairs_of_rank * ranks));
}

void MpiGroup::by_one(const std::function<Outcomes()>& compare) {
    if (!taken_) {
        taken_ = counters_.add(numbers_taken, 1);
    }
    const std::uint64_t number = number_++;
    if (number == *taken_) {
        or_end_run([&] { hand_in(number, compare()); });
        taken_.reset();
    } else if (leads()) {
        next_.push_back({number});
    }
    print_next();
}

void MpiGroup::hand_in(const std::uint64_t number, Outcomes outcomes) {
    if (leads()) {
        next_.push_back({number, std::move(outcomes)});
        return;
    }
    for (Outcome& outcome : outcomes) {
        outcome.process = process_name();
    }
    Packer packer;
    packer.pass(number);
    outcomes_sent_.send(0, Tag::outcomes, packer.take() + talcmp::packed(outcomes, question_));
}

// ---- What the first rank prints

void MpiGroup::report(const Outcome& outcome) {
    if (!leads()) {
        return;
    }
    // Where no rank has compared anything alone, the last outcome that is wanted is followed by
    // nothing but trouble with its picture.
    if (number_ == 0) {
        ended_ = false;
    }
    next_.push_back({0, Outcomes{outcome}});
    print_next();
}

void MpiGroup::take_in(const Message& message) {
    if (message.bytes.empty()) {
        ++finished_;
        return;
    }
    std::uint64_t number = 0;
    Unpacker(message.bytes).pass(number);
    arrived_[number] = message.bytes.substr(sizeof number);
}

void MpiGroup::print_next() {
    if (leads()) {
        or_end_run([this] {
            take_in_all();
            print_all();
        });
    }
}

void MpiGroup::take_in_all() {
    while (const auto message = receive_if_there(Tag::outcomes)) {
        take_in(*message);
    }
}

void MpiGroup::print_all() {
    while (!next_.empty()) {
        if (const Next& next = next_.front(); next.outcomes) {
            print(*next.outcomes);
        } else if (const auto arrived = arrived_.find(next.number); arrived != arrived_.end()) {
            print(unpacked_outcomes(arrived->second, question_));
            arrived_.erase(arrived);
        } else {
            return;
        }
        next_.pop_front();
    }
}

void MpiGroup::print(const Outcomes& outcomes) {
    constexpr std::uint64_t more_than_all = std::uint64_t{1} << 62U;
    for (const Outcome& outcome : outcomes) {
        if (!ended_ && !reporter_(outcome)) {
            ended_ = true;
            counters_.add(numbers_taken, more_than_all);
        }
    }
}

void MpiGroup::finish() {
    if (!leads()) {
        if (!ended_) {
            broadcast("");
        }
        outcomes_sent_.wait();
        send(0, Tag::outcomes, "");
        return;
    }
    broadcast(packed(Word::end));
    while (finished_ < rank_count() - 1) {
        or_end_run([this] { take_in(receive(Tag::outcomes)); });
        print_next();
    }
    print_next();
}

} // namespace talcmp
