// A pipe, such as standard input, as a source of bytes.

#pragma once

#include "byte_stream.h"
#include "descriptor.h"

#include <string>

namespace talcmp {

class Pipe : public ByteStream {
  public:
    // `name` is what messages call the pipe.
    Pipe(std::string name, Descriptor pipe) : name_(std::move(name)), pipe_(std::move(pipe)) {}

    std::optional<std::uint64_t> size() const override { return std::nullopt; }

    // The first bytes, enough to recognise a format by; they are still to be read. Must be called
    // before anything is read. Throws Trouble.
    const std::string& beginning();

  private:
    std::size_t read_next(void* bytes, std::size_t count) override;
    std::size_t read_from_system(void* bytes, std::size_t count);

    std::string name_;
    Descriptor pipe_;
    std::optional<std::string> beginning_;
    std::size_t taken_ = 0; // bytes of the beginning
};

} // namespace talcmp
