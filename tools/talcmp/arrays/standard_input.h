// Standard input as a source of bytes.

#ifndef TALCMP_STANDARD_INPUT_H
#define TALCMP_STANDARD_INPUT_H

#include "byte_stream.h"

namespace talcmp {

class StandardInput : public ByteStream {
  public:
    std::optional<std::uint64_t> size() const override { return std::nullopt; }

  private:
    std::size_t read_next(void* bytes, std::size_t count) override;
};

} // namespace talcmp

#endif
