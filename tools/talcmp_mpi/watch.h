// A process that watches the one that does the work, and tells of its end whatever ends it.

#pragma once

#include "descriptor.h"

#include <atomic>

namespace talcmp {

// Exists in the process that does the work.
class Watched {
  public:
    // Divides the process in two. The one that goes on is the new one; the other one waits for its
    // end and ends with the same exit status. But if a signal ends the new one, or if it ends
    // before `has_started`, the other one writes a line to standard error and ends with the
    // status 2.
    Watched();
    Watched(const Watched&) = delete;
    Watched& operator=(const Watched&) = delete;
    ~Watched() = default;

    // Until this is called, what is written to standard error is kept. It becomes part of that
    // line, or is written now.
    void has_started();

  private:
    std::atomic<bool>& has_started_; // seen by both processes
    Descriptor kept_;
    Descriptor standard_error_;
};

} // namespace talcmp
