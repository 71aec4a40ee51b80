// What processes send each other, as bytes. All run the same program, on machines of one kind.

#pragma once

#include "box_supply.h"
#include "operands.h"
#include "outcome.h"
#include "question.h"

#include <cstddef>
#include <cstring>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

namespace talcmp {

// Both call their arguments `pass`: what is written one after another is read so.
class Packer {
  public:
    static constexpr bool is_reading = false;

    template <typename Value>
    void pass(const Value& value) {
        static_assert(std::is_trivially_copyable_v<Value>);
        bytes_.append(reinterpret_cast<const char*>(&value), sizeof value);
    }
    void pass(const std::string& text) {
        pass(text.size());
        bytes_ += text;
    }
    std::string take() { return std::move(bytes_); }

  private:
    std::string bytes_;
};

class Unpacker {
  public:
    static constexpr bool is_reading = true;

    // `bytes` are kept as a reference.
    explicit Unpacker(const std::string& bytes) : next_(bytes.data()) {}

    template <typename Value>
    void pass(Value& value) {
        static_assert(std::is_trivially_copyable_v<Value>);
        std::memcpy(&value, next_, sizeof value);
        next_ += sizeof value;
    }
    void pass(std::string& text) {
        std::size_t size = 0;
        pass(size);
        text.assign(next_, size);
        next_ += size;
    }

  private:
    const char* next_;
};

std::string packed(FilePairs& files);
FilePairs unpacked_files(const std::string& bytes);

// `question` has the maps that outcomes have.
std::string packed(std::vector<Outcome>& outcomes, const Question& question);
std::vector<Outcome> unpacked_outcomes(const std::string& bytes, const Question& question);

// With the levels of the plan's maps, and the sums of what was read of its arrays. `process` names
// this one, for what failed here.
std::string packed(const BoxPlan& plan, const BoxResults& results, const std::string& process);

// Adds what another process packed.
void add_packed(const std::string& bytes, const BoxPlan& plan, BoxResults& results);

} // namespace talcmp
