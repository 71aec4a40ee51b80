// A pipe, such as standard input, as a source of bytes.

#ifndef TALCMP_PIPE_H
#define TALCMP_PIPE_H

#include "byte_stream.h"
#include "descriptor.h"

#include <string>

namespace talcmp {

class Pipe : public ByteStream {
  public:
    // Opens a named pipe, and waits until somebody writes to it. Throws Trouble.
    explicit Pipe(const std::string& path);
    // `name` is what messages call the pipe, which is `descriptor`.
    Pipe(std::string name, int descriptor);

    std::optional<std::uint64_t> size() const override { return std::nullopt; }

  private:
    std::size_t read_next(void* bytes, std::size_t count) override;

    std::string name_;
    Descriptor pipe_;
};

} // namespace talcmp

#endif
